// Textures of the OpenGL drawer, counted through the drawer, the BitBlt clipping rule on both
// drawers, the context set-up and the guards.
#include <gtest/gtest.h>

#include "tests/core/TraceCapture.h"
#include "tests/ui/DrawerTestSupport.h"
#include "ui/KDrawerToKBitmap.h"

namespace {
KBitmap Numbered(int32_t width, int32_t height) {
  KBitmap b(width, height);
  for (int32_t y = 0; y < height; ++y)
    for (int32_t x = 0; x < width; ++x) b.Row(y)[x] = KMakeColor(255, uint32_t(x * 7), uint32_t(y * 5), 99);
  return b;
}

// Where the picture differs from the untouched background.
KRect Painted(const KBitmap& picture, KColor background) {
  KRect r{INT32_MAX, INT32_MAX, INT32_MIN, INT32_MIN};
  for (int32_t y = 0; y < picture.Height(); ++y)
    for (int32_t x = 0; x < picture.Width(); ++x)
      if (picture.Pixel(x, y) != background)
        r = {std::min(r.left, x), std::min(r.top, y), std::max(r.right, x), std::max(r.bottom, y)};
  return r;
}
}  // namespace

TEST(OpenGLTexture, BitBltWiderThanTheRestOfTheBitmapStopsAtItsEdgeOnBothDrawers) {
  const KBitmap source = Numbered(20, 10);
  // From source point (15, 4) only 5 columns and 6 rows remain.
  KBitmap software(64, 64);
  software.Fill(0xFF000000u);
  KDrawerToKBitmap soft(software);
  soft.BitBlt({10, 20, 49, 59}, source, {15, 4}, 255, kDrawBlend);
  EXPECT_EQ(Painted(software, 0xFF000000u), (KRect{10, 20, 14, 25}));
  EXPECT_EQ(software.Pixel(10, 20), source.Pixel(15, 4));
  EXPECT_EQ(software.Pixel(14, 25), source.Pixel(19, 9));

  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 64, 64);
  gl.drawer->FillRectangle({0, 0, 63, 63}, 0xFF000000u, 255, kDrawCopy);
  gl.drawer->BitBlt({10, 20, 49, 59}, source, {15, 4}, 255, kDrawBlend);
  const KBitmap hardware = gl.drawer->GetScreenShot();
  EXPECT_EQ(Painted(hardware, 0xFF000000u), (KRect{10, 20, 14, 25}));
  EXPECT_EQ(hardware.Pixel(10, 20), source.Pixel(15, 4));
  EXPECT_EQ(hardware.Pixel(14, 25), source.Pixel(19, 9));
}

TEST(OpenGLTexture, TheWholeBitmapHasOneTextureWhateverTheForceFlag) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 32, 32);
  const KBitmap bitmap = Numbered(16, 8);
  KRect whole = bitmap.Bounds();
  const KOpenGLTexture* plain = KOpenGLTexture::Get(bitmap, whole, *gl.drawer, false);
  KRect again = bitmap.Bounds();
  const KOpenGLTexture* forced = KOpenGLTexture::Get(bitmap, again, *gl.drawer, true);
  ASSERT_NE(plain, nullptr);
  EXPECT_EQ(plain, forced);
  EXPECT_EQ(gl.drawer->TextureCount(), 1);
  EXPECT_EQ(plain->Source(), bitmap.Bounds());
  // Blits of the whole bitmap and of parts of it share that texture while it fits.
  gl.drawer->BitBlt({0, 0, 15, 7}, bitmap, {0, 0}, 255, kDrawBlend);
  gl.drawer->StretchBlt({0, 0, 31, 31}, bitmap, {2, 2, 9, 5}, 255, kDrawBlend);
  gl.drawer->PatBlt({0, 0, 31, 31}, bitmap, bitmap.Bounds(), 255, kDrawBlend);
  EXPECT_EQ(gl.drawer->TextureCount(), 1);
}

TEST(OpenGLTexture, PatBltMakesOneTexturePerSourceRectangle) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 64, 64);
  const KBitmap bitmap = Numbered(32, 32);
  gl.drawer->PatBlt({0, 0, 63, 31}, bitmap, {4, 4, 11, 11}, 255, kDrawBlend);
  EXPECT_EQ(gl.drawer->TextureCount(), 1);
  gl.drawer->PatBlt({0, 32, 63, 63}, bitmap, {4, 4, 11, 11}, 255, kDrawBlend);
  EXPECT_EQ(gl.drawer->TextureCount(), 1);
  gl.drawer->PatBlt({0, 0, 63, 63}, bitmap, {0, 0, 3, 3}, 255, kDrawBlend);
  EXPECT_EQ(gl.drawer->TextureCount(), 2);
  // The pattern starts at the source rectangle's corner wherever the destination lies.
  gl.drawer->PatBlt({5, 40, 30, 60}, bitmap, {4, 4, 11, 11}, 255, kDrawCopy);
  const KBitmap picture = gl.drawer->GetScreenShot();
  EXPECT_EQ(picture.Pixel(5, 40), bitmap.Pixel(4, 4));
  EXPECT_EQ(picture.Pixel(5 + 9, 40 + 10), bitmap.Pixel(4 + 1, 4 + 2));
  // The software drawer paints the same pattern.
  KBitmap software(64, 64);
  KDrawerToKBitmap soft(software);
  soft.PatBlt({5, 40, 30, 60}, bitmap, {4, 4, 11, 11}, 255, kDrawCopy);
  EXPECT_EQ(software.Pixel(5 + 9, 40 + 10), picture.Pixel(5 + 9, 40 + 10));
}

TEST(OpenGLTexture, BitmapsLargerThanTheLargestTextureAreCutIntoRectangleTextures) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 64, 64);
  const int32_t largest = KOpenGLTexture::MaximumSize();
  KOpenGLTexture::SetMaximumSize(16);
  const KBitmap wide = Numbered(40, 8);
  KRect part{20, 0, 35, 7};
  const KOpenGLTexture* texture = KOpenGLTexture::Get(wide, part, *gl.drawer, false);
  ASSERT_NE(texture, nullptr);
  // Its own texture; the caller's rectangle now addresses that texture.
  EXPECT_EQ(texture->Source(), (KRect{20, 0, 35, 7}));
  EXPECT_EQ(part, (KRect{0, 0, 15, 7}));
  KRect same{20, 0, 35, 7};
  EXPECT_EQ(KOpenGLTexture::Get(wide, same, *gl.drawer, false), texture);
  // Sorted by rectangle: one found by bisection among others made before and after it.
  for (int32_t left : {0, 4, 24, 2}) {
    KRect other{left, 0, left + 15, 7};
    KOpenGLTexture::Get(wide, other, *gl.drawer, false);
  }
  KRect lookup{20, 0, 35, 7};
  EXPECT_EQ(KOpenGLTexture::Get(wide, lookup, *gl.drawer, false), texture);
  EXPECT_EQ(gl.drawer->TextureCount(), 5);
  // A rectangle beyond the largest texture cannot be made: reported, painting goes on.
  KTraceCapture trace;
  KRect tooWide{0, 0, 38, 7};
  EXPECT_EQ(KOpenGLTexture::Get(wide, tooWide, *gl.drawer, true), nullptr);
  ASSERT_EQ(trace.Lines().size(), 1u);
  EXPECT_EQ(trace.Lines()[0], "SYSTEM EXCEPTION! KOpenGLTexture::Get");
  KOpenGLTexture::SetMaximumSize(largest);
}

TEST(OpenGLTexture, TheAlphaMaskIsOneTexturePerBitmap) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 32, 32);
  KBitmap mask(8, 8);
  for (int32_t x = 0; x < 8; ++x) mask.Row(3)[x] = 0x80000000u;
  gl.drawer->FillRectangle({0, 0, 31, 31}, 0xFF000000u, 255, kDrawCopy);
  gl.drawer->AlphaMask({0, 0, 7, 7}, mask, {0, 0}, 0xFFFF0000u, 255, kDrawBlend);
  gl.drawer->AlphaMask({8, 8, 15, 15}, mask, {0, 0}, 0xFF00FF00u, 255, kDrawBlend);
  EXPECT_EQ(gl.drawer->TextureCount(), 1);
  const KBitmap picture = gl.drawer->GetScreenShot();
  EXPECT_NEAR(double(KRedOf(picture.Pixel(4, 3))), 128, 1);
  EXPECT_EQ(picture.Pixel(4, 4), 0xFF000000u);
  EXPECT_NEAR(double(KGreenOf(picture.Pixel(12, 11))), 128, 1);
  // Too large for any texture: reported under its own name.
  KOpenGLTexture::SetMaximumSize(4);
  KTraceCapture trace;
  const KBitmap other(8, 8);
  gl.drawer->AlphaMask({0, 0, 7, 7}, other, {0, 0}, 0xFFFF0000u, 255, kDrawBlend);
  KOpenGLTexture::SetMaximumSize(16384);
  ASSERT_EQ(trace.Lines().size(), 1u);
  EXPECT_EQ(trace.Lines()[0], "SYSTEM EXCEPTION! KOpenGLTexture::Get (create texture alphamask)");
}

TEST(OpenGLDrawer, ContextSetUpReadsTheLargestTextureAndPaintsOffScreen) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 16, 16);
  const int32_t largest = KOpenGLTexture::MaximumSize();
  EXPECT_GE(largest, 2048);
  EXPECT_EQ(KDrawerOpenGL::IsCapable(), largest >= 2049);
  EXPECT_EQ(gl.drawer->HasFramebuffer(), largest >= 4097);
  // Option value 2 keeps a newly attached drawer in the window's framebuffer; it still paints.
  gl.drawer->EndPaint();
  KDrawerOpenGL::SetFramebufferOption(2);
  KDrawerOpenGL plain(*gl.context);
  plain.Attach();
  KDrawerOpenGL::SetFramebufferOption(0);
  EXPECT_FALSE(plain.HasFramebuffer());
  plain.BeginPaint();
  plain.FillRectangle({2, 2, 5, 5}, 0xFF336699u, 255, kDrawCopy);
  const KBitmap picture = plain.GetScreenShot();
  plain.EndPaint();
  EXPECT_EQ(picture.Pixel(3, 3), 0xFF336699u);
}

TEST(OpenGLDrawer, EveryOperationIsGuardedUnderItsName) {
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, 16, 16);
  gl.drawer->EndPaint();
  // Outside BeginPaint / EndPaint an operation fails, is reported and returns normally.
  KTraceCapture trace;
  const KBitmap bitmap(4, 4);
  gl.drawer->BitBlt({0, 0, 3, 3}, bitmap, {0, 0}, 255, kDrawBlend);
  gl.drawer->FillCircle({8, 8}, 4, 0xFFFFFFFFu, 255, kDrawBlend);
  gl.drawer->PatBlt({0, 0, 3, 3}, bitmap, {0, 0, 1, 1}, 255, kDrawBlend);
  ASSERT_EQ(trace.Lines().size(), 3u);
  EXPECT_EQ(trace.Lines()[0], "SYSTEM EXCEPTION! KDrawerOpenGL::BitBlt");
  EXPECT_EQ(trace.Lines()[1], "SYSTEM EXCEPTION! KDrawerOpenGL::FillCircle");
  EXPECT_EQ(trace.Lines()[2], "SYSTEM EXCEPTION! KDrawerOpenGL::PatBlt");
}
