// Bad input to the software drawer: empty and inverted rectangles, far coordinates, a target
// of no pixels, numbers that are not numbers. Nothing may crash or write outside the bitmap
// (the suite runs under AddressSanitizer too), and nothing is painted where nothing is asked.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "tests/core/TraceCapture.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/KOpenGLTexture.h"

namespace {
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

// Calls every operation with rectangles of `rect` and points of `p` / `f`.
void EveryOperation(KDrawer& d, const KRect& rect, KPoint p, KPointF f, const KBitmap& bitmap) {
  const KOpenGLTexture texture(0, &bitmap, bitmap.Bounds());
  const uint32_t c = 0xFFFFFFFFu;
  d.PaintGLTexture(rect, texture, 255, kDrawBlend);
  d.PatBlt(rect, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.BitBlt(rect, bitmap, p, 255, kDrawBlend);
  d.AlphaMask(rect, bitmap, p, c, 255, kDrawBlend);
  d.StretchBlt(rect, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.StretchBltF(f.x, f.y, f.x * 2, f.y * 2, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.DrawBitmap(p, bitmap, 255, kDrawBlend);
  d.StretchBltNine(rect, bitmap, bitmap.Bounds(), {1, 1, 1, 1}, 255, kDrawBlend);
  d.StretchBltH(rect, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.StretchBltV(rect, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.RotatedBlt(f, f.x, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.StretchBltArc(f, f.x, f.y, 0, f.x, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  d.AlignedTextOut(rect, KString("Text"), KFont::Normal(), c, kAlignCentre | kAlignMiddle, 255, kDrawBlend);
  d.MoveTo(f);
  d.LineTo(p, c, 255, kDrawBlend);
  d.Line(p, {p.x / 2, p.y / 3}, c, 255, kDrawBlend);
  d.LineToF(f, c, 255, kDrawBlend);
  d.LineF(f, {f.x / 2, f.y}, c, 255, kDrawBlend);
  d.Rectangle(rect, c, 255, kDrawBlend);
  d.FillRectangle(rect, c, 255, kDrawBlend);
  d.FillRectangleGradient(rect, c, 0xFF000000u, KGradient::Horizontal, 255, kDrawBlend);
  d.RoundRectangle(rect, f.x, c, 255, kDrawBlend);
  d.FillRoundRectangle(rect, f.y, c, 255, kDrawBlend);
  d.Circle(f, f.x, c, 255, kDrawBlend);
  d.FillCircle(f, f.y, c, 255, kDrawBlend);
  d.FillTriangle(f, {f.x, 0}, {0, f.y}, c, 255, kDrawBlend);
  const KPoint points[] = {p, {p.x, p.y / 2}, {p.x / 2, p.y}};
  const KPointF pointsF[] = {f, {f.x, f.y / 2}, {f.x / 2, f.y}};
  d.PolyLine(points, c, 255, kDrawBlend);
  d.PolyLineF(pointsF, c, 255, kDrawBlend);
  const int32_t badContours[] = {2, -5, 100};
  d.FillPolygon(pointsF, badContours, c, 255, kDrawBlend);
  const double values[] = {f.x, f.y, kNaN, 1e300};
  d.PaintHorizontalPolyLine(rect, values, f.x, f.y, c, 255, kDrawBlend);
  d.PaintHorizontalGraph(rect, values, 0, 1, f.x, c, c, 255, kDrawBlend);
  d.PaintHorizontalIntervalGraph(rect, values, std::span<const double>(values, 2), f.y, 0, c, 255, kDrawBlend);
  d.SetPixel(p, c, 255, kDrawBlend);
}

bool Untouched(const KBitmap& picture) {
  for (int32_t y = 0; y < picture.Height(); ++y)
    for (int32_t x = 0; x < picture.Width(); ++x)
      if (picture.Pixel(x, y) != 0xFF000000u) return false;
  return true;
}
}  // namespace

TEST(BadInput, EmptyAndInvertedRectanglesPaintNothing) {
  const KBitmap bitmap(8, 8);
  KBitmap picture(32, 32);
  picture.Fill(0xFF000000u);
  KDrawerToKBitmap drawer(picture);
  KTraceCapture trace;
  for (const KRect& rect : {KRect{10, 10, 9, 20}, KRect{10, 20, 20, 10}, KRect{20, 20, 5, 5}}) {
    const KPoint nowhere{-100, -100};
    const KPointF far{-500.5, -900};
    EveryOperation(drawer, rect, nowhere, far, bitmap);
  }
  EXPECT_TRUE(Untouched(picture));
  EXPECT_TRUE(trace.Lines().empty());
}

TEST(BadInput, FarCoordinatesAreCutToTheBitmap) {
  KBitmap bitmap(8, 8);
  bitmap.Fill(0xFFFF0000u);
  for (double scale : {1.0, 1.5, 2.0}) {
    KBitmap picture(32, 32);
    KDrawerToKBitmap drawer(picture, scale);
    for (const KRect& rect : {KRect{INT32_MIN, INT32_MIN, INT32_MAX, INT32_MAX}, KRect{INT32_MAX - 1, 0, INT32_MAX, 5},
                              KRect{-2000000000, -5, 10, 2000000000}})
      EveryOperation(drawer, rect, {INT32_MAX, INT32_MIN}, {1e15, -1e300}, bitmap);
    // A line from far outside to far outside still crosses the picture.
    KBitmap line(32, 32);
    line.Fill(0xFF000000u);
    KDrawerToKBitmap lines(line, scale);
    lines.LineF({-1e9, -1e9}, {1e9, 1e9}, 0xFFFFFFFFu, 255, kDrawBlend);
    EXPECT_GT(KGreenOf(line.Pixel(16, 16)), 230u);  // 0.914 of it at scale 1, all of it above
    EXPECT_EQ(KGreenOf(line.Pixel(28, 2)), 0u);
  }
}

TEST(BadInput, NumbersThatAreNotNumbersPaintNothing) {
  const KBitmap bitmap(8, 8);
  KBitmap picture(32, 32);
  picture.Fill(0xFF000000u);
  KDrawerToKBitmap drawer(picture);
  for (const double bad : {kNaN, kInfinity, -kInfinity}) {
    for (const KPointF f : {KPointF{bad, 3}, KPointF{4, bad}}) {
      drawer.LineF(f, {10, 10}, 0xFFFFFFFFu, 255, kDrawBlend);
      drawer.FillCircle(f, 4, 0xFFFFFFFFu, 255, kDrawBlend);
      drawer.FillTriangle(f, {1, 1}, {20, 5}, 0xFFFFFFFFu, 255, kDrawBlend);
      const KPointF points[] = {{1, 1}, f, {20, 20}};
      drawer.PolyLineF(points, 0xFFFFFFFFu, 255, kDrawBlend);
      drawer.FillPolygon(points, {}, 0xFFFFFFFFu, 255, kDrawBlend);
      drawer.RotatedBlt(f, 0.5, bitmap, bitmap.Bounds(), 255, kDrawBlend);
      drawer.StretchBltArc(f, 4, 8, 0, 1, bitmap, bitmap.Bounds(), 255, kDrawBlend);
      drawer.StretchBltF(f.x, f.y, 10, 10, bitmap, bitmap.Bounds(), 255, kDrawBlend);
    }
    drawer.Circle({10, 10}, bad, 0xFFFFFFFFu, 255, kDrawBlend);
    drawer.FillCircle({10, 10}, bad, 0xFFFFFFFFu, 255, kDrawBlend);
    drawer.RotatedBlt({10, 10}, bad, bitmap, bitmap.Bounds(), 255, kDrawBlend);
    drawer.StretchBltArc({10, 10}, bad, 8, 0, 1, bitmap, bitmap.Bounds(), 255, kDrawBlend);
    drawer.StretchBltArc({10, 10}, 4, 8, bad, 1, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  }
  EXPECT_TRUE(Untouched(picture));
  drawer.SetLineWidth(kNaN);  // ignored
  drawer.SetScale(kNaN);
  EXPECT_EQ(drawer.LineWidth(), 1);
  EXPECT_EQ(drawer.Scale(), 1);
}

TEST(BadInput, ATargetOrSourceOfNoPixels) {
  KBitmap empty;
  KDrawerToKBitmap drawer(empty);
  KBitmap bitmap(4, 4);
  EveryOperation(drawer, {0, 0, 10, 10}, {1, 1}, {2.5, 3.5}, bitmap);
  EveryOperation(drawer, {0, 0, 10, 10}, {0, 0}, {1, 1}, empty);
  KBitmap picture(16, 16);
  picture.Fill(0xFF000000u);
  KDrawerToKBitmap onto(picture);
  EveryOperation(onto, {0, 0, 10, 10}, {0, 0}, {1, 1}, empty);
  // Only what needs no bitmap painted: the empty bitmap's blits left the picture alone there.
  EXPECT_EQ(empty.Width(), 0);
  // A source rectangle outside the bitmap is refused, not read.
  KBitmap clean(16, 16);
  clean.Fill(0xFF000000u);
  KDrawerToKBitmap blits(clean);
  blits.StretchBlt({0, 0, 15, 15}, bitmap, {2, 2, 9, 9}, 255, kDrawBlend);
  blits.PatBlt({0, 0, 15, 15}, bitmap, {-1, 0, 2, 2}, 255, kDrawBlend);
  blits.RotatedBlt({8, 8}, 1, bitmap, {0, 0, 4, 3}, 255, kDrawBlend);
  EXPECT_TRUE(Untouched(clean));
}
