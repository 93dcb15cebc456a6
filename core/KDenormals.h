#pragma once

#if defined(__SSE__) || defined(_M_X64)
#include <xmmintrin.h>
#endif

// Flushes denormal numbers to zero for the life of the object (one processing call), so that
// decaying filters and envelopes never fall onto the slow path of the floating-point unit.
// The caller's mode is restored on exit: a host's own settings stay its own.
class KDenormalScope {
public:
#if defined(__SSE__) || defined(_M_X64)
  // Writing the control register stalls the processor: it is written only when the host's
  // thread does not flush already (most audio threads do).
  KDenormalScope() noexcept : saved_(_mm_getcsr()) {
    if ((saved_ & kFlush) != kFlush) _mm_setcsr(saved_ | kFlush);
  }
  ~KDenormalScope() {
    if ((saved_ & kFlush) != kFlush) _mm_setcsr(saved_);
  }

private:
  static constexpr unsigned kFlushToZero = 0x8000;
  static constexpr unsigned kDenormalsAreZero = 0x0040;
  static constexpr unsigned kFlush = kFlushToZero | kDenormalsAreZero;
  unsigned saved_;
#else
  KDenormalScope() noexcept = default;
#endif
  KDenormalScope(const KDenormalScope&) = delete;
  KDenormalScope& operator=(const KDenormalScope&) = delete;
};
