#pragma once

#include <cstdint>
#include <span>

#include "kernel/KString.h"
#include "ui/KBitmap.h"
#include "ui/KFont.h"
#include "ui/KGeometry.h"

class KOpenGLTexture;

// The drawing operations in slot order; drawers name their guarded operations from this list.
#define KDRAWER_OPERATIONS(X)                                                                              \
  X(PaintGLTexture) X(PatBlt) X(BitBlt) X(AlphaMask) X(StretchBlt) X(StretchBltF) X(DrawBitmap)            \
  X(StretchBltNine) X(StretchBltH) X(StretchBltV) X(RotatedBlt) X(StretchBltArc) X(AlignedTextOut)         \
  X(LineTo) X(Line) X(LineToF) X(LineF) X(Rectangle) X(FillRectangle) X(FillRectangleGradient)             \
  X(RoundRectangle) X(FillRoundRectangle) X(Circle) X(FillCircle) X(FillTriangle) X(PolyLine) X(PolyLineF) \
  X(FillPolygon) X(PaintHorizontalPolyLine) X(PaintHorizontalGraph) X(PaintHorizontalIntervalGraph) X(SetPixel)

enum KDrawerOperation : int32_t {
#define KDRAWER_ENUMERATOR(name) kOperation##name,
  KDRAWER_OPERATIONS(KDRAWER_ENUMERATOR)
#undef KDRAWER_ENUMERATOR
  kOperationCount
};

// Mode word of every operation. Bit 0 set: the element replaces the pixels under it instead of
// blending over them (blits and filled rectangles; shapes always blend their anti-aliased edges).
inline constexpr uint32_t kDrawBlend = 0;
inline constexpr uint32_t kDrawCopy = 1;

enum class KGradient : uint8_t { Vertical, Horizontal };

// The one drawing interface of the editors. Coordinates are logical: the drawer's scale turns
// them into pixels of the target, so an editor laid out for scale 1 draws sharp at 1.5 or 2.
// Bitmap source rectangles and points are in the bitmap's own pixels. Every operation takes an
// opacity byte (0 transparent, 255 opaque) and a mode word last. Operations never throw: a
// failure leaves the element out and the picture goes on.
class KDrawer {
public:
  // `names`: the operation names of the drawer's guards ("Class::Operation"), in slot order.
  KDrawer(const KString* names, double scale);
  KDrawer(const KDrawer&) = delete;
  KDrawer& operator=(const KDrawer&) = delete;
  virtual ~KDrawer();

  double Scale() const noexcept { return scale_; }
  // Values that are not positive and finite are ignored.
  void SetScale(double scale) noexcept;
  // Width of lines and outlines in logical units (1 by default).
  double LineWidth() const noexcept { return lineWidth_; }
  void SetLineWidth(double width) noexcept;
  // The start of the next LineTo / LineToF.
  void MoveTo(KPointF at) noexcept { position_ = at; }
  KPointF Position() const noexcept { return position_; }

  // 1: the part `texture` holds of its bitmap, over `dest`.
  virtual void PaintGLTexture(const KRect& dest, const KOpenGLTexture& texture, uint8_t opacity, uint32_t mode) = 0;
  // 2: `source` repeated over `dest`, its top-left pixel at the destination's top-left corner.
  virtual void PatBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) = 0;
  // 3: unscaled copy from `source`; `dest` is cut so that it never reads past the bitmap's
  // right or bottom edge.
  virtual void BitBlt(const KRect& dest, const KBitmap& bitmap, KPoint source, uint8_t opacity, uint32_t mode) = 0;
  // 4: `color` painted through the alpha of the mask from `source` on.
  virtual void AlphaMask(const KRect& dest, const KBitmap& mask, KPoint source, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 5: `source` scaled onto `dest` with bilinear filtering.
  virtual void StretchBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) = 0;
  // 6: StretchBlt onto a destination with fractional edges (inclusive, like KRect), rounded to
  // whole pixels of the target.
  virtual void StretchBltF(double left, double top, double right, double bottom, const KBitmap& bitmap, const KRect& source,
                           uint8_t opacity, uint32_t mode);
  // 7: the whole bitmap with its top-left pixel at `at`, unscaled.
  virtual void DrawBitmap(KPoint at, const KBitmap& bitmap, uint8_t opacity, uint32_t mode);
  // 8: a frame image: the corners of `source` (sizes from `insets`: left, top, right, bottom
  // widths) stay unscaled, the edges stretch along one axis and the middle along both.
  virtual void StretchBltNine(const KRect& dest, const KBitmap& bitmap, const KRect& source, const KRect& insets,
                              uint8_t opacity, uint32_t mode);
  // 9, 10: stretched along one axis; the other keeps the source's size from dest's top / left.
  virtual void StretchBltH(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) = 0;
  virtual void StretchBltV(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) = 0;
  // 11: `source` centred on `centre`, turned clockwise by `angle` radians.
  virtual void RotatedBlt(KPointF centre, double angle, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                          uint32_t mode) = 0;
  // 12: `source` bent along an arc around `centre`: its x axis runs from `startAngle` to
  // `endAngle` (radians, clockwise from 12 o'clock), its y axis from `outerRadius` to `innerRadius`.
  virtual void StretchBltArc(KPointF centre, double innerRadius, double outerRadius, double startAngle, double endAngle,
                             const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) = 0;
  // 13: one line of text aligned in `rect` (kAlign... values).
  virtual void AlignedTextOut(const KRect& rect, const KString& text, const KFont& font, KColor color, uint32_t alignment,
                              uint8_t opacity, uint32_t mode) = 0;
  // 14-17: lines of the current width. Integer lines cover both end pixels (square ends);
  // floating-point lines end flat at their end points.
  virtual void LineTo(KPoint to, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void Line(KPoint from, KPoint to, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void LineToF(KPointF to, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void LineF(KPointF from, KPointF to, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 18-20: the outline lies inside the rectangle.
  virtual void Rectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void FillRectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // From `from` at the top (left) edge to `to` at the bottom (right) edge.
  virtual void FillRectangleGradient(const KRect& rect, KColor from, KColor to, KGradient direction, uint8_t opacity,
                                     uint32_t mode) = 0;
  // 21, 22: corners of radius `radius` (logical units).
  virtual void RoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void FillRoundRectangle(const KRect& rect, double radius, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 23, 24: the outline is centred on the radius.
  virtual void Circle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void FillCircle(KPointF centre, double radius, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void FillTriangle(KPointF a, KPointF b, KPointF c, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 26, 27: joined with round joins.
  virtual void PolyLine(std::span<const KPoint> points, KColor color, uint8_t opacity, uint32_t mode) = 0;
  virtual void PolyLineF(std::span<const KPointF> points, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 28: contours of `contourLengths` points each, one after another in `points` (empty: one
  // contour of all points), filled by the non-zero winding rule, so a reversed inner contour
  // makes a hole.
  virtual void FillPolygon(std::span<const KPointF> points, std::span<const int32_t> contourLengths, KColor color,
                           uint8_t opacity, uint32_t mode) = 0;
  // 29: a curve through `values` spread evenly from area's left to right edge; `top` maps to
  // the top edge, `bottom` to the bottom edge (an equalizer response, a transfer curve).
  virtual void PaintHorizontalPolyLine(const KRect& area, std::span<const double> values, double top, double bottom,
                                       KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 30: the same curve, the area between it and the `base` value filled with `fill`.
  virtual void PaintHorizontalGraph(const KRect& area, std::span<const double> values, double top, double bottom,
                                    double base, KColor line, KColor fill, uint8_t opacity, uint32_t mode) = 0;
  // 31: the band between `lows` and `highs` filled (a level meter's range, a spectrum's spread);
  // the shorter list sets the count.
  virtual void PaintHorizontalIntervalGraph(const KRect& area, std::span<const double> lows, std::span<const double> highs,
                                            double top, double bottom, KColor color, uint8_t opacity, uint32_t mode) = 0;
  // 32: one logical pixel (a square of scale × scale pixels).
  virtual void SetPixel(KPoint at, KColor color, uint8_t opacity, uint32_t mode) = 0;

protected:
  const KString& Name(KDrawerOperation operation) const noexcept { return names_[operation]; }

  // The pixels of a logical rectangle: edges rounded to the pixel grid so that neighbours
  // meet without a gap or an overlap. 64-bit so that far coordinates do not overflow.
  struct PixelBox {
    int64_t left, top, right, bottom;  // right and bottom exclusive
    bool IsEmpty() const noexcept { return right <= left || bottom <= top; }
  };
  PixelBox ToPixels(const KRect& rect) const noexcept;
  // A logical point in continuous pixel coordinates of the target (pixel i spans [i, i+1]).
  KPointF ToPixels(KPointF point) const noexcept { return {(point.x + 0.5) * scale_, (point.y + 0.5) * scale_}; }
  KPointF ToPixels(KPoint point) const noexcept { return ToPixels(KPointF{double(point.x), double(point.y)}); }

  // The cut destination and source rectangle of a BitBlt; false when nothing remains.
  static bool ClipBitBlt(KRect& dest, const KBitmap& bitmap, KPoint source, KRect& sourceRect) noexcept;
  // Whether `source` is a non-empty rectangle inside the bitmap.
  static bool IsInside(const KRect& source, const KBitmap& bitmap) noexcept;

  KPointF position_{};

private:
  const KString* names_;
  double scale_ = 1;
  double lineWidth_ = 1;
};
