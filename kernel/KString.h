#pragma once

#include <atomic>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include "kernel/KArray.h"
#include "kernel/KExport.h"
#include "kernel/KUtf8.h"

// Shared reference-counted character blocks of long strings. Layout: block size in bytes,
// reference count, then the UTF-16 characters and a NUL. A string points at the characters,
// so the count lies one word before them and the block starts two words before them.
struct KStringHeap {
  static constexpr int32_t kHeaderBytes = 8;

  // Bytes of a block holding `capacity` characters: 2c + 10 rounded up to a power of two.
  static constexpr int32_t BlockSize(int32_t capacity) noexcept {
    uint32_t v = static_cast<uint32_t>(2 * capacity + 9);
    v |= v >> 1;
    v |= v >> 2;
    v |= v >> 4;
    v |= v >> 8;
    v |= v >> 16;
    return static_cast<int32_t>(v + 1);
  }
  static int32_t Size(const char16_t* chars) noexcept { return Header(chars)[0]; }
  static int32_t Count(const char16_t* chars) noexcept {
    return std::atomic_ref<int32_t>(Header(chars)[1]).load(std::memory_order_acquire);
  }
  static int32_t Capacity(const char16_t* chars) noexcept { return (Size(chars) - 10) / 2; }
  static void Retain(char16_t* chars) noexcept {
    std::atomic_ref<int32_t>(Header(chars)[1]).fetch_add(1, std::memory_order_relaxed);
  }

  TORVANE_API static char16_t* Allocate(int32_t capacity);
  // Grows a block that only the caller references.
  TORVANE_API static char16_t* Resize(char16_t* chars, int32_t capacity);
  // Drops one reference; the thread that takes the count from 1 to 0 frees the block.
  TORVANE_API static void Release(char16_t* chars) noexcept;

private:
  static int32_t* Header(const char16_t* chars) noexcept {
    return reinterpret_cast<int32_t*>(const_cast<char16_t*>(chars)) - 2;
  }
};

// The one empty literal that every default-constructed string points at.
inline constexpr char kEmptyText[1] = "";

// UTF-16 string with three storages: a static 8-bit literal (not owned, never copied), up to
// N - 1 code units inline, or a shared copy-on-write heap block. N counts the terminator.
template <int N>
class KStringT {
  static_assert(N >= 2, "an inline string needs room for a terminator");
  template <int M>
  friend class KStringT;

public:
  enum Storage : uint32_t { kLiteral = 0, kInline = 1, kHeap = 2 };

  constexpr KStringT() noexcept : length_(0), storage_(kLiteral), literal_(kEmptyText) {}

  // Only string literals bind here (anything else is not a constant expression), so the
  // stored pointer stays valid for the life of the program. Literals are ASCII: a character
  // read from one is the byte widened to 16 bits.
  template <size_t K>
  consteval KStringT(const char (&text)[K]) : length_(0), storage_(kLiteral), literal_(text) {
    while (text[length_] != 0) {
      if (static_cast<unsigned char>(text[length_]) >= 0x80) throw "literals must be ASCII; use FromUtf8";
      ++length_;
    }
  }

  // A NUL-terminated 8-bit text with static lifetime known only at run time (tables of names).
  static KStringT Static(const char* text) noexcept {
    KStringT s;
    s.literal_ = text;
    s.length_ = static_cast<int32_t>(std::strlen(text));
    return s;
  }
  // Each byte becomes one 16-bit unit (hosts hand names as 8-bit texts).
  static KStringT Widen(const char* text, size_t length) {
    KStringT s;
    s.Reserve(static_cast<int32_t>(length));
    char16_t* out = s.Mutable();
    for (size_t i = 0; i < length; ++i) out[i] = static_cast<unsigned char>(text[i]);
    s.Terminate(static_cast<int32_t>(length));
    return s;
  }
  static KStringT Widen(const char* text) { return Widen(text, std::strlen(text)); }
  // Malformed sequences become U+FFFD.
  static KStringT FromUtf8(std::string_view utf8) {
    KStringT s;
    const int32_t units = KUtf8::CountUtf16Units(utf8.data(), utf8.size());
    s.Reserve(units);
    KUtf8::DecodeToUtf16(utf8.data(), utf8.size(), s.Mutable());
    s.Terminate(units);
    return s;
  }
  static KStringT FromUtf16(const char16_t* units, int32_t length) {
    KStringT s;
    s.Reserve(length);
    std::memcpy(s.Mutable(), units, sizeof(char16_t) * static_cast<size_t>(length));
    s.Terminate(length);
    return s;
  }

  KStringT(const KStringT& other) noexcept { CopyFrom(other); }  // same N never allocates
  template <int M>
  KStringT(const KStringT<M>& other) {
    CopyFrom(other);
  }
  KStringT(KStringT&& other) noexcept { TakeFrom(other); }
  ~KStringT() { ReleaseStorage(); }

  KStringT& operator=(const KStringT& other) {
    if (this != &other) {
      KStringT copy(other);
      ReleaseStorage();
      TakeFrom(copy);
    }
    return *this;
  }
  template <int M>
  KStringT& operator=(const KStringT<M>& other) {
    KStringT copy(other);
    ReleaseStorage();
    TakeFrom(copy);
    return *this;
  }
  KStringT& operator=(KStringT&& other) noexcept {
    if (this != &other) {
      ReleaseStorage();
      TakeFrom(other);
    }
    return *this;
  }

  int32_t Length() const noexcept { return length_; }
  bool IsEmpty() const noexcept { return length_ == 0; }
  Storage GetStorage() const noexcept { return static_cast<Storage>(storage_); }

  // Reads through Wide() rather than the inline array itself, so that a constant index beyond
  // N (valid for a heap text) does not trip the compiler's array bounds check.
  char16_t CharAt(int32_t index) const noexcept {
    if (storage_ == kLiteral) return static_cast<unsigned char>(literal_[index]);
    return Wide()[index];
  }

  // Calls f(units, length) with either `const char*` (literal) or `const char16_t*` units, so
  // that loops over the characters are written once and carry no per-character storage test.
  template <class F>
  decltype(auto) VisitUnits(F&& f) const {
    if (storage_ == kLiteral) return f(literal_, length_);
    return f(Wide(), length_);
  }

  // Makes the string writable with room for `capacity` characters (copy on write).
  void Reserve(int32_t capacity) {
    if (!HasRoom(capacity)) Grow(capacity);
  }

  // True when the string may be written in place up to `capacity` characters.
  bool HasRoom(int32_t capacity) const noexcept {
    if (storage_ == kInline) return capacity < N;
    return storage_ == kHeap && KStringHeap::Count(heap_) < 2 && KStringHeap::Size(heap_) >= KStringHeap::BlockSize(capacity);
  }

private:
  void Grow(int32_t capacity) {
    switch (storage_) {
      case kInline:
        if (capacity >= N) {
          char16_t* block = KStringHeap::Allocate(capacity);
          std::memcpy(block, inline_, sizeof(char16_t) * static_cast<size_t>(length_ + 1));
          heap_ = block;
          storage_ = kHeap;
        }
        return;
      case kHeap:
        if (KStringHeap::Count(heap_) < 2) {
          if (KStringHeap::Size(heap_) < KStringHeap::BlockSize(capacity)) heap_ = KStringHeap::Resize(heap_, capacity);
          return;
        }
        [[fallthrough]];
      default: {
        // Shared block or literal: take a private copy of what fits. The shared reference is
        // dropped only after the copy, so another thread's release cannot free it under us.
        const int32_t keep = length_ < capacity ? length_ : capacity;
        const Storage old = static_cast<Storage>(storage_);
        char16_t* oldHeap = heap_;
        const char* oldLiteral = literal_;
        char16_t* target;
        if (capacity <= N - 1) {
          storage_ = kInline;
          target = inline_;
        } else {
          target = KStringHeap::Allocate(capacity);
        }
        if (old == kLiteral) {
          for (int32_t i = 0; i < keep; ++i) target[i] = static_cast<unsigned char>(oldLiteral[i]);
        } else {
          std::memmove(target, oldHeap, sizeof(char16_t) * static_cast<size_t>(keep));
        }
        if (target != inline_) {
          heap_ = target;
          storage_ = kHeap;
        }
        Terminate(keep);
        if (old == kHeap) KStringHeap::Release(oldHeap);
        return;
      }
    }
  }

public:
  KStringT& Append(const KStringT& text) { return AppendUnits(text); }
  template <int M>
  KStringT& Append(const KStringT<M>& text) {
    return AppendUnits(text);
  }
  KStringT& Append(char16_t c) {
    Reserve(length_ + 1);
    Mutable()[length_] = c;
    Terminate(length_ + 1);
    return *this;
  }
  KStringT& AppendUtf8(std::string_view utf8) {
    const int32_t units = KUtf8::CountUtf16Units(utf8.data(), utf8.size());
    Reserve(length_ + units);
    KUtf8::DecodeToUtf16(utf8.data(), utf8.size(), Mutable() + length_);
    Terminate(length_ + units);
    return *this;
  }
  KStringT& AppendUtf16(const char16_t* units, int32_t count) {
    const int32_t start = length_;
    Reserve(start + count);
    std::memcpy(Mutable() + start, units, sizeof(char16_t) * static_cast<size_t>(count));
    Terminate(start + count);
    return *this;
  }
  // Appends `count` characters of `text` from `start` (both clamped).
  template <int M>
  KStringT& AppendPart(const KStringT<M>& text, int32_t start, int32_t count) {
    if (static_cast<const void*>(&text) == this) return AppendPart(KStringT(*this), start, count);
    start = Clamp(start, 0, text.length_);
    count = Clamp(count, 0, text.length_ - start);
    const int32_t at = length_;
    Reserve(at + count);
    char16_t* out = Mutable() + at;
    text.VisitUnits([&](const auto* units, int32_t) {
      for (int32_t i = 0; i < count; ++i) out[i] = static_cast<char16_t>(Unit(units[start + i]));
    });
    Terminate(at + count);
    return *this;
  }
  KStringT& operator+=(const KStringT& text) { return Append(text); }
  KStringT& operator+=(char16_t c) { return Append(c); }

  // Removes `count` characters at `start` (both clamped to the text).
  void Erase(int32_t start, int32_t count) {
    start = Clamp(start, 0, length_);
    count = Clamp(count, 0, length_ - start);
    if (count == 0) return;
    if (storage_ == kLiteral && start == 0) {  // dropping a prefix of a literal needs no copy
      literal_ += count;
      length_ -= count;
      return;
    }
    Reserve(length_);
    char16_t* chars = Mutable();
    std::memmove(chars + start, chars + start + count, sizeof(char16_t) * static_cast<size_t>(length_ - start - count));
    Terminate(length_ - count);
  }

  KStringT SubString(int32_t start, int32_t count) const {
    start = Clamp(start, 0, length_);
    count = Clamp(count, 0, length_ - start);
    KStringT result;
    if (storage_ == kLiteral && start + count == length_) {  // a literal's tail is still a literal
      result.literal_ = literal_ + start;
      result.length_ = count;
      return result;
    }
    result.Reserve(count);
    char16_t* out = result.Mutable();
    VisitUnits([&](const auto* units, int32_t) {
      for (int32_t i = 0; i < count; ++i) out[i] = static_cast<char16_t>(Unit(units[start + i]));
    });
    result.Terminate(count);
    return result;
  }

  // Compares the first n characters (fewer when a text is shorter); 0 when they agree.
  template <int M>
  int CompareFirst(const KStringT<M>& other, int32_t n) const noexcept {
    const int32_t limitA = length_ < n ? length_ : n;
    const int32_t limitB = other.length_ < n ? other.length_ : n;
    return VisitUnits([&](const auto* a, int32_t) {
      return other.VisitUnits([&](const auto* b, int32_t) { return CompareUnits(a, limitA, b, limitB); });
    });
  }
  template <int M>
  int Compare(const KStringT<M>& other) const noexcept {
    return CompareFirst(other, length_ > other.length_ ? length_ : other.length_);
  }
  template <int M>
  bool operator==(const KStringT<M>& other) const noexcept {
    return length_ == other.length_ && Compare(other) == 0;
  }
  bool operator==(const KStringT& other) const noexcept {
    return length_ == other.length_ && Compare(other) == 0;
  }
  template <int M>
  bool operator<(const KStringT<M>& other) const noexcept {
    return Compare(other) < 0;
  }

  // A decimal text with an optional leading "-"; reading stops at the first other character,
  // and values beyond the 64-bit range saturate.
  int64_t ToInteger() const noexcept {
    return VisitUnits([](const auto* units, int32_t length) {
      int32_t i = 0;
      const bool negative = length > 0 && units[0] == '-';
      if (negative) i = 1;
      uint64_t value = 0;
      const uint64_t limit = negative ? uint64_t{1} << 63 : (uint64_t{1} << 63) - 1;
      for (; i < length; ++i) {
        const uint32_t digit = Unit(units[i]) - '0';
        if (digit > 9) break;
        value = value > (limit - digit) / 10 ? limit : value * 10 + digit;
      }
      return negative ? static_cast<int64_t>(0 - value) : static_cast<int64_t>(value);
    });
  }

  std::string ToUtf8() const {
    std::string out;
    AppendUtf8To(out);
    return out;
  }
  void AppendUtf8To(std::string& out) const {
    VisitUnits([&](const auto* units, int32_t length) { KUtf8::Encode(units, length, out); });
  }
  // The characters as UTF-16 into `out` (room for Length() units); no terminator.
  void CopyUtf16(char16_t* out) const noexcept {
    VisitUnits([&](const auto* units, int32_t length) {
      for (int32_t i = 0; i < length; ++i) out[i] = static_cast<char16_t>(Unit(units[i]));
    });
  }

private:
  static constexpr uint32_t Unit(char c) noexcept { return static_cast<unsigned char>(c); }
  static constexpr uint32_t Unit(char16_t c) noexcept { return c; }
  static constexpr int32_t Clamp(int32_t v, int32_t lo, int32_t hi) noexcept { return v < lo ? lo : (v > hi ? hi : v); }

  template <class A, class B>
  static int CompareUnits(const A* a, int32_t lengthA, const B* b, int32_t lengthB) noexcept {
    const int32_t n = lengthA < lengthB ? lengthA : lengthB;
    for (int32_t i = 0; i < n; ++i) {
      const uint32_t x = Unit(a[i]), y = Unit(b[i]);
      if (x != y) return x < y ? -1 : 1;
    }
    return lengthA == lengthB ? 0 : (lengthA < lengthB ? -1 : 1);
  }

  const char16_t* Wide() const noexcept { return storage_ == kInline ? inline_ : heap_; }
  char16_t* Mutable() noexcept { return storage_ == kInline ? inline_ : heap_; }
  void Terminate(int32_t length) noexcept {
    length_ = length;
    Mutable()[length] = 0;
  }

  template <int M>
  KStringT& AppendUnits(const KStringT<M>& text) {
    return AppendPart(text, 0, text.length_);
  }

  template <int M>
  void CopyFrom(const KStringT<M>& other) {
    length_ = other.length_;
    switch (other.storage_) {
      case kLiteral:
        storage_ = kLiteral;
        literal_ = other.literal_;
        break;
      case kHeap:
        storage_ = kHeap;
        heap_ = other.heap_;
        KStringHeap::Retain(heap_);
        break;
      default:
        // An inline text of a type no larger than this one always fits inline here.
        if (M <= N || other.length_ <= N - 1) {
          storage_ = kInline;
          std::memcpy(inline_, other.inline_, sizeof(char16_t) * static_cast<size_t>(length_ + 1));
        } else if constexpr (M > N) {  // longer than this type keeps inline
          storage_ = kHeap;
          heap_ = KStringHeap::Allocate(length_);
          std::memcpy(heap_, other.inline_, sizeof(char16_t) * static_cast<size_t>(length_ + 1));
        }
        break;
    }
  }

  // Moves other's text here and leaves other empty; this holds no storage on entry.
  void TakeFrom(KStringT& other) noexcept {
    length_ = other.length_;
    storage_ = other.storage_;
    if (storage_ == kInline) {
      std::memcpy(inline_, other.inline_, sizeof(char16_t) * static_cast<size_t>(length_ + 1));
    } else if (storage_ == kHeap) {
      heap_ = other.heap_;
    } else {
      literal_ = other.literal_;
    }
    other.length_ = 0;
    other.storage_ = kLiteral;
    other.literal_ = kEmptyText;
  }

  void ReleaseStorage() noexcept {
    if (storage_ == kHeap) KStringHeap::Release(heap_);
  }

  int32_t length_;
  uint32_t storage_;
  union {
    const char* literal_;
    char16_t inline_[N];
    char16_t* heap_;
  };
};

template <int N>
struct KIsRelocatable<KStringT<N>> : std::true_type {};  // no pointers into itself

using KString = KStringT<60>;

template <int N>
KStringT<N> operator+(KStringT<N> left, const std::type_identity_t<KStringT<N>>& right) {
  left.Append(right);
  return left;
}
