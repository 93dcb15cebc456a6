// Text through FreeType with the fonts shipped beside the kernel: readable, placed where the
// alignment says, in the sizes and styles help texts use.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "ui/KDrawerToKBitmap.h"

namespace {
// The box of all pixels that differ from black.
KRect Ink(const KBitmap& picture) {
  KRect r{INT32_MAX, INT32_MAX, INT32_MIN, INT32_MIN};
  for (int32_t y = 0; y < picture.Height(); ++y)
    for (int32_t x = 0; x < picture.Width(); ++x)
      if (picture.Pixel(x, y) != 0xFF000000u) r = {std::min(r.left, x), std::min(r.top, y), std::max(r.right, x), std::max(r.bottom, y)};
  return r;
}

KBitmap Text(const KRect& rect, const char16_t* text, const KFont& font, uint32_t alignment, double scale = 1) {
  KBitmap picture(int32_t(200 * scale), int32_t(60 * scale));
  picture.Fill(0xFF000000u);
  KDrawerToKBitmap drawer(picture, scale);
  drawer.AlignedTextOut(rect, KString::FromUtf16(text, int32_t(std::char_traits<char16_t>::length(text))), font, 0xFFFFFFFFu,
                        alignment, 255, kDrawBlend);
  return picture;
}
}  // namespace

TEST(Text, TheFontFilesLieBesideTheKernel) {
  const std::string folder = KFont::FontFolder();
  ASSERT_FALSE(folder.empty());
  EXPECT_EQ(folder.back(), static_cast<char>(std::filesystem::path::preferred_separator));
  EXPECT_TRUE(std::ifstream(folder + "DejaVuSans.ttf").good()) << folder;
}

TEST(Text, SizesAndStylesOfHelpTexts) {
  const KString sample("Attack time");
  EXPECT_GT(KFont::Large(1).TextWidth(sample), KFont::Large(2).TextWidth(sample));
  EXPECT_GT(KFont::Large(2).TextWidth(sample), KFont::Large(3).TextWidth(sample));
  EXPECT_GT(KFont::Large(3).TextWidth(sample), KFont::Large(4).TextWidth(sample));
  EXPECT_GT(KFont::Large(4).TextWidth(sample), KFont::Normal().TextWidth(sample));
  EXPECT_GT(KFont::Normal().TextWidth(sample), KFont::Small().TextWidth(sample));
  EXPECT_GT(KFont::Bold().TextWidth(sample), KFont::Normal().TextWidth(sample));
  EXPECT_EQ(KFont::Normal().TextWidth(KString()), 0);
  // Metrics of a 13-unit face: ascent about 12, descent about 3, and the same in logical
  // units at scale 2 within hinting.
  const KFont font = KFont::Normal();
  EXPECT_NEAR(font.Ascent(), 12, 1.5);
  EXPECT_NEAR(font.Descent(), 3, 1.5);
  EXPECT_NEAR(font.LineHeight(), font.Ascent() + font.Descent(), 2);
  EXPECT_NEAR(font.TextWidth(sample, 2), font.TextWidth(sample), 2);
}

TEST(Text, InkLiesInTheAlignedBox) {
  const KFont font = KFont::Normal();
  const KString text("Hxg");
  const double width = font.TextWidth(text), ascent = font.Ascent(), descent = font.Descent();
  const KRect rect{10, 5, 189, 54};
  // Left and top: ink from the left edge, between the top and the line's bottom.
  const KRect left = Ink(Text(rect, u"Hxg", font, kAlignLeft | kAlignTop));
  EXPECT_GE(left.left, 10);
  EXPECT_LE(left.left, 12);
  EXPECT_LE(left.right, 10 + width);
  EXPECT_GE(left.top, 5);
  EXPECT_NEAR(5 + ascent - left.top, 0.73 * font.Size(), 1.5);  // "H" reaches the capital height
  EXPECT_LE(left.bottom, 5 + ascent + descent);
  EXPECT_GT(left.bottom, 5 + ascent);  // "g" descends below the base line
  // Right and bottom.
  const KRect right = Ink(Text(rect, u"Hxg", font, kAlignRight | kAlignBottom));
  EXPECT_LE(right.right, 189);
  EXPECT_GE(right.right, 189 - 3);
  EXPECT_LE(right.bottom, 54);
  EXPECT_GE(right.bottom, 54 - 3);
  // Centred both ways: the ink's middle lies near the rectangle's.
  const KRect centre = Ink(Text(rect, u"Hxg", font, kAlignCentre | kAlignMiddle));
  EXPECT_NEAR((centre.left + centre.right) / 2.0, 99.5, 2);
  EXPECT_NEAR((centre.top + centre.bottom) / 2.0, 29.5, 3);
}

TEST(Text, GlyphsAreReadable) {
  // "H" has two full-height stems: along its middle row ink, gap, ink; the stems are solid.
  const KBitmap picture = Text({10, 5, 189, 54}, u"H", KFont::Large(1), kAlignLeft | kAlignTop);
  const KRect ink = Ink(picture);
  ASSERT_GT(ink.bottom - ink.top, 15);
  const int32_t middle = (ink.top + ink.bottom) / 2, upper = ink.top + (ink.bottom - ink.top) / 4;
  int32_t runs = 0;
  bool inside = false;
  for (int32_t x = ink.left; x <= ink.right; ++x) {
    const bool on = KGreenOf(picture.Pixel(x, upper)) > 128;
    runs += on && !inside;
    inside = on;
  }
  EXPECT_EQ(runs, 2);
  EXPECT_EQ(KGreenOf(picture.Pixel(ink.left + 1, middle)), 255u);
  // The crossbar joins the stems at the middle.
  EXPECT_GT(KGreenOf(picture.Pixel((ink.left + ink.right) / 2, middle)) + KGreenOf(picture.Pixel((ink.left + ink.right) / 2, middle + 1)), 200u);
  // Italic leans right: the top of "l" lies right of its bottom.
  const KBitmap italic = Text({10, 5, 189, 54}, u"l", KFont(30, KFontStyle::Italic), kAlignLeft | kAlignTop);
  const KRect lean = Ink(italic);
  int32_t topX = 0, bottomX = 0;
  for (int32_t x = lean.left; x <= lean.right; ++x) {
    if (KGreenOf(italic.Pixel(x, lean.top + 1)) > 128 && !topX) topX = x;
    if (KGreenOf(italic.Pixel(x, lean.bottom - 1)) > 128 && !bottomX) bottomX = x;
  }
  EXPECT_GT(topX, bottomX + 3);
}

TEST(Text, ScaleTwoDrawsTheSameTextTwiceAsLarge) {
  const KRect rect{10, 5, 189, 54};
  const KRect one = Ink(Text(rect, u"Gain 3 dB", KFont::Normal(), kAlignLeft | kAlignTop));
  const KRect two = Ink(Text(rect, u"Gain 3 dB", KFont::Normal(), kAlignLeft | kAlignTop, 2));
  EXPECT_NEAR(two.right - two.left, 2 * (one.right - one.left), 4);
  EXPECT_NEAR(two.bottom - two.top, 2 * (one.bottom - one.top), 3);
  EXPECT_NEAR(two.left, 2 * one.left, 2);
}

TEST(Text, OverlappingInksAddUpBeforeTheyAreBlended) {
  // Bold italic "ff" at this size: the inks of the two glyphs share pixels.
  const KFont font(15, KFontStyle::BoldItalic);
  const double box[4] = {0, 0, 60, 30};
  const std::vector<KGlyphInk> glyphs = font.Place(KString("ff"), 1, box, kAlignLeft);
  ASSERT_EQ(glyphs.size(), 2u);
  const auto inkAt = [](const KGlyphInk& g, int32_t x, int32_t y) -> uint32_t {
    return x >= g.x && x < g.x + g.width && y >= g.y && y < g.y + g.height ? g.ink[(y - g.y) * g.width + (x - g.x)] : 0;
  };
  // Painted in white at half opacity over black, a pixel shows half of the two inks' sum; blended
  // one glyph after the other it would show 1 - (1 - a)(1 - b) of it instead.
  KBitmap picture(60, 30);
  picture.Fill(0xFF000000u);
  KDrawerToKBitmap drawer(picture);
  drawer.AlignedTextOut({0, 0, 59, 29}, KString("ff"), font, 0xFFFFFFFFu, kAlignLeft, 128, kDrawBlend);
  int32_t shared = 0;
  for (int32_t y = 0; y < 30; ++y)
    for (int32_t x = 0; x < 60; ++x) {
      const uint32_t a = inkAt(glyphs[0], x, y), b = inkAt(glyphs[1], x, y);
      shared += a > 0 && b > 0;
      ASSERT_EQ(KGreenOf(picture.Pixel(x, y)), KMulByte(128, std::min(255u, a + b))) << x << "," << y;
    }
  EXPECT_GT(shared, 0);
}
