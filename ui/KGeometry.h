#pragma once

#include <cstdint>

// Geometry and colour of the drawing interface. Rectangles are inclusive: a bitmap of width w
// and height h is (0, 0, w-1, h-1). Integer points name a pixel (its centre); floating-point
// points use the same axes with fractions, so (2.5, 0) lies between the centres of pixels 2 and 3.
struct KRect {
  int32_t left = 0, top = 0, right = -1, bottom = -1;

  int64_t Width() const noexcept { return int64_t{right} - left + 1; }
  int64_t Height() const noexcept { return int64_t{bottom} - top + 1; }
  bool IsEmpty() const noexcept { return right < left || bottom < top; }
  bool operator==(const KRect&) const = default;
  auto operator<=>(const KRect&) const = default;
};

struct KPoint {
  int32_t x = 0, y = 0;
};

struct KPointF {
  double x = 0, y = 0;
};

// 0xAARRGGBB; in memory blue, green, red, alpha.
using KColor = uint32_t;

constexpr uint32_t KAlphaOf(KColor c) noexcept { return c >> 24; }
constexpr uint32_t KRedOf(KColor c) noexcept { return (c >> 16) & 0xFF; }
constexpr uint32_t KGreenOf(KColor c) noexcept { return (c >> 8) & 0xFF; }
constexpr uint32_t KBlueOf(KColor c) noexcept { return c & 0xFF; }
constexpr KColor KMakeColor(uint32_t a, uint32_t r, uint32_t g, uint32_t b) noexcept { return a << 24 | r << 16 | g << 8 | b; }

// x·y/255 rounded, for bytes.
constexpr uint32_t KMulByte(uint32_t x, uint32_t y) noexcept {
  const uint32_t t = x * y + 128;
  return (t + (t >> 8)) >> 8;
}
