#include "ui/KCoverage.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace {
// Largest distance between a curve and the polygon that stands for it, in pixels.
constexpr double kFlatness = 0.03;

int32_t ArcSegments(double radius, double angle) {
  if (!(radius > kFlatness)) return 1;
  const double step = 2 * std::acos(1 - kFlatness / radius);
  return std::clamp(int32_t(std::ceil(std::abs(angle) / step)), 1, 4096);
}

// Signed area accumulation: every edge adds, per pixel row, the area it leaves to its right,
// so that a running sum along the row yields the covered fraction of each pixel. The cells are
// a buffer of the thread that is all zero between shapes: Finish clears what edges touched.
class Accumulator {
public:
  Accumulator(int32_t width, int32_t height)
      : width_(width), height_(height), stride_(size_t(width) + 2), cells_(Cells(stride_ * size_t(height))),
        touched_(size_t(2 * height)) {
    for (int32_t row = 0; row < height; ++row) touched_[size_t(2 * row)] = width + 2, touched_[size_t(2 * row + 1)] = 0;
  }

  // An edge clipped to the box: rows above and below contribute nothing, and parts left or right
  // of it are pushed onto its side, where they still change the winding of what lies right.
  void Edge(KPointF a, KPointF b) {
    if (a.y == b.y) return;
    const double top = std::max(std::min(a.y, b.y), 0.0), bottom = std::min(std::max(a.y, b.y), double(height_));
    if (top >= bottom) return;
    const auto xAt = [&](double y) { return a.x + (b.x - a.x) * (y - a.y) / (b.y - a.y); };
    KPointF p{xAt(top), top}, q{xAt(bottom), bottom};
    if (a.y > b.y) std::swap(p, q);
    // Split at the box's side lines so that each piece lies on one side or inside.
    double cuts[2];
    int count = 0;
    for (double side : {0.0, double(width_)})
      if ((p.x - side) * (q.x - side) < 0) cuts[count++] = (side - p.x) / (q.x - p.x);
    if (count == 2 && cuts[0] > cuts[1]) std::swap(cuts[0], cuts[1]);
    KPointF from = p;
    for (int i = 0; i <= count; ++i) {
      const double t = i < count ? cuts[i] : 1.0;
      const KPointF to = i < count ? KPointF{p.x + (q.x - p.x) * t, p.y + (q.y - p.y) * t} : q;
      Inside({std::clamp(from.x, 0.0, double(width_)), from.y}, {std::clamp(to.x, 0.0, double(width_)), to.y});
      from = to;
    }
  }

  KCoverage Finish(int32_t x, int32_t y) {
    KCoverage mask{x, y, width_, height_, std::vector<uint8_t>(size_t(width_) * height_), std::vector<int32_t>(size_t(2 * height_))};
    for (int32_t row = 0; row < height_; ++row) {
      float* cell = &cells_[size_t(row) * stride_];
      uint8_t* out = &mask.values[size_t(row) * width_];
      const int32_t first = touched_[size_t(2 * row)], last = touched_[size_t(2 * row + 1)];
      // Right of the last touched cell the sum of a closed path is back at zero.
      const int32_t end = std::min(last, width_);
      float sum = 0;
      for (int32_t column = first; column < end; ++column) {
        sum += cell[column];
        out[column] = uint8_t(std::min(std::abs(sum), 1.0f) * 255 + 0.5f);
      }
      mask.spans[size_t(2 * row)] = std::min(first, end);
      mask.spans[size_t(2 * row + 1)] = end;
      if (first < last) std::fill(cell + first, cell + last + 1, 0.f);
    }
    return mask;
  }

private:
  static float* Cells(size_t count) {
    thread_local std::vector<float> cells;
    if (cells.size() < count) cells.assign(count, 0.f);
    return cells.data();
  }

  void Inside(KPointF a, KPointF b) {
    if (a.y == b.y) return;
    const float direction = a.y < b.y ? 1.f : -1.f;
    if (a.y > b.y) std::swap(a, b);
    const double slope = (b.x - a.x) / (b.y - a.y);
    double x = a.x;
    const int32_t last = std::min(height_, int32_t(std::ceil(b.y)));
    for (int32_t row = int32_t(a.y); row < last; ++row) {
      const double dy = std::min(double(row + 1), b.y) - std::max(double(row), a.y);
      const double next = x + slope * dy;
      Row(row, x, next, float(dy) * direction);
      x = next;
    }
  }

  // Distributes `d` (the row height the edge spans, signed) over the cells from x0 to x1.
  void Row(int32_t row, double xa, double xb, float d) {
    float* cell = &cells_[size_t(row) * stride_];
    const double x0 = std::min(xa, xb), x1 = std::max(xa, xb);
    const int32_t i0 = int32_t(std::floor(x0)), i1 = int32_t(std::ceil(x1));
    int32_t& first = touched_[size_t(2 * row)];
    int32_t& last = touched_[size_t(2 * row + 1)];
    first = std::min(first, i0);
    last = std::max(last, std::max(i1, i0 + 1));
    if (i1 <= i0 + 1) {
      // Within one pixel: the part right of the edge's mean position.
      const float right = float(0.5 * (xa + xb) - i0);
      cell[i0] += d * (1 - right);
      cell[i0 + 1] += d * right;
      return;
    }
    // Across pixels: the area right of the edge grows linearly between the first and last
    // crossed pixel, quadratically inside those two.
    const double inverse = 1 / (x1 - x0);
    const double f0 = x0 - i0;
    const double firstPart = 0.5 * inverse * (1 - f0) * (1 - f0);
    const double f1 = x1 - i1 + 1;
    const double lastPart = 0.5 * inverse * f1 * f1;
    cell[i0] += d * float(firstPart);
    if (i1 == i0 + 2) {
      cell[i0 + 1] += d * float(1 - firstPart - lastPart);
    } else {
      const double second = inverse * (1.5 - f0);
      cell[i0 + 1] += d * float(second - firstPart);
      for (int32_t i = i0 + 2; i < i1 - 1; ++i) cell[i] += d * float(inverse);
      const double beforeLast = second + (i1 - i0 - 3) * inverse;
      cell[i1 - 1] += d * float(1 - beforeLast - lastPart);
    }
    cell[i1] += d * float(lastPart);
  }

  int32_t width_, height_;
  size_t stride_;
  float* cells_;
  std::vector<int32_t> touched_;  // per row the first and last cell an edge wrote
};
}  // namespace

void KPath::Close() {
  const int32_t start = ends_.empty() ? 0 : ends_.back();
  if (int32_t(points_.size()) - start < 3)
    points_.resize(size_t(start));
  else
    ends_.push_back(int32_t(points_.size()));
}

void KPath::AddContour(std::span<const KPointF> points) {
  points_.insert(points_.end(), points.begin(), points.end());
  Close();
}

void KPath::Reverse(size_t from) { std::reverse(points_.begin() + std::ptrdiff_t(from), points_.end()); }

void KPath::AddRectangle(double left, double top, double right, double bottom, bool hole) {
  const size_t from = points_.size();
  for (KPointF p : {KPointF{left, top}, KPointF{right, top}, KPointF{right, bottom}, KPointF{left, bottom}}) Add(p);
  if (hole) Reverse(from);
  Close();
}

void KPath::AddEllipse(double cx, double cy, double rx, double ry, bool hole) {
  const size_t from = points_.size();
  const int32_t n = std::max(8, ArcSegments(std::max(rx, ry), 2 * std::numbers::pi));
  // Turning a unit vector by one step at a time instead of a sine and cosine per point.
  const double step = 2 * std::numbers::pi / n, c = std::cos(step), s = std::sin(step);
  // Vertices slightly outside the curve, so that the polygon's chords cross it and it lies
  // within half the flatness on either side (its area equals the ellipse's closely).
  const double out = 2 / (1 + std::cos(step / 2));
  double ux = out, uy = 0;
  for (int32_t i = 0; i < n; ++i) {
    Add({cx + rx * ux, cy + ry * uy});
    const double nx = ux * c - uy * s;
    uy = ux * s + uy * c, ux = nx;
  }
  if (hole) Reverse(from);
  Close();
}

void KPath::AddWedge(KPointF centre, double radius, double from, double to) {
  const double turn = std::remainder(to - from, 2 * std::numbers::pi);
  const int32_t n = ArcSegments(radius, turn);
  const size_t start = points_.size();
  Add(centre);
  for (int32_t i = 0; i <= n; ++i) {
    const double a = from + turn * i / n;
    Add({centre.x + radius * std::cos(a), centre.y + radius * std::sin(a)});
  }
  if (turn < 0) Reverse(start);
  Close();
}

void KPath::AddRoundRectangle(double left, double top, double right, double bottom, double radius, bool hole) {
  radius = std::clamp(radius, 0.0, std::min(right - left, bottom - top) / 2);
  if (!(radius > 0)) return AddRectangle(left, top, right, bottom, hole);
  const size_t from = points_.size();
  const int32_t n = ArcSegments(radius, std::numbers::pi / 2);
  const KPointF centres[4] = {{right - radius, top + radius}, {right - radius, bottom - radius},
                              {left + radius, bottom - radius}, {left + radius, top + radius}};
  for (int corner = 0; corner < 4; ++corner)
    for (int32_t i = 0; i <= n; ++i) {
      const double a = std::numbers::pi / 2 * (corner - 1 + double(i) / n);
      Add({centres[corner].x + radius * std::cos(a), centres[corner].y + radius * std::sin(a)});
    }
  if (hole) Reverse(from);
  Close();
}

void KPath::AddStroke(std::span<const KPointF> points, double width, double extend) {
  const double half = width / 2;
  double previous = NAN;  // direction of the segment before, for the join
  for (size_t i = 0; i + 1 < points.size(); ++i) {
    KPointF a = points[i], b = points[i + 1];
    const double length = std::hypot(b.x - a.x, b.y - a.y);
    if (!(length > 0)) continue;
    const double ux = (b.x - a.x) / length, uy = (b.y - a.y) / length;
    if (i == 0) a = {a.x - ux * extend, a.y - uy * extend};
    if (i + 2 == points.size()) b = {b.x + ux * extend, b.y + uy * extend};
    const double nx = -uy * half, ny = ux * half;
    // The same turning sense for any direction, so that pieces add up instead of cancelling.
    for (KPointF p : {KPointF{a.x - nx, a.y - ny}, KPointF{b.x - nx, b.y - ny}, KPointF{b.x + nx, b.y + ny},
                      KPointF{a.x + nx, a.y + ny}})
      Add(p);
    Close();
    // A round join: the wedges between the two segments' ends on both sides.
    const double direction = std::atan2(uy, ux);
    if (!std::isnan(previous) && std::abs(std::remainder(direction - previous, 2 * std::numbers::pi)) > 1e-6) {
      const double quarter = std::numbers::pi / 2;
      AddWedge(a, half, previous + quarter, direction + quarter);
      AddWedge(a, half, previous - quarter, direction - quarter);
    }
    previous = direction;
  }
}

bool KPath::IsFinite() const noexcept {
  return std::all_of(points_.begin(), points_.end(), [](KPointF p) { return std::isfinite(p.x) && std::isfinite(p.y); });
}

KCoverage KRasterize(const KPath& path, int32_t width, int32_t height) {
  if (path.Ends().empty() || !path.IsFinite()) return {};
  double left = INFINITY, top = INFINITY, right = -INFINITY, bottom = -INFINITY;
  for (KPointF p : path.Points()) {
    left = std::min(left, p.x), right = std::max(right, p.x);
    top = std::min(top, p.y), bottom = std::max(bottom, p.y);
  }
  const int32_t x0 = int32_t(std::clamp(std::floor(left), 0.0, double(width)));
  const int32_t x1 = int32_t(std::clamp(std::ceil(right), 0.0, double(width)));
  const int32_t y0 = int32_t(std::clamp(std::floor(top), 0.0, double(height)));
  const int32_t y1 = int32_t(std::clamp(std::ceil(bottom), 0.0, double(height)));
  if (x1 <= x0 || y1 <= y0) return {};
  Accumulator accumulator(x1 - x0, y1 - y0);
  int32_t start = 0;
  const std::span<const KPointF> points = path.Points();
  for (int32_t end : path.Ends()) {
    for (int32_t i = start; i < end; ++i) {
      const KPointF a = points[size_t(i)], b = points[size_t(i + 1 < end ? i + 1 : start)];
      accumulator.Edge({a.x - x0, a.y - y0}, {b.x - x0, b.y - y0});
    }
    start = end;
  }
  return accumulator.Finish(x0, y0);
}
