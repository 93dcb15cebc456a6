#pragma once

#include <memory>
#include <unordered_map>
#include <vector>

#include "ui/KCoverageDrawer.h"
#include "ui/KOpenGLTexture.h"

class KOpenGLContext;
struct KTexturedMesh;

// The OpenGL drawer: bitmaps become textures (KOpenGLTexture) painted as textured quads in the
// colour white with the opacity as alpha; shapes and text are coverage masks painted in their
// colour. Operations paint only between BeginPaint and EndPaint.
class KDrawerOpenGL final : public KCoverageDrawer {
public:
  KDrawerOpenGL(KOpenGLContext& context, double scale = 1);
  ~KDrawerOpenGL() override;

  // Sets the context up for this drawer (each time it is attached to a window): reads the
  // largest texture size, and makes an off-screen framebuffer where the card allows.
  void Attach();
  void BeginPaint();
  void EndPaint();
  // Between BeginPaint and EndPaint: copies the off-screen picture into the context's default
  // framebuffer (a window's back buffer). Without an off-screen framebuffer the picture is
  // already there.
  void CopyToDefaultFramebuffer();
  // The picture painted so far, top row first.
  KBitmap GetScreenShot();

  bool HasFramebuffer() const noexcept { return framebuffer_ != 0; }
  // Textures made for bitmaps so far (whole, rectangle and alpha-mask textures).
  int32_t TextureCount() const noexcept { return textureCount_; }

  // Cleared when a context's largest texture is below 2049 pixels (too small for large editors).
  static bool IsCapable() noexcept;
  // 2 keeps the drawer from painting off-screen; any other value lets it.
  static void SetFramebufferOption(int32_t value) noexcept;

  void PaintGLTexture(const KRect& dest, const KOpenGLTexture& texture, uint8_t opacity, uint32_t mode) override;
  void PatBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) override;
  void BitBlt(const KRect& dest, const KBitmap& bitmap, KPoint source, uint8_t opacity, uint32_t mode) override;
  void AlphaMask(const KRect& dest, const KBitmap& mask, KPoint source, KColor color, uint8_t opacity, uint32_t mode) override;
  void StretchBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) override;
  void RotatedBlt(KPointF centre, double angle, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                  uint32_t mode) override;
  void StretchBltArc(KPointF centre, double innerRadius, double outerRadius, double startAngle, double endAngle,
                     const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) override;
  void FillRectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) override;
  void FillRectangleGradient(const KRect& rect, KColor from, KColor to, KGradient direction, uint8_t opacity,
                             uint32_t mode) override;

protected:
  int32_t TargetWidth() const noexcept override;
  int32_t TargetHeight() const noexcept override;
  void PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t mode) override;

private:
  friend class KOpenGLTexture;
  // The textures of one bitmap: the whole one, the rectangles sorted by rectangle, the mask.
  struct TextureSet {
    std::unique_ptr<KOpenGLTexture> whole;
    std::vector<std::unique_ptr<KOpenGLTexture>> parts;
    std::unique_ptr<KOpenGLTexture> alphaMask;
  };
  TextureSet& TexturesOf(const KBitmap& bitmap) { return textures_[bitmap.Identity()]; }
  // A new texture name holding `pixels` (width × height, 0xAARRGGBB), or as alpha only.
  uint32_t Upload(const uint32_t* pixels, int32_t width, int32_t height, bool alphaOnly);

  void CheckPainting() const;
  // `source` of the texture (in its texels) over the pixel box.
  void PaintTexture(const KOpenGLTexture& texture, const PixelBox& box, const KRect& source, uint8_t opacity, uint32_t mode);
  void PaintMesh(const KTexturedMesh& mesh, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode);
  void SetBlending(uint32_t mode);

  KOpenGLContext& context_;
  std::unordered_map<uint64_t, TextureSet> textures_;
  int32_t textureCount_ = 0;
  uint32_t framebuffer_ = 0;
  uint32_t framebufferTexture_ = 0;
  bool painting_ = false;
};
