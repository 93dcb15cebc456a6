#pragma once

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>
#include <type_traits>
#include <utility>

// Types that may be moved in memory with memcpy/realloc (no pointers into themselves).
// Specialise for a type that is not trivially copyable but keeps no self-references.
template <class T>
struct KIsRelocatable : std::is_trivially_copyable<T> {};

// The framework's growable array: grows with realloc, to the new count while below two
// elements and otherwise to the smallest power of two above the old count.
template <class T>
class KArray {
  static_assert(KIsRelocatable<T>::value, "KArray moves its elements with realloc");

public:
  KArray() noexcept = default;
  KArray(const KArray& other) { *this = other; }
  KArray(KArray&& other) noexcept { Swap(other); }
  ~KArray() {
    Clear();
    std::free(items_);
  }

  KArray& operator=(const KArray& other) {
    if (this != &other) {
      Clear();
      Reserve(other.count_);
      for (int32_t i = 0; i < other.count_; ++i) new (items_ + i) T(other.items_[i]);
      count_ = other.count_;
    }
    return *this;
  }
  KArray& operator=(KArray&& other) noexcept {
    Swap(other);
    return *this;
  }

  void Swap(KArray& other) noexcept {
    std::swap(items_, other.items_);
    std::swap(capacity_, other.capacity_);
    std::swap(count_, other.count_);
  }

  int32_t Count() const noexcept { return count_; }
  int32_t Capacity() const noexcept { return capacity_; }
  bool IsEmpty() const noexcept { return count_ == 0; }
  T& operator[](int32_t i) noexcept { return items_[i]; }
  const T& operator[](int32_t i) const noexcept { return items_[i]; }
  T* begin() noexcept { return items_; }
  T* end() noexcept { return items_ + count_; }
  const T* begin() const noexcept { return items_; }
  const T* end() const noexcept { return items_ + count_; }
  T& Last() noexcept { return items_[count_ - 1]; }

  // Makes room for `capacity` elements at once (for pools filled outside the audio thread).
  void Reserve(int32_t capacity) {
    if (capacity > capacity_) Reallocate(capacity);
  }

  template <class... Args>
  T& Append(Args&&... args) {
    Grow();
    T* slot = new (items_ + count_) T(std::forward<Args>(args)...);
    ++count_;
    return *slot;
  }

  template <class... Args>
  T& Insert(int32_t index, Args&&... args) {
    // Construct first: an argument may refer to an element that the move below displaces.
    T value(std::forward<Args>(args)...);
    Grow();
    std::memmove(static_cast<void*>(items_ + index + 1), static_cast<const void*>(items_ + index),
                 sizeof(T) * static_cast<size_t>(count_ - index));
    T* slot = new (items_ + index) T(std::move(value));
    ++count_;
    return *slot;
  }

  void RemoveAt(int32_t index) noexcept {
    items_[index].~T();
    std::memmove(static_cast<void*>(items_ + index), static_cast<const void*>(items_ + index + 1),
                 sizeof(T) * static_cast<size_t>(count_ - index - 1));
    --count_;
  }

  void RemoveLast() noexcept { items_[--count_].~T(); }

  void Clear() noexcept {
    for (int32_t i = 0; i < count_; ++i) items_[i].~T();
    count_ = 0;
  }

  // The growth rule on its own, so that other growable stores can share it.
  static int32_t GrownCapacity(int32_t oldCount, int32_t newCount) noexcept {
    if (oldCount < 2) return newCount;
    uint32_t c = 1;
    while (c <= static_cast<uint32_t>(oldCount)) c <<= 1;
    return static_cast<int32_t>(c);
  }

private:
  void Grow() {
    if (count_ + 1 > capacity_) Reallocate(GrownCapacity(count_, count_ + 1));
  }
  void Reallocate(int32_t capacity) {
    void* block = std::realloc(static_cast<void*>(items_), sizeof(T) * static_cast<size_t>(capacity));
    if (!block) throw std::bad_alloc();
    items_ = static_cast<T*>(block);
    capacity_ = capacity;
  }

  T* items_ = nullptr;
  int32_t capacity_ = 0;
  int32_t count_ = 0;
};

template <class T>
struct KIsRelocatable<KArray<T>> : std::true_type {};  // holds only a pointer to its block
