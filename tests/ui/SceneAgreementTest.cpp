// The same editor picture painted by both drawers: they must agree pixel by pixel within a
// small tolerance, at scale 1 and 2. Pictures and their difference land in the build folder.
#include <gtest/gtest.h>

#include "tests/ui/DrawerTestSupport.h"
#include "tests/ui/TestScene.h"
#include "ui/KDrawerToKBitmap.h"

namespace {
// Both drawers share shapes, text masks, mesh positions and sample positions, so they differ
// only where arithmetic rounds differently: the software drawer rounds the effective alpha to a
// byte before it blends and filters with 8-bit weights, while the GL blender and sampler work
// in floating point. Each moves a channel by at most one step; a filtered, half-transparent
// blit collects both.
constexpr uint32_t kTolerance = 2;

void PaintBoth(double scale, const char* name) {
  const int32_t width = int32_t(400 * scale), height = int32_t(300 * scale);
  const KTestSceneImages images;
  KBitmap software(width, height);
  KDrawerToKBitmap soft(software, scale);
  KPaintTestScene(soft, images, KOpenGLTexture(0, &images.picture, images.picture.Bounds()));

  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, width, height, scale);
  KRect whole = images.picture.Bounds();
  const KOpenGLTexture* texture = KOpenGLTexture::Get(images.picture, whole, *gl.drawer, false);
  ASSERT_NE(texture, nullptr);
  KPaintTestScene(*gl.drawer, images, *texture);
  const KBitmap hardware = gl.drawer->GetScreenShot();
  gl.drawer->EndPaint();
  ASSERT_EQ(hardware.Width(), width);

  const KPictureDifference d = KCompare(software, hardware, kTolerance);
  software.Store(KPicturePath(std::string(name) + "_software.png"));
  hardware.Store(KPicturePath(std::string(name) + "_opengl.png"));
  d.picture.Store(KPicturePath(std::string(name) + "_difference.png"));
  std::printf("%s: largest channel difference %u, %lld of %d pixels beyond %u\n", name, d.largest,
              static_cast<long long>(d.beyond), width * height, kTolerance);
  EXPECT_EQ(d.beyond, 0) << "largest difference " << d.largest;
  // The picture is not blank: the scene painted something on both.
  EXPECT_NE(software.Pixel(width / 2, height / 2), software.Pixel(2, 2));
}
}  // namespace

TEST(SceneAgreement, BothDrawersPaintTheSamePictureAtScaleOne) { PaintBoth(1, "scene_scale1"); }
TEST(SceneAgreement, BothDrawersPaintTheSamePictureAtScaleTwo) { PaintBoth(2, "scene_scale2"); }
TEST(SceneAgreement, BothDrawersPaintTheSamePictureAtScaleOneAndAHalf) { PaintBoth(1.5, "scene_scale1_5"); }
