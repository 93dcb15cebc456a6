#include "ui/controls/KControlPaint.h"

#include <cmath>
#include <vector>

namespace KControlPaint {

KPointF Polar(KPointF centre, double radius, double angle) noexcept {
  return {centre.x + radius * std::sin(angle), centre.y - radius * std::cos(angle)};
}

void Arc(KDrawer& drawer, KPointF centre, double radius, double from, double to, double width, KColor color) {
  if (to < from) std::swap(from, to);
  if (to - from < 1e-6) return;
  // Segments short enough that the polygon reads as a circle at twice the scale.
  const int32_t segments = 2 + static_cast<int32_t>((to - from) * radius * drawer.Scale() / 3);
  std::vector<KPointF> points;
  points.reserve(static_cast<size_t>(segments) + 1);
  for (int32_t i = 0; i <= segments; ++i) points.push_back(Polar(centre, radius, from + (to - from) * i / segments));
  const double previous = drawer.LineWidth();
  drawer.SetLineWidth(width);
  drawer.PolyLineF(points, color, 255, kDrawBlend);
  drawer.SetLineWidth(previous);
}

KRect Top(const KRect& r, int32_t height) noexcept { return {r.left, r.top, r.right, r.top + height - 1}; }
KRect Bottom(const KRect& r, int32_t height) noexcept { return {r.left, r.bottom - height + 1, r.right, r.bottom}; }

KString Fitted(const KDrawer& drawer, const KString& text, const KFont& font, const KRect& r) {
  // A pixel of air on either side, so that anti-aliased edges stay inside too.
  const double room = double(r.Width() - 2);
  if (font.TextWidth(text, drawer.Scale()) <= room) return text;
  const auto cut = [&](int32_t count) {
    KString shorter = text.SubString(0, count);
    while (shorter.Length() > 0 && shorter.CharAt(shorter.Length() - 1) == u' ') shorter = shorter.SubString(0, shorter.Length() - 1);
    return shorter += u'\u2026';
  };
  // The longest beginning that fits with its ellipsis (widths grow with the count).
  int32_t fits = 0, fails = text.Length();
  while (fails - fits > 1) {
    const int32_t middle = (fits + fails) / 2;
    (font.TextWidth(cut(middle), drawer.Scale()) <= room ? fits : fails) = middle;
  }
  return cut(fits);
}

}  // namespace KControlPaint
