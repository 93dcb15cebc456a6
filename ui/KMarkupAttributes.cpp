#include "ui/KMarkupAttributes.h"

namespace {
// Sizes of the look-and-feel that help texts may name instead of a number of pixels, at
// scale 1: the largest and the common size of the toolkit's button icons.
struct KLayoutConstant {
  const char* name;
  int32_t pixels;
};
constexpr KLayoutConstant kLayoutConstants[] = {
    {"MaxStdIconSizeX", 32},
    {"MaxStdIconSizeY", 32},
    {"StdIconSizeX", 20},
    {"StdIconSizeY", 20},
};

int32_t HexDigit(char16_t c) noexcept {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return -1;
}

// Hexadecimal digits from `start` up to the first other character, wrapping at 32 bits.
uint32_t ReadHex(const KString& text, int32_t start) noexcept {
  uint32_t value = 0;
  for (int32_t i = start; i < text.Length(); ++i) {
    const int32_t digit = HexDigit(text.CharAt(i));
    if (digit < 0) break;
    value = value << 4 | static_cast<uint32_t>(digit);
  }
  return value;
}

int32_t Saturate(int64_t value) noexcept {
  return value > INT32_MAX ? INT32_MAX : (value < INT32_MIN ? INT32_MIN : static_cast<int32_t>(value));
}
}  // namespace

const KString* KMarkupAttributes::Find(const KString& name) const noexcept {
  for (const KMarkupAttribute& a : items_)
    if (a.name == name) return &a.value;
  return nullptr;
}

int32_t KMarkupAttributes::Integer(const KString& name, int32_t fallback) const noexcept {
  const KString* value = Find(name);
  return value ? Saturate(value->ToInteger()) : fallback;
}

uint8_t KMarkupAttributes::HexByte(const KString& name, uint8_t fallback) const noexcept {
  const KString* value = Find(name);
  if (!value) return fallback;
  const bool negative = value->Length() > 0 && value->CharAt(0) == '-';
  const uint32_t magnitude = ReadHex(*value, negative ? 1 : 0);
  return static_cast<uint8_t>(negative ? 0u - magnitude : magnitude);
}

uint32_t KMarkupAttributes::Colour(const KString& name, uint32_t fallback) const noexcept {
  const KString* value = Find(name);
  return value ? ParseColour(*value) : fallback;
}

KMarkupSize KMarkupAttributes::Size(const KString& name) const noexcept {
  const KString* value = Find(name);
  if (!value || value->IsEmpty()) return {};
  const char16_t first = value->CharAt(0);
  if (first != '-' && (first < '0' || first > '9')) return {KMarkupSize::kPixels, LayoutConstant(*value)};
  const int32_t number = Saturate(value->ToInteger());
  const bool percent = value->CharAt(value->Length() - 1) == '%';
  return {percent ? KMarkupSize::kPercent : KMarkupSize::kPixels, number};
}

uint32_t KMarkupAttributes::ParseColour(const KString& value) noexcept {
  const uint32_t digits = ReadHex(value, 0);
  if (value.Length() == 8) return digits >> 8 | digits << 24;
  return 0xFF000000u | (digits & 0xFFFFFFu);
}

int32_t KMarkupAttributes::LayoutConstant(const KString& name) noexcept {
  for (const KLayoutConstant& c : kLayoutConstants)
    if (name == KString::Static(c.name)) return c.pixels;
  return 0;
}
