#pragma once

#include <cstdint>

#include "kernel/KExport.h"

struct KTransport;

// The transport as a host format reports it for one block, before any rule is applied: each
// adapter copies the fields its format has and raises the validity bits its format's own flags
// allow (VST 3's ProcessContext state, VST 2's VstTimeInfo flags, an AAX transport query, LV2
// time atoms). KAcceptTransport then applies the same rules for every format.
struct KHostTime {
  static constexpr uint32_t kTempoValid = 1u << 0;
  static constexpr uint32_t kSongPositionValid = 1u << 1;
  static constexpr uint32_t kBarStartValid = 1u << 2;
  static constexpr uint32_t kSignatureValid = 1u << 3;
  static constexpr uint32_t kCycleValid = 1u << 4;
  static constexpr uint32_t kPlaying = 1u << 5;

  uint32_t valid = 0;
  double samplePosition = 0.0;  // samples; every format reports one
  double tempo = 0.0;           // beats per minute
  double songPosition = 0.0;    // quarter notes
  double barStart = 0.0;        // quarter notes
  int32_t numerator = 0;
  int32_t denominator = 0;
  double cycleStart = 0.0;  // quarter notes
  double cycleEnd = 0.0;
};

// The plug-in's transport snapshot from what the host reported (null: nothing at all), reset to
// the unknown markers first and then taking only what passes:
//   sample position  rounded; offline only when above 1e-10 (an offline pass that reports 0
//                    has no position at all)
//   tempo            only above 1.0
//   song position    offline only when above 1e-10
//   signature        only with a numerator other than 0; the denominator comes with it
//   bar start        snapped to the beat grid of the signature: d = max(1, denominator / 4),
//                    round(d x bar start) / d
//   cycle            only when it ends more than 1e-10 after it starts
//   playing          when the pass is offline or the host plays
TORVANE_API void KAcceptTransport(const KHostTime* time, bool offline, KTransport& transport) noexcept;
