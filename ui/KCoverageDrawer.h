#pragma once

#include "ui/KCoverage.h"
#include "ui/KDrawer.h"

// The shapes, text and graphs of a drawer (and the operations made of others), made into coverage masks that the drawer paints in
// one colour. Both drawers share this, so their shapes agree to the blending of a byte.
class KCoverageDrawer : public KDrawer {
public:
  void StretchBltH(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) override;
  void StretchBltV(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) override;
  void AlignedTextOut(const KRect& rect, const KString& text, const KFont& font, KColor color, uint32_t alignment,
                      uint8_t opacity, uint32_t mode) override;
  void LineTo(KPoint to, KColor color, uint8_t opacity, uint32_t mode) override;
  void Line(KPoint from, KPoint to, KColor color, uint8_t opacity, uint32_t mode) override;
  void LineToF(KPointF to, KColor color, uint8_t opacity, uint32_t mode) override;
  void LineF(KPointF from, KPointF to, KColor color, uint8_t opacity, uint32_t mode) override;
  void Rectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) override;
  void RoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) override;
  void FillRoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) override;
  void Circle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) override;
  void FillCircle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) override;
  void FillTriangle(KPointF a, KPointF b, KPointF c, KColor color, uint8_t opacity, uint32_t mode) override;
  void PolyLine(std::span<const KPoint> points, KColor color, uint8_t opacity, uint32_t mode) override;
  void PolyLineF(std::span<const KPointF> points, KColor color, uint8_t opacity, uint32_t mode) override;
  void FillPolygon(std::span<const KPointF> points, std::span<const int32_t> contourLengths, KColor color, uint8_t opacity,
                   uint32_t mode) override;
  void PaintHorizontalPolyLine(const KRect& area, std::span<const double> values, double top, double bottom, KColor color,
                               uint8_t opacity, uint32_t mode) override;
  void PaintHorizontalGraph(const KRect& area, std::span<const double> values, double top, double bottom, double base,
                            KColor line, KColor fill, uint8_t opacity, uint32_t mode) override;
  void PaintHorizontalIntervalGraph(const KRect& area, std::span<const double> lows, std::span<const double> highs,
                                    double top, double bottom, KColor color, uint8_t opacity, uint32_t mode) override;
  void SetPixel(KPoint at, KColor color, uint8_t opacity, uint32_t mode) override;

protected:
  // `names`: the guarded operation names of the drawer, in slot order (kOperationCount texts).
  KCoverageDrawer(const KString* names, double scale) : KDrawer(names, scale) {}

  // The target's size in pixels.
  virtual int32_t TargetWidth() const noexcept = 0;
  virtual int32_t TargetHeight() const noexcept = 0;
  // Paints `color` through the mask; the mask lies inside the target.
  virtual void PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // Paints the glyphs of a line of text in one colour; by default as one mask.
  virtual void PaintGlyphs(const std::vector<KGlyphInk>& glyphs, KColor color, uint8_t opacity, uint32_t mode);

private:
  void Fill(const KPath& path, KColor color, uint8_t opacity, uint32_t mode);
  // A line of the current width through logical points; `square` extends the ends by half of it.
  void Stroke(std::span<const KPointF> points, bool square, KColor color, uint8_t opacity, uint32_t mode);
  // The pixel points of a curve over `area` (see PaintHorizontalPolyLine).
  std::vector<KPointF> CurvePoints(const KRect& area, std::span<const double> values, double top, double bottom) const;
};
