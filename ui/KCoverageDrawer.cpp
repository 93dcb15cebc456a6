#include "ui/KCoverageDrawer.h"

#include <algorithm>
#include <cmath>

#include "kernel/KGuard.h"

namespace {
KPointF ToF(KPoint p) { return {double(p.x), double(p.y)}; }
}  // namespace

void KCoverageDrawer::PaintGlyphs(const std::vector<KGlyphInk>& glyphs, KColor color, uint8_t opacity, uint32_t mode) {
  const KCoverage mask = KFont::Compose(glyphs, TargetWidth(), TargetHeight());
  if (!mask.IsEmpty()) PaintCoverage(mask, color, opacity, mode);
}

void KCoverageDrawer::Fill(const KPath& path, KColor color, uint8_t opacity, uint32_t mode) {
  const KCoverage mask = KRasterize(path, TargetWidth(), TargetHeight());
  if (!mask.IsEmpty()) PaintCoverage(mask, color, opacity, mode);
}

void KCoverageDrawer::Stroke(std::span<const KPointF> points, bool square, KColor color, uint8_t opacity, uint32_t mode) {
  std::vector<KPointF> pixels(points.size());
  std::transform(points.begin(), points.end(), pixels.begin(), [this](KPointF p) { return ToPixels(p); });
  const double width = LineWidth() * Scale();
  KPath path;
  path.AddStroke(pixels, width, square ? width / 2 : 0);
  Fill(path, color, opacity, mode);
}

void KCoverageDrawer::AlignedTextOut(const KRect& rect, const KString& text, const KFont& font, KColor color,
                                     uint32_t alignment, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationAlignedTextOut), [&] {
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty() || text.IsEmpty()) return;
    const double pixels[4] = {double(box.left), double(box.top), double(box.right), double(box.bottom)};
    PaintGlyphs(font.Place(text, Scale(), pixels, alignment), color, opacity, mode);
  });
}

void KCoverageDrawer::LineTo(KPoint to, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationLineTo), [&] {
    const KPointF points[2] = {position_, ToF(to)};
    position_ = ToF(to);
    Stroke(points, true, color, opacity, mode);
  });
}

void KCoverageDrawer::Line(KPoint from, KPoint to, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationLine), [&] {
    const KPointF points[2] = {ToF(from), ToF(to)};
    Stroke(points, true, color, opacity, mode);
  });
}

void KCoverageDrawer::LineToF(KPointF to, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationLineToF), [&] {
    const KPointF points[2] = {position_, to};
    position_ = to;
    Stroke(points, false, color, opacity, mode);
  });
}

void KCoverageDrawer::LineF(KPointF from, KPointF to, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationLineF), [&] {
    const KPointF points[2] = {from, to};
    Stroke(points, false, color, opacity, mode);
  });
}

void KCoverageDrawer::Rectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationRectangle), [&] {
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty()) return;
    const double l = double(box.left), t = double(box.top), r = double(box.right), b = double(box.bottom);
    const double w = LineWidth() * Scale();
    KPath path;
    path.AddRectangle(l, t, r, b);
    if (r - l > 2 * w && b - t > 2 * w) path.AddRectangle(l + w, t + w, r - w, b - w, true);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::RoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationRoundRectangle), [&] {
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty()) return;
    const double l = double(box.left), t = double(box.top), r = double(box.right), b = double(box.bottom);
    const double w = LineWidth() * Scale(), rounding = radius * Scale();
    KPath path;
    path.AddRoundRectangle(l, t, r, b, rounding);
    if (r - l > 2 * w && b - t > 2 * w) path.AddRoundRectangle(l + w, t + w, r - w, b - w, rounding - w, true);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::FillRoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillRoundRectangle), [&] {
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty()) return;
    KPath path;
    path.AddRoundRectangle(double(box.left), double(box.top), double(box.right), double(box.bottom), radius * Scale());
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::Circle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationCircle), [&] {
    const KPointF c = ToPixels(centre);
    const double r = radius * Scale(), half = LineWidth() * Scale() / 2;
    if (!(r > 0)) return;
    KPath path;
    path.AddEllipse(c.x, c.y, r + half, r + half);
    if (r > half) path.AddEllipse(c.x, c.y, r - half, r - half, true);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::FillCircle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillCircle), [&] {
    const KPointF c = ToPixels(centre);
    const double r = radius * Scale();
    if (!(r > 0)) return;
    KPath path;
    path.AddEllipse(c.x, c.y, r, r);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::FillTriangle(KPointF a, KPointF b, KPointF c, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillTriangle), [&] {
    KPath path;
    for (KPointF p : {a, b, c}) path.Add(ToPixels(p));
    path.Close();
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::PolyLine(std::span<const KPoint> points, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPolyLine), [&] {
    std::vector<KPointF> f(points.size());
    std::transform(points.begin(), points.end(), f.begin(), ToF);
    Stroke(f, true, color, opacity, mode);
  });
}

void KCoverageDrawer::PolyLineF(std::span<const KPointF> points, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPolyLineF), [&] { Stroke(points, false, color, opacity, mode); });
}

void KCoverageDrawer::FillPolygon(std::span<const KPointF> points, std::span<const int32_t> contourLengths, KColor color,
                                  uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillPolygon), [&] {
    KPath path;
    const int32_t single[1] = {int32_t(points.size())};
    size_t next = 0;
    for (int32_t length : contourLengths.empty() ? std::span<const int32_t>(single) : contourLengths) {
      if (length < 0 || size_t(length) > points.size() - next) break;
      for (size_t i = next; i < next + size_t(length); ++i) path.Add(ToPixels(points[i]));
      path.Close();
      next += size_t(length);
    }
    Fill(path, color, opacity, mode);
  });
}

std::vector<KPointF> KCoverageDrawer::CurvePoints(const KRect& area, std::span<const double> values, double top,
                                                  double bottom) const {
  std::vector<KPointF> points;
  if (values.empty() || area.IsEmpty() || !(std::abs(top - bottom) > 1e-10)) return points;
  const double low = std::min(top, bottom), high = std::max(top, bottom);
  const double stepX = values.size() > 1 ? (double(area.right) - area.left) / double(values.size() - 1) : 0;
  const double spanY = double(area.bottom) - area.top;
  points.reserve(values.size());
  for (size_t i = 0; i < values.size(); ++i) {
    // Values beyond the range (or not a number) run along the nearer edge.
    const double v = std::isnan(values[i]) ? bottom : std::clamp(values[i], low, high);
    points.push_back(ToPixels(KPointF{area.left + stepX * double(i), area.top + (top - v) / (top - bottom) * spanY}));
  }
  return points;
}

void KCoverageDrawer::PaintHorizontalPolyLine(const KRect& area, std::span<const double> values, double top, double bottom,
                                              KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPaintHorizontalPolyLine), [&] {
    const std::vector<KPointF> points = CurvePoints(area, values, top, bottom);
    KPath path;
    path.AddStroke(points, LineWidth() * Scale(), 0);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::PaintHorizontalGraph(const KRect& area, std::span<const double> values, double top, double bottom,
                                           double base, KColor line, KColor fill, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPaintHorizontalGraph), [&] {
    const std::vector<KPointF> points = CurvePoints(area, values, top, bottom);
    if (points.empty()) return;
    const std::vector<KPointF> basePoint = CurvePoints(area, std::span<const double>(&base, 1), top, bottom);
    if (basePoint.empty()) return;
    const double baseline = basePoint.front().y;
    // Closed along the base line: the end points drop onto it.
    std::vector<KPointF> closed = points;
    closed.push_back({points.back().x, baseline});
    closed.push_back({points.front().x, baseline});
    KPath below;
    below.AddContour(closed);
    Fill(below, fill, opacity, mode);
    KPath curve;
    curve.AddStroke(points, LineWidth() * Scale(), 0);
    Fill(curve, line, opacity, mode);
  });
}

void KCoverageDrawer::PaintHorizontalIntervalGraph(const KRect& area, std::span<const double> lows,
                                                   std::span<const double> highs, double top, double bottom, KColor color,
                                                   uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPaintHorizontalIntervalGraph), [&] {
    const size_t count = std::min(lows.size(), highs.size());
    std::vector<KPointF> band = CurvePoints(area, highs.first(count), top, bottom);
    const std::vector<KPointF> low = CurvePoints(area, lows.first(count), top, bottom);
    band.insert(band.end(), low.rbegin(), low.rend());
    // A band of one value still shows as a line of the current width.
    KPath path;
    path.AddContour(band);
    path.AddStroke(band, std::min(LineWidth() * Scale(), 1.0), 0);
    Fill(path, color, opacity, mode);
  });
}

void KCoverageDrawer::StretchBltH(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltH), [&] {
    const KRect d{dest.left, dest.top, dest.right, int32_t(std::min<int64_t>(INT32_MAX, dest.top + source.Height() - 1))};
    StretchBlt(d, bitmap, source, opacity, mode);
  });
}

void KCoverageDrawer::StretchBltV(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltV), [&] {
    const KRect d{dest.left, dest.top, int32_t(std::min<int64_t>(INT32_MAX, dest.left + source.Width() - 1)), dest.bottom};
    StretchBlt(d, bitmap, source, opacity, mode);
  });
}

void KCoverageDrawer::SetPixel(KPoint at, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationSetPixel), [&] { FillRectangle({at.x, at.y, at.x, at.y}, color, opacity, mode); });
}
