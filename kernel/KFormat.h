#pragma once

#include <cstdint>
#include <type_traits>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// Builds a message from a pattern with numbered placeholders, e.g.
//   KFormat("Could not create plugin {0}.\n\nError: {1}").Arg(name).Arg(message).Text()
// The pattern is parsed once; arguments then arrive in slot order (0, 1, 2, ...).
//
// Placeholder options, read up to the closing brace: " " or "0" sets the fill character and
// is followed by a width of at most two characters ("-" for left alignment), "." by a
// precision of at most two digits, "+" forces a sign on positive numbers, "x" gives upper-case
// hexadecimal; any other character is ignored ("{1;02}" is zero fill, width 2). "{{" is a
// literal brace and "}" yields the character after it.
//
// Floating-point values without a precision get at most six decimals with trailing zeros
// removed (0.5 -> "0.5", 2.0 -> "2", 1/3 -> "0.333333"): enough for any value shown to a user
// and free of binary noise such as 0.30000000000000004. Values are correctly rounded from
// their exact binary value (exact ties to even, as printf does), and a result that rounds to
// zero is written without a sign.
class KFormat {
public:
  static constexpr int kMaxSlots = 32;

  struct Slot {
    uint32_t position;  // where the rendering is inserted in the literal text
    uint8_t flags;      // kHexadecimal, kPlusSign
    int8_t width;       // negative: left aligned
    uint8_t fill;
    int8_t precision;   // negative: the default
    uint8_t before;     // slots written earlier at the same position
  };
  static constexpr uint8_t kHexadecimal = 1;
  static constexpr uint8_t kPlusSign = 2;

  // Throws KException "Formatting string ends in an argument specification." for a pattern
  // that ends inside a placeholder.
  TORVANE_API explicit KFormat(const KString& pattern);

  TORVANE_API KFormat& Arg(const KString& text);
  template <int M>
  KFormat& Arg(const KStringT<M>& text) {
    return Arg(KString(text));
  }
  template <class T>
    requires std::is_arithmetic_v<T> && (!std::is_same_v<T, bool>)
  KFormat& Arg(T value) {
    if constexpr (std::is_floating_point_v<T>) return ArgFloat(static_cast<double>(value));
    else if constexpr (std::is_signed_v<T>) return ArgSigned(static_cast<int64_t>(value));
    else return ArgUnsigned(static_cast<uint64_t>(value));
  }

  TORVANE_API KString Text() const;

  int32_t SlotCount() const noexcept { return slotCount_; }
  const Slot& GetSlot(int32_t index) const noexcept { return slots_[index]; }

private:
  TORVANE_API KFormat& ArgSigned(int64_t value);
  TORVANE_API KFormat& ArgUnsigned(uint64_t value);
  TORVANE_API KFormat& ArgFloat(double value);
  uint8_t CurrentFlags() const noexcept { return current_ < kMaxSlots ? slots_[current_].flags : 0; }
  KFormat& Place(const char* text, int32_t length, bool negative, bool positive);
  void Store(KString rendering);

  KString literal_;
  Slot slots_[kMaxSlots];
  bool used_[kMaxSlots] = {};
  KString rendered_[kMaxSlots];
  int32_t slotCount_ = 0;
  int32_t current_ = 0;
};

// One-call form: KFormatText("{0} of {1}", done, total).
template <class... Args>
KString KFormatText(const KString& pattern, const Args&... args) {
  KFormat format(pattern);
  (format.Arg(args), ...);
  return format.Text();
}
