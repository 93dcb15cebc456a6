#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "ui/KGeometry.h"

// How much of each pixel of a box a shape covers, 0 to 255. Both drawers paint shapes and text
// from these masks, so their anti-aliased edges are the same on either drawer.
struct KCoverage {
  int32_t x = 0, y = 0, width = 0, height = 0;
  std::vector<uint8_t> values;  // width × height, rows top to bottom
  // Per row the columns [begin, end) outside which every value is 0 (relative to x), two
  // numbers a row; empty when every row may be covered anywhere.
  std::vector<int32_t> spans;

  // Calls paint(row, begin, end) for each row's covered columns (all relative to x and y).
  template <class Paint>
  void ForEachSpan(Paint&& paint) const {
    for (int32_t row = 0; row < height; ++row) {
      const int32_t begin = spans.empty() ? 0 : spans[size_t(2 * row)], end = spans.empty() ? width : spans[size_t(2 * row + 1)];
      if (begin < end) paint(row, begin, end);
    }
  }

  bool IsEmpty() const noexcept { return width <= 0 || height <= 0; }
  uint8_t At(int32_t px, int32_t py) const noexcept { return values[size_t(py - y) * width + (px - x)]; }
};

// Closed contours in continuous pixel coordinates (pixel i spans [i, i+1]).
class KPath {
public:
  void Clear() { points_.clear(), ends_.clear(); }
  void Add(KPointF p) { points_.push_back(p); }
  // Closes the contour begun after the previous one; fewer than three points are dropped.
  void Close();
  void AddContour(std::span<const KPointF> points);
  // Contours with the same turning sense as AddRectangle add up; the opposite sense cuts holes.
  void AddRectangle(double left, double top, double right, double bottom, bool hole = false);
  void AddEllipse(double cx, double cy, double rx, double ry, bool hole = false);
  // The pie slice of a circle from angle `from` to `to` the short way round.
  void AddWedge(KPointF centre, double radius, double from, double to);
  void AddRoundRectangle(double left, double top, double right, double bottom, double radius, bool hole = false);
  // The outline of a line of `width` through `points`, round joins; `extend` lengthens both
  // ends by that much (half the width gives square ends).
  void AddStroke(std::span<const KPointF> points, double width, double extend);

  bool IsFinite() const noexcept;
  std::span<const KPointF> Points() const noexcept { return points_; }
  std::span<const int32_t> Ends() const noexcept { return ends_; }

private:
  void Reverse(size_t from);
  std::vector<KPointF> points_;
  std::vector<int32_t> ends_;  // one past the last point of each contour
};

// Exact-area coverage of a path by the non-zero rule, inside the target box [0, width) ×
// [0, height). Paths with a coordinate that is not finite cover nothing.
KCoverage KRasterize(const KPath& path, int32_t width, int32_t height);
