#include "kernel/KString.h"

#include <cstdlib>
#include <new>

char16_t* KStringHeap::Allocate(int32_t capacity) {
  const int32_t size = BlockSize(capacity);
  auto* block = static_cast<int32_t*>(std::malloc(static_cast<size_t>(size)));
  if (!block) throw std::bad_alloc();
  block[0] = size;
  block[1] = 1;
  return reinterpret_cast<char16_t*>(block + 2);
}

char16_t* KStringHeap::Resize(char16_t* chars, int32_t capacity) {
  const int32_t size = BlockSize(capacity);
  auto* block = static_cast<int32_t*>(std::realloc(Header(chars), static_cast<size_t>(size)));
  if (!block) throw std::bad_alloc();
  block[0] = size;
  return reinterpret_cast<char16_t*>(block + 2);
}

void KStringHeap::Release(char16_t* chars) noexcept {
  if (std::atomic_ref<int32_t>(Header(chars)[1]).fetch_sub(1, std::memory_order_acq_rel) == 1) std::free(Header(chars));
}
