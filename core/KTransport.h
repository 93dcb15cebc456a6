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
  // The song position `offset` samples into the block while the transport plays with a known
  // position and tempo, else -1.
  double PlayingPositionAt(int32_t offset, double sampleRate) const noexcept {
    if (!IsPlaying() || !(songPosition >= 0.0) || !(tempo > 0.0) || !(sampleRate > 0.0)) return -1.0;
    return songPosition + offset * tempo / (sampleRate * 60.0);
  }
};
