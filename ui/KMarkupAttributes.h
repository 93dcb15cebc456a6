#pragma once

#include <cstdint>
#include <vector>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// One attribute of a mark-up tag, as written: "name=value".
struct KMarkupAttribute {
  KString name;
  KString value;
};

// A length in a tag's attribute: pixels, a percentage of the enclosing block, or unset (the
// element's own size). Named layout constants are resolved to pixels when read.
struct KMarkupSize {
  enum Unit : uint8_t { kAuto, kPixels, kPercent };
  Unit unit = kAuto;
  int32_t value = 0;

  // The size within `available` pixels at `scale` (pixels scale, percentages do not); `fallback`
  // when unset.
  int32_t Resolve(int32_t available, int32_t scale, int32_t fallback) const noexcept {
    if (unit == kPixels) return value * scale;
    if (unit == kPercent) return static_cast<int32_t>(int64_t{available} * value / 100);
    return fallback;
  }
  bool operator==(const KMarkupSize&) const = default;
};

// The attributes of one tag in their written order, and the readers every element uses for its
// attribute set. Absent attributes give the caller's default; present ones never fail.
class TORVANE_API KMarkupAttributes {
public:
  void Add(KString name, KString value) { items_.push_back({std::move(name), std::move(value)}); }
  int32_t Count() const noexcept { return static_cast<int32_t>(items_.size()); }
  const KMarkupAttribute& operator[](int32_t i) const noexcept { return items_[static_cast<size_t>(i)]; }
  auto begin() const noexcept { return items_.begin(); }
  auto end() const noexcept { return items_.end(); }

  // The first attribute of that name, or null.
  const KString* Find(const KString& name) const noexcept;

  // Decimal with an optional leading "-"; reading stops at the first other character, so a
  // non-numeric value reads as 0.
  int32_t Integer(const KString& name, int32_t fallback) const noexcept;
  // A hexadecimal byte with an optional leading "-" ("fillalpha=50" is 0x50); a negative value
  // wraps as the byte it names would.
  uint8_t HexByte(const KString& name, uint8_t fallback) const noexcept;
  uint32_t Colour(const KString& name, uint32_t fallback) const noexcept;  // 0xAARRGGBB
  KMarkupSize Size(const KString& name) const noexcept;

  // "RRGGBB" becomes 0xFFRRGGBB; a value of exactly eight characters is "RRGGBBAA" and becomes
  // 0xAARRGGBB. Digits are read up to the first character that is not one.
  static uint32_t ParseColour(const KString& value) noexcept;
  // A positive whole number of pixels of the look-and-feel ("MaxStdIconSizeX"), or 0 for a name
  // it does not define.
  static int32_t LayoutConstant(const KString& name) noexcept;

private:
  std::vector<KMarkupAttribute> items_;
};
