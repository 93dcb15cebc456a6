#include "tests/core/AllocationCounter.h"

#include <cstddef>
#include <cstdlib>
#include <new>
#if defined(_WIN32)
#include <malloc.h>
#endif

// Linked with -Wl,--wrap for the malloc family: calls from our objects arrive at __wrap_*,
// which reach the C library (or a sanitizer's allocator) through __real_*. Not on Windows: MinGW
// keeps thread_local variables in blocks it allocates with malloc on first use, which would
// come back here; there only operator new is counted.
#if defined(_WIN32)
#define __real_malloc std::malloc
#else
extern "C" {
void* __real_malloc(size_t size);
void* __real_calloc(size_t count, size_t size);
void* __real_realloc(void* block, size_t size);
}
#endif

namespace {
thread_local KAllocationCounter* tInnermost = nullptr;
}

void KCountAllocation() noexcept {
  for (KAllocationCounter* counter = tInnermost; counter; counter = counter->outer_) ++counter->count_;
}

KAllocationCounter::KAllocationCounter() noexcept : outer_(tInnermost) { tInnermost = this; }
KAllocationCounter::~KAllocationCounter() { tInnermost = outer_; }

#if !defined(_WIN32)
extern "C" {
void* __wrap_malloc(size_t size) { KCountAllocation(); return __real_malloc(size); }
void* __wrap_calloc(size_t count, size_t size) { KCountAllocation(); return __real_calloc(count, size); }
void* __wrap_realloc(void* block, size_t size) { KCountAllocation(); return __real_realloc(block, size); }
}
#endif

// The array and nothrow forms of the standard library forward to these two.
void* operator new(size_t size) {
  KCountAllocation();
  if (void* block = __real_malloc(size == 0 ? 1 : size)) return block;
  throw std::bad_alloc();
}
void* operator new(size_t size, std::align_val_t alignment) {
  KCountAllocation();
  const auto align = static_cast<size_t>(alignment);
  const size_t rounded = (size + align - 1) / align * align;  // aligned_alloc wants a multiple
#if defined(_WIN32)
  // The Windows C library has no aligned_alloc: aligned blocks have their own pair of calls.
  if (void* block = _aligned_malloc(rounded == 0 ? align : rounded, align)) return block;
#else
  if (void* block = std::aligned_alloc(align, rounded == 0 ? align : rounded)) return block;
#endif
  throw std::bad_alloc();
}
void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, size_t) noexcept { std::free(block); }
#if defined(_WIN32)
void operator delete(void* block, std::align_val_t) noexcept { _aligned_free(block); }
void operator delete(void* block, size_t, std::align_val_t) noexcept { _aligned_free(block); }
#else
void operator delete(void* block, std::align_val_t) noexcept { std::free(block); }
void operator delete(void* block, size_t, std::align_val_t) noexcept { std::free(block); }
#endif
