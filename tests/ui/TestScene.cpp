#include "tests/ui/TestScene.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

#include "ui/KOpenGLTexture.h"

KBitmap KTestImages::Picture(int32_t width, int32_t height) {
  KBitmap b(width, height);
  for (int32_t y = 0; y < height; ++y)
    for (int32_t x = 0; x < width; ++x) {
      const uint32_t r = uint32_t(255 * x / std::max(1, width - 1)), g = uint32_t(255 * y / std::max(1, height - 1));
      const uint32_t blue = ((x / 8 + y / 8) % 2) ? 200 : 60;
      // Opaque, but fading out towards the right edge and transparent in the top-right corner.
      uint32_t a = x < width * 3 / 4 ? 255 : uint32_t(255 - 160 * (x - width * 3 / 4) / std::max(1, width / 4));
      if (x > width - 12 && y < 12) a = 0;
      b.Row(y)[x] = KMakeColor(a, r, g, blue);
    }
  return b;
}

KBitmap KTestImages::Tile() {
  KBitmap b(8, 8);
  for (int32_t y = 0; y < 8; ++y)
    for (int32_t x = 0; x < 8; ++x) b.Row(y)[x] = (x + y) % 8 < 2 ? 0xFF3A4452u : 0xFF2C333Du;
  return b;
}

KBitmap KTestImages::Disc(int32_t size) {
  KBitmap b(size, size);
  const double c = size / 2.0;
  for (int32_t y = 0; y < size; ++y)
    for (int32_t x = 0; x < size; ++x) {
      const double d = std::hypot(x + 0.5 - c, y + 0.5 - c);
      const double a = std::clamp(c - 1 - d + 0.5, 0.0, 1.0);
      const uint32_t shade = uint32_t(180 + 70 * (1 - (y + 0.5) / size));
      b.Row(y)[x] = KMakeColor(uint32_t(a * 255 + 0.5), shade, shade, shade);
    }
  // A pointer line from the centre to the top.
  for (int32_t y = 3; y < size / 2; ++y) b.Row(y)[size / 2] = b.Row(y)[size / 2 - 1] = 0xFFE0402Au;
  return b;
}

void KPaintTestScene(KDrawer& d, const KTestSceneImages& images, const KOpenGLTexture& texture) {
  constexpr uint32_t kBlend = kDrawBlend;
  d.SetLineWidth(1);
  // Background and panels.
  d.FillRectangleGradient({0, 0, 399, 299}, 0xFF20252Cu, 0xFF12151Au, KGradient::Vertical, 255, kDrawCopy);
  d.PatBlt({8, 8, 391, 39}, images.tile, {0, 0, 7, 7}, 255, kBlend);
  d.FillRectangleGradient({8, 44, 199, 51}, 0xFF4080C0u, 0xFFC04060u, KGradient::Horizontal, 200, kBlend);
  d.RoundRectangle({8, 56, 199, 170}, 6, 0xFF5A6672u, 255, kBlend);
  d.FillRoundRectangle({12, 60, 195, 166}, 4, 0x30FFFFFFu, 255, kBlend);
  // Blits.
  d.BitBlt({16, 64, 111, 127}, images.picture, {0, 0}, 255, kBlend);
  d.BitBlt({120, 64, 400, 400}, images.picture, {40, 20}, 160, kBlend);
  d.StretchBlt({16, 132, 79, 163}, images.picture, {8, 8, 71, 55}, 255, kBlend);
  d.StretchBltF(84.4, 132.2, 131.6, 163.4, images.picture, {0, 0, 95, 63}, 220, kBlend);
  d.StretchBltH({136, 132, 191, 200}, images.picture, {0, 30, 47, 45}, 255, kBlend);
  d.StretchBltV({204, 8, 400, 60}, images.picture, {50, 0, 65, 20}, 255, kBlend);
  d.DrawBitmap({224, 8}, images.disc, 128, kBlend);
  d.StretchBltNine({270, 10, 389, 36}, images.picture, {0, 0, 63, 63}, {6, 6, 6, 6}, 180, kBlend);
  d.PaintGLTexture({300, 250, 347, 281}, texture, 255, kBlend);
  d.PatBlt({352, 250, 391, 289}, images.picture, {10, 10, 25, 25}, 255, kBlend);
  // Knobs: a turned image, an arc of a picture, a mask in colour, and drawn ones.
  d.RotatedBlt({240, 100}, 0.6, images.disc, {0, 0, 39, 39}, 255, kBlend);
  d.StretchBltArc({300, 100}, 18, 28, -2.4, 2.4, images.picture, {0, 20, 95, 27}, 255, kBlend);
  d.AlphaMask({340, 80, 379, 119}, images.disc, {0, 0}, 0xFF40C0A0u, 200, kBlend);
  for (int i = 0; i < 3; ++i) {
    const KPointF c{230.0 + 50 * i, 150};
    d.FillCircle(c, 16, 0xFF2A3038u, 255, kBlend);
    d.SetLineWidth(2.5);
    std::vector<KPointF> arc;
    for (int k = 0; k <= 24; ++k) {
      const double a = -2.4 + (0.8 + 1.6 * i) * k / 24;
      arc.push_back({c.x + 19 * std::sin(a), c.y - 19 * std::cos(a)});
    }
    d.PolyLineF(arc, 0xFFF0A030u, 255, kBlend);
    d.SetLineWidth(1.5);
    const double a = -2.4 + 0.8 + 1.6 * i;
    d.LineF(c, {c.x + 14 * std::sin(a), c.y - 14 * std::cos(a)}, 0xFFFFFFFFu, 255, kBlend);
    d.SetLineWidth(1);
    d.Circle(c, 16, 0xFF6A7682u, 255, kBlend);
  }
  // Text.
  d.AlignedTextOut({8, 176, 199, 195}, KString("Threshold -18.0 dB"), KFont::Normal(), 0xFFE8ECF0u, kAlignLeft | kAlignMiddle, 255, kBlend);
  d.AlignedTextOut({8, 176, 199, 195}, KString("Bold"), KFont::Bold(), 0xFFF0C060u, kAlignRight | kAlignMiddle, 255, kBlend);
  d.AlignedTextOut({8, 196, 199, 230}, KString("Compressor"), KFont::Large(1), 0xFFFFFFFFu, kAlignCentre | kAlignTop, 255, kBlend);
  d.AlignedTextOut({8, 228, 199, 250}, KString("Italic help text"), KFont::Italic(), 0xFFB0C4D8u, kAlignLeft | kAlignBottom, 255, kBlend);
  d.AlignedTextOut({8, 250, 199, 266}, KString("Heading 2, 3, 4"), KFont::Large(3), 0xFFD0D8E0u, kAlignLeft, 200, kBlend);
  d.AlignedTextOut({8, 268, 199, 282}, KString("Secondary: ratio 4:1, knee 6 dB"), KFont::Small(), 0xFF8894A0u, kAlignLeft, 255, kBlend);
  // Glyphs whose inks overlap: their coverage adds up before it is blended.
  d.AlignedTextOut({150, 283, 199, 299}, KString("fffj"), KFont(15, KFontStyle::BoldItalic), 0xFFF0E0A0u, kAlignRight, 255, kBlend);
  // Lines and shapes.
  d.Line({210, 180}, {390, 180}, 0xFF808890u, 255, kBlend);
  d.MoveTo({210, 185});
  d.LineTo({250, 195}, 0xFFE06060u, 255, kBlend);
  d.LineToF({290.5, 186.25}, 0xFF60E060u, 255, kBlend);
  d.Rectangle({300, 184, 339, 199}, 0xFFA0A8B0u, 255, kBlend);
  d.FillRectangle({344, 184, 359, 199}, 0xC0E04040u, 255, kBlend);
  d.FillTriangle({364, 199}, {376, 183}, {390, 199}, 0xFF40A0E0u, 230, kBlend);
  const KPoint zigzag[] = {{210, 240}, {220, 205}, {230, 240}, {240, 205}};
  d.PolyLine(zigzag, 0xFFC0C040u, 255, kBlend);
  const KPointF ring[] = {{250, 205}, {290, 205}, {290, 245}, {250, 245}, {260, 215}, {260, 235}, {280, 235}, {280, 215}};
  const int32_t contours[] = {4, 4};
  d.FillPolygon(ring, contours, 0xFF9070D0u, 255, kBlend);
  for (int i = 0; i < 8; ++i) d.SetPixel({296 + 2 * i, 240}, 0xFFFFFFFFu, 255, kBlend);
  // Graphs: an equalizer response, its filled form and a level meter's range.
  std::vector<double> response(256), lows(64), highs(64);
  for (size_t i = 0; i < response.size(); ++i) {
    const double x = double(i) / 255;
    response[i] = 9 * std::exp(-std::pow((x - 0.3) / 0.08, 2)) - 6 * std::exp(-std::pow((x - 0.75) / 0.12, 2));
  }
  for (size_t i = 0; i < lows.size(); ++i) {
    highs[i] = -6 - 20 * std::abs(std::sin(double(i) * 0.37));
    lows[i] = highs[i] - 6 - 4 * std::abs(std::cos(double(i) * 0.23));
  }
  d.FillRectangle({300, 204, 391, 245}, 0xFF0C0E11u, 255, kBlend);
  d.PaintHorizontalGraph({300, 204, 391, 245}, response, 12, -12, 0, 0xFF60C0F0u, 0x4060C0F0u, 255, kBlend);
  d.SetLineWidth(1.5);
  d.PaintHorizontalPolyLine({300, 204, 391, 245}, response, 15, -15, 0xFFF0F060u, 255, kBlend);
  d.SetLineWidth(1);
  d.PaintHorizontalIntervalGraph({210, 250, 291, 289}, lows, highs, 0, -40, 0xC050D070u, 255, kBlend);
}
