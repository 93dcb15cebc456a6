#pragma once

#include <cstdint>

// The host's transport at the start of the current block, as far as the host told it.
// Unknown values keep the markers below.
struct KTransport {
  static constexpr int64_t kUnknownSamplePosition = -1;  // all bits set
  static constexpr uint32_t kPlaying = 1;

  double tempo = -1.0;         // beats per minute
  double songPosition = -1.0;  // quarter notes
  double barStart = -1.0;      // quarter notes
  int64_t samplePosition = kUnknownSamplePosition;
  int32_t numerator = 4;
  int32_t denominator = 4;
  double cycleStart = -1.0;  // quarter notes
  double cycleEnd = -1.0;
  uint32_t flags = 0;

  void Reset() noexcept { *this = KTransport{}; }
  bool IsPlaying() const noexcept { return (flags & kPlaying) != 0; }
};
