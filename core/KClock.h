#pragma once

#include <cstdint>

// A millisecond clock, injectable so that time rules (gesture ends, undo windows) are tested
// without sleeping.
class KClock {
public:
  virtual ~KClock() = default;
  virtual uint64_t Milliseconds() const noexcept = 0;
  // The system's monotonic clock.
  static const KClock& System() noexcept;
};
