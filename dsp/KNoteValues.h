#pragma once

#include <cstdint>

// The note values that tempo-synced times are chosen from, longest first: straight, dotted and
// triplet, measured in quarter notes so that a length in seconds is quarters · 60 / tempo.
struct KNoteValue {
  const char* name;
  double quarters;
};

inline constexpr KNoteValue kNoteValues[] = {
    {"4/1", 16.0},     {"2/1", 8.0},        {"1/1", 4.0},      {"1/2.", 3.0},    {"1/2", 2.0},
    {"1/2T", 4.0 / 3}, {"1/4.", 1.5},       {"1/4", 1.0},      {"1/4T", 2.0 / 3}, {"1/8.", 0.75},
    {"1/8", 0.5},      {"1/8T", 1.0 / 3},   {"1/16.", 0.375},  {"1/16", 0.25},   {"1/16T", 1.0 / 6},
    {"1/32", 0.125},   {"1/32T", 1.0 / 12}, {"1/64", 0.0625},
};
inline constexpr int32_t kNoteValueCount = static_cast<int32_t>(sizeof(kNoteValues) / sizeof(kNoteValues[0]));
inline constexpr int32_t kNoteValueQuarter = 7;  // "1/4"

// Seconds of a note value at a tempo in beats (quarter notes) per minute.
inline double KNoteSeconds(int32_t note, double tempo) noexcept { return kNoteValues[note].quarters * 60.0 / tempo; }
