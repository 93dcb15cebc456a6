#pragma once

#include <cstdint>

// Counts the allocations of the calling thread while it lives: operator new, and the malloc family
// called from our code (linked through wrappers). Counters nest; every live one sees each.
class KAllocationCounter {
public:
  KAllocationCounter() noexcept;
  KAllocationCounter(const KAllocationCounter&) = delete;
  KAllocationCounter& operator=(const KAllocationCounter&) = delete;
  ~KAllocationCounter();

  int64_t Count() const noexcept { return count_; }

private:
  friend void KCountAllocation() noexcept;

  int64_t count_ = 0;
  KAllocationCounter* outer_;
};

// Whether the malloc family is counted as well as operator new: not on Windows, where MinGW's
// thread-local storage allocates through malloc itself (see AllocationCounter.cpp).
#if defined(_WIN32)
inline constexpr bool kAllocationCounterSeesMalloc = false;
#else
inline constexpr bool kAllocationCounterSeesMalloc = true;
#endif
