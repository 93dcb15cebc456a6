#pragma once

#include <cstdint>

#include "kernel/KExport.h"

// A millisecond clock, injectable so that time rules (gesture ends, undo windows) are tested
// without sleeping.
class TORVANE_API KClock {
public:
  virtual ~KClock() = default;
  virtual uint64_t Milliseconds() const noexcept = 0;
  // The system's monotonic clock.
  static const KClock& System() noexcept;
};
