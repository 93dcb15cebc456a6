#include "ui/KDrawer.h"

#include <algorithm>
#include <cmath>

#include "kernel/KGuard.h"

namespace {
// Far beyond any target, yet far from overflowing 64 bits when multiplied by a scale.
constexpr double kFarPixel = 1e12;

int64_t GridLine(double logical, double scale) noexcept {
  return static_cast<int64_t>(std::clamp(std::round(logical * scale), -kFarPixel, kFarPixel));
}
}  // namespace

KDrawer::KDrawer(const KString* names, double scale) : names_(names) { SetScale(scale); }
KDrawer::~KDrawer() = default;

void KDrawer::SetScale(double scale) noexcept {
  if (std::isfinite(scale) && scale > 0) scale_ = scale;
}

void KDrawer::SetLineWidth(double width) noexcept {
  if (std::isfinite(width) && width > 0) lineWidth_ = width;
}

KDrawer::PixelBox KDrawer::ToPixels(const KRect& rect) const noexcept {
  return {GridLine(rect.left, scale_), GridLine(rect.top, scale_), GridLine(double(rect.right) + 1, scale_),
          GridLine(double(rect.bottom) + 1, scale_)};
}

bool KDrawer::ClipBitBlt(KRect& dest, const KBitmap& bitmap, KPoint source, KRect& sourceRect) noexcept {
  // A source point left of or above the bitmap moves the destination's start instead.
  int64_t left = dest.left, top = dest.top, sx = source.x, sy = source.y;
  if (sx < 0) left -= sx, sx = 0;
  if (sy < 0) top -= sy, sy = 0;
  const int64_t right = std::min<int64_t>(dest.right, left + (bitmap.Width() - sx - 1));
  const int64_t bottom = std::min<int64_t>(dest.bottom, top + (bitmap.Height() - sy - 1));
  if (right < left || bottom < top || left > INT32_MAX || top > INT32_MAX) return false;
  dest = {int32_t(left), int32_t(top), int32_t(right), int32_t(bottom)};
  sourceRect = {int32_t(sx), int32_t(sy), int32_t(sx + right - left), int32_t(sy + bottom - top)};
  return true;
}

bool KDrawer::IsInside(const KRect& source, const KBitmap& bitmap) noexcept {
  return !source.IsEmpty() && source.left >= 0 && source.top >= 0 && source.right < bitmap.Width() &&
         source.bottom < bitmap.Height();
}

void KDrawer::StretchBltF(double left, double top, double right, double bottom, const KBitmap& bitmap, const KRect& source,
                          uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltF), [&] {
    for (double v : {left, top, right, bottom})
      if (!(std::abs(v) < 1e9)) return;
    const KRect dest{int32_t(std::lround(left)), int32_t(std::lround(top)), int32_t(std::lround(right)),
                     int32_t(std::lround(bottom))};
    StretchBlt(dest, bitmap, source, opacity, mode);
  });
}

void KDrawer::DrawBitmap(KPoint at, const KBitmap& bitmap, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationDrawBitmap), [&] {
    const KRect dest{at.x, at.y, int32_t(std::min<int64_t>(INT32_MAX, int64_t{at.x} + bitmap.Width() - 1)),
                     int32_t(std::min<int64_t>(INT32_MAX, int64_t{at.y} + bitmap.Height() - 1))};
    BitBlt(dest, bitmap, {0, 0}, opacity, mode);
  });
}

void KDrawer::StretchBltNine(const KRect& dest, const KBitmap& bitmap, const KRect& source, const KRect& insets,
                             uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltNine), [&] {
    // Column and row boundaries of the nine pieces in the source and in the destination, in
    // 64 bits so that far rectangles cannot overflow.
    const int64_t sx[4] = {source.left, int64_t{source.left} + insets.left, int64_t{source.right} - insets.right + 1,
                           int64_t{source.right} + 1};
    const int64_t sy[4] = {source.top, int64_t{source.top} + insets.top, int64_t{source.bottom} - insets.bottom + 1,
                           int64_t{source.bottom} + 1};
    const int64_t dx[4] = {dest.left, int64_t{dest.left} + insets.left, int64_t{dest.right} - insets.right + 1,
                           int64_t{dest.right} + 1};
    const int64_t dy[4] = {dest.top, int64_t{dest.top} + insets.top, int64_t{dest.bottom} - insets.bottom + 1,
                           int64_t{dest.bottom} + 1};
    const auto fits = [](int64_t v) { return v >= INT32_MIN && v <= INT32_MAX; };
    for (int row = 0; row < 3; ++row)
      for (int column = 0; column < 3; ++column) {
        const int64_t s[4] = {sx[column], sy[row], sx[column + 1] - 1, sy[row + 1] - 1};
        const int64_t d[4] = {dx[column], dy[row], dx[column + 1] - 1, dy[row + 1] - 1};
        if (!std::all_of(s, s + 4, fits) || !std::all_of(d, d + 4, fits)) continue;
        const KRect from{int32_t(s[0]), int32_t(s[1]), int32_t(s[2]), int32_t(s[3])};
        const KRect to{int32_t(d[0]), int32_t(d[1]), int32_t(d[2]), int32_t(d[3])};
        if (!from.IsEmpty() && !to.IsEmpty()) StretchBlt(to, bitmap, from, opacity, mode);
      }
  });
}
