#pragma once

#include "ui/KCoverageDrawer.h"

struct KTexturedMesh;

// The software drawer: paints into a KBitmap. Blending is "source over" with colours that are
// not premultiplied, the same arithmetic as the OpenGL drawer's blend function. The owner of
// the target calls MarkChanged on it before using it as a source of another drawer's blits.
class KDrawerToKBitmap final : public KCoverageDrawer {
public:
  explicit KDrawerToKBitmap(KBitmap& target, double scale = 1);

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
  int32_t TargetWidth() const noexcept override { return target_.Width(); }
  int32_t TargetHeight() const noexcept override { return target_.Height(); }
  void PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t mode) override;
  // Each glyph straight onto the target, without a mask of the whole line.
  void PaintGlyphs(const std::vector<KGlyphInk>& glyphs, KColor color, uint8_t opacity, uint32_t mode) override;

private:
  struct Source;
  // `source` of the bitmap scaled onto the pixels of `dest`.
  void Stretch(const PixelBox& dest, const Source& source, uint8_t opacity, uint32_t mode);
  void PaintMesh(const KTexturedMesh& mesh, const KBitmap& bitmap, uint8_t opacity, uint32_t mode);

  KBitmap& target_;
};
