// The software rasteriser is right, not only alike: anti-aliased edges against the exact area
// they cover, the non-zero rule, blending to exact bytes, the pixel grid at fractional scales,
// blits and the graphs.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

#include "tests/core/TraceCapture.h"
#include "ui/KDrawerToKBitmap.h"

namespace {
// A black picture painted in white: the green byte of a pixel is the covered part of it.
struct Canvas {
  KBitmap picture;
  KDrawerToKBitmap drawer;
  explicit Canvas(int32_t size, double scale = 1) : picture(size, size), drawer(picture, scale) { picture.Fill(0xFF000000u); }
  double Coverage(int32_t x, int32_t y) const { return KGreenOf(picture.Pixel(x, y)) / 255.0; }
};

// The area of a convex polygon inside the unit square of pixel (px, py), by clipping it
// against the four sides (Sutherland-Hodgman) and the shoelace formula.
double ExactArea(std::vector<KPointF> polygon, int32_t px, int32_t py) {
  const auto clip = [&](auto inside, auto cross) {
    std::vector<KPointF> out;
    for (size_t i = 0; i < polygon.size(); ++i) {
      const KPointF a = polygon[i], b = polygon[(i + 1) % polygon.size()];
      if (inside(a)) out.push_back(a);
      if (inside(a) != inside(b)) out.push_back(cross(a, b));
    }
    polygon = out;
  };
  const auto atX = [](double x) {
    return [x](KPointF a, KPointF b) { return KPointF{x, a.y + (b.y - a.y) * (x - a.x) / (b.x - a.x)}; };
  };
  const auto atY = [](double y) {
    return [y](KPointF a, KPointF b) { return KPointF{a.x + (b.x - a.x) * (y - a.y) / (b.y - a.y), y}; };
  };
  clip([&](KPointF p) { return p.x >= px; }, atX(px));
  clip([&](KPointF p) { return p.x <= px + 1; }, atX(px + 1));
  clip([&](KPointF p) { return p.y >= py; }, atY(py));
  clip([&](KPointF p) { return p.y <= py + 1; }, atY(py + 1));
  double area = 0;
  for (size_t i = 0; i < polygon.size(); ++i) {
    const KPointF a = polygon[i], b = polygon[(i + 1) % polygon.size()];
    area += a.x * b.y - b.x * a.y;
  }
  return std::abs(area) / 2;
}

// The area of a disc inside pixel (px, py), integrated column by column.
double DiscArea(KPointF c, double r, int32_t px, int32_t py) {
  constexpr int kSteps = 4000;
  double area = 0;
  for (int i = 0; i < kSteps; ++i) {
    const double x = px + (i + 0.5) / kSteps, dx = x - c.x;
    if (std::abs(dx) >= r) continue;
    const double h = std::sqrt(r * r - dx * dx);
    area += std::max(0.0, std::min(c.y + h, py + 1.0) - std::max(c.y - h, double(py))) / kSteps;
  }
  return area;
}
}  // namespace

TEST(Raster, LineEdgesCoverTheExactArea) {
  // Lines of width 1.6 at several angles, flat ends: the covered part of every pixel matches
  // the exact area of the line's rectangle to within the rounding of one byte.
  for (double angle : {0.0, 0.3, 0.7854, 1.2, 1.5708, 2.5}) {
    Canvas c(40);
    c.drawer.SetLineWidth(1.6);
    const KPointF from{20 - 12 * std::cos(angle), 20 - 12 * std::sin(angle)}, to{20 + 12 * std::cos(angle), 20 + 12 * std::sin(angle)};
    c.drawer.LineF(from, to, 0xFFFFFFFFu, 255, kDrawBlend);
    // The rectangle in pixel coordinates (integer points name pixel centres).
    const double nx = -std::sin(angle) * 0.8, ny = std::cos(angle) * 0.8;
    const std::vector<KPointF> rect{{from.x + 0.5 - nx, from.y + 0.5 - ny}, {to.x + 0.5 - nx, to.y + 0.5 - ny},
                                    {to.x + 0.5 + nx, to.y + 0.5 + ny}, {from.x + 0.5 + nx, from.y + 0.5 + ny}};
    double worst = 0, ink = 0;
    for (int32_t y = 0; y < 40; ++y)
      for (int32_t x = 0; x < 40; ++x) {
        worst = std::max(worst, std::abs(c.Coverage(x, y) - ExactArea(rect, x, y)));
        ink += c.Coverage(x, y);
      }
    EXPECT_LT(worst, 1.5 / 255) << "angle " << angle;
    // The total is the line's area, give or take the rounding of each edge pixel to a byte.
    EXPECT_NEAR(ink, 24 * 1.6, 0.2) << "angle " << angle;
  }
}

TEST(Raster, CircleEdgesCoverTheExactArea) {
  for (double radius : {2.3, 7.5, 15.2}) {
    Canvas c(40);
    const KPointF centre{19.3, 18.8};
    c.drawer.FillCircle(centre, radius, 0xFFFFFFFFu, 255, kDrawBlend);
    const KPointF inPixels{centre.x + 0.5, centre.y + 0.5};
    double worst = 0;
    for (int32_t y = 0; y < 40; ++y)
      for (int32_t x = 0; x < 40; ++x) worst = std::max(worst, std::abs(c.Coverage(x, y) - DiscArea(inPixels, radius, x, y)));
    // The circle is a polygon within 0.015 pixels of the true curve on either side.
    EXPECT_LT(worst, 0.02) << "radius " << radius;
  }
}

TEST(Raster, NonZeroWindingCutsHolesOnlyWithReversedContours) {
  const KPointF squares[] = {{4, 4}, {27, 4}, {27, 27}, {4, 27}, {10, 10}, {10, 21}, {21, 21}, {21, 10}};
  const int32_t two[] = {4, 4};
  Canvas hole(32);
  hole.drawer.FillPolygon(squares, two, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(hole.Coverage(15, 15), 0);  // inside the reversed inner square
  EXPECT_EQ(hole.Coverage(7, 15), 1);   // in the ring
  EXPECT_EQ(hole.Coverage(2, 2), 0);
  // The inner square turning the same way adds to the outer one: no hole.
  const KPointF same[] = {{4, 4}, {27, 4}, {27, 27}, {4, 27}, {10, 10}, {21, 10}, {21, 21}, {10, 21}};
  Canvas filled(32);
  filled.drawer.FillPolygon(same, two, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(filled.Coverage(15, 15), 1);
  // A pentagram's centre is wound twice: filled by the non-zero rule.
  std::vector<KPointF> star;
  for (int i = 0; i < 5; ++i) star.push_back({16 + 14 * std::sin(i * 4 * std::numbers::pi / 5), 16 - 14 * std::cos(i * 4 * std::numbers::pi / 5)});
  Canvas pentagram(32);
  pentagram.drawer.FillPolygon(star, {}, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(pentagram.Coverage(15, 16), 1);
}

TEST(Raster, HalfTransparentColoursBlendToExactBytes) {
  KBitmap picture(4, 1);
  picture.Fill(0xFF0000FFu);  // opaque blue
  KDrawerToKBitmap drawer(picture);
  // Red at alpha 128 over blue: 255·128/255 = 128 red, 255·127/255 = 127 blue.
  drawer.SetPixel({0, 0}, 0x80FF0000u, 255, kDrawBlend);
  EXPECT_EQ(picture.Pixel(0, 0), 0xFF80007Fu);
  // Opacity multiplies the colour's alpha: 128 · 128 / 255 = 64.
  drawer.SetPixel({1, 0}, 0x80FFFFFFu, 128, kDrawBlend);
  EXPECT_EQ(picture.Pixel(1, 0), KMakeColor(255, 64, 64, 64 + KMulByte(255, 191)));
  // Copy mode replaces the pixel, alpha included.
  drawer.SetPixel({2, 0}, 0x40102030u, 255, kDrawCopy);
  EXPECT_EQ(picture.Pixel(2, 0), 0x40102030u);
  // Over a transparent pixel the alpha becomes the source's.
  picture.Row(0)[3] = 0;
  drawer.SetPixel({3, 0}, 0x60FFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(picture.Pixel(3, 0), 0x60606060u);
  // A half-transparent bitmap pixel blitted at half opacity over white: alpha 200·128/255 = 100.
  KBitmap source(1, 1);
  source.Row(0)[0] = 0xC8000000u;
  picture.Fill(0xFFFFFFFFu);
  drawer.BitBlt({0, 0, 0, 0}, source, {0, 0}, 128, kDrawBlend);
  EXPECT_EQ(picture.Pixel(0, 0), KMakeColor(255, 155, 155, 155));
}

TEST(Raster, TheScaleKeepsNeighboursSeamless) {
  // At 1.5 two neighbouring logical pixels share three pixels without a gap or an overlap.
  Canvas c(8, 1.5);
  c.drawer.FillRectangle({0, 0, 0, 0}, 0xFFFFFFFFu, 128, kDrawBlend);
  c.drawer.FillRectangle({1, 0, 1, 0}, 0xFFFFFFFFu, 128, kDrawBlend);
  for (int32_t x = 0; x < 3; ++x) EXPECT_EQ(KGreenOf(c.picture.Pixel(x, 0)), 128u) << x;
  EXPECT_EQ(KGreenOf(c.picture.Pixel(3, 0)), 0u);
  // At 2 a logical pixel is two by two.
  Canvas two(8, 2);
  two.drawer.SetPixel({1, 1}, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(two.Coverage(2, 2) + two.Coverage(3, 3), 2);
  EXPECT_EQ(two.Coverage(1, 1) + two.Coverage(4, 4), 0);
  // Integer lines cover their end pixels exactly (square ends of half the width).
  Canvas line(16);
  line.drawer.Line({2, 3}, {7, 3}, 0xFFFFFFFFu, 255, kDrawBlend);
  for (int32_t x = 0; x < 16; ++x)
    for (int32_t y = 0; y < 16; ++y) EXPECT_EQ(line.Coverage(x, y), y == 3 && x >= 2 && x <= 7 ? 1 : 0) << x << "," << y;
}

TEST(Raster, GradientsRunFromEdgeToEdge) {
  KBitmap picture(2, 256);
  KDrawerToKBitmap drawer(picture);
  drawer.FillRectangleGradient({0, 0, 1, 255}, 0xFF000000u, 0xFFFFFFFFu, KGradient::Vertical, 255, kDrawCopy);
  // Each row takes the colour at its centre: row y is (y + 0.5) / 256 of the way.
  for (int32_t y = 0; y < 256; ++y) EXPECT_EQ(KRedOf(picture.Pixel(1, y)), uint32_t((y + 0.5) / 256 * 255 + 0.5)) << y;
  drawer.FillRectangleGradient({0, 0, 1, 0}, 0xFF000000u, 0xFFFFFFFFu, KGradient::Horizontal, 255, kDrawCopy);
  EXPECT_LT(KRedOf(picture.Pixel(0, 0)), KRedOf(picture.Pixel(1, 0)));
}

TEST(Raster, BlitsCopyClipRepeatAndFilter) {
  KBitmap source(8, 8);
  for (int32_t y = 0; y < 8; ++y)
    for (int32_t x = 0; x < 8; ++x) source.Row(y)[x] = KMakeColor(255, uint32_t(x * 30), uint32_t(y * 30), 7);
  KBitmap picture(32, 32);
  KDrawerToKBitmap drawer(picture);
  // The pattern's corner lies at the destination's corner and repeats with the source's size.
  drawer.PatBlt({3, 5, 20, 20}, source, {4, 4, 7, 7}, 255, kDrawCopy);
  EXPECT_EQ(picture.Pixel(3, 5), source.Pixel(4, 4));
  EXPECT_EQ(picture.Pixel(3 + 4, 5 + 9), source.Pixel(4, 5));
  EXPECT_EQ(picture.Pixel(21, 21), 0u);
  // Stretching two texels over four pixels interpolates between them; the ends keep them.
  KBitmap two(2, 1);
  two.Row(0)[0] = 0xFF000000u, two.Row(0)[1] = 0xFFFFFFFFu;
  drawer.StretchBlt({0, 30, 3, 30}, two, {0, 0, 1, 0}, 255, kDrawCopy);
  EXPECT_EQ(KRedOf(picture.Pixel(0, 30)), 0u);
  EXPECT_EQ(KRedOf(picture.Pixel(1, 30)), 64u);
  EXPECT_EQ(KRedOf(picture.Pixel(2, 30)), 191u);
  EXPECT_EQ(KRedOf(picture.Pixel(3, 30)), 255u);
  // A quarter turn moves the source's top row onto the right column.
  KBitmap turned(16, 16);
  KDrawerToKBitmap turner(turned);
  turner.RotatedBlt({7.5, 7.5}, std::numbers::pi / 2, source, source.Bounds(), 255, kDrawCopy);
  EXPECT_EQ(turned.Pixel(11 - 0, 4 + 2), source.Pixel(2, 0));
}

TEST(Raster, GraphsFillBetweenTheirCurves) {
  const std::vector<double> flat(20, 0.0);
  Canvas graph(40);
  graph.drawer.PaintHorizontalGraph({0, 0, 39, 20}, flat, 10, -10, -10, 0xFFFFFFFFu, 0xFF808080u, 255, kDrawBlend);
  EXPECT_EQ(KGreenOf(graph.picture.Pixel(20, 16)), 0x80u);  // between the curve and the base
  EXPECT_EQ(KGreenOf(graph.picture.Pixel(20, 4)), 0u);      // above the curve
  EXPECT_EQ(graph.Coverage(20, 10), 1);                     // on the curve, drawn last
  const std::vector<double> lows(10, -5.0), highs(10, 5.0);
  Canvas band(40);
  band.drawer.PaintHorizontalIntervalGraph({0, 0, 39, 20}, lows, highs, 10, -10, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_EQ(band.Coverage(20, 10), 1);
  EXPECT_EQ(band.Coverage(20, 2), 0);
  EXPECT_EQ(band.Coverage(20, 18), 0);
  // Values beyond the range run along the edge they are beyond.
  const std::vector<double> high(5, 100.0);
  Canvas edge(40);
  edge.drawer.PaintHorizontalPolyLine({0, 10, 39, 30}, high, 10, -10, 0xFFFFFFFFu, 255, kDrawBlend);
  EXPECT_GT(edge.Coverage(20, 10), 0.4);
  EXPECT_EQ(edge.Coverage(20, 14), 0);
}

TEST(Raster, OperationsAreGuardedUnderTheirNames) {
  KTraceCapture trace;
  Canvas c(8);
  c.drawer.AlignedTextOut({0, 0, 7, 7}, KString("x"), KFont(5000), 0xFFFFFFFFu, kAlignLeft, 255, kDrawBlend);
  c.drawer.FillRectangle({0, 0, 7, 7}, 0xFFFFFFFFu, 255, kDrawBlend);
  ASSERT_EQ(trace.Lines().size(), 1u);
  EXPECT_EQ(trace.Lines()[0], "SYSTEM EXCEPTION! KDrawerToKBitmap::AlignedTextOut");
  // The failed text left nothing; the painting went on.
  EXPECT_EQ(c.Coverage(3, 3), 1);
}
