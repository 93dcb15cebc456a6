#pragma once

#include <cstdint>

// Counts the heap allocations made on the calling thread while it lives: operator new in every
// form, and malloc, calloc and realloc called from our own code (the test binary links them
// through wrappers). Counters nest; every live counter of the thread sees each allocation.
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
