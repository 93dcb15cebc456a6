#include "ui/controls/KGraphs.h"

#include <algorithm>
#include <cmath>

#include "kernel/KFormat.h"
#include "ui/controls/KStyle.h"

namespace {

double Distance(KPointF a, KPoint b) noexcept { return std::hypot(a.x - b.x, a.y - b.y); }

// Whether two lists of points differ by a tenth of a logical pixel or more.
bool Moved(const std::vector<KPointF>& a, const std::vector<KPointF>& b) noexcept {
  if (a.size() != b.size()) return true;
  for (size_t i = 0; i < a.size(); ++i)
    if (std::fabs(a[i].x - b[i].x) >= 0.1 || std::fabs(a[i].y - b[i].y) >= 0.1) return true;
  return false;
}

void PaintNode(KDrawer& drawer, const KStyle& style, KPointF at, bool active, bool dragged) {
  drawer.FillCircle(at, KGraph::kNodeRadius + (dragged ? 2 : 0), active ? style.Get(KStyle::kAccent) : style.Get(KStyle::kTextDim),
                    255, kDrawBlend);
  drawer.Circle(at, KGraph::kNodeRadius + (dragged ? 2 : 0), style.Get(KStyle::kGraphBack), 255, kDrawBlend);
}

}  // namespace

std::vector<double> KGraph::Sample(const std::function<double(double x)>& value) const {
  std::vector<double> values(kSamples);
  for (int32_t i = 0; i < kSamples; ++i) values[static_cast<size_t>(i)] = value(FromFraction(i / double(kSamples - 1)));
  return values;
}

std::vector<double> KGraph::Sample() const {
  return Sample([this](double x) { return Evaluate(x); });
}

void KGraph::OnTimer() {
  std::vector<double> values = Sample();
  const double unitsPerPixel = std::fabs(Top() - Bottom()) / std::max<int64_t>(1, Plot().Height());
  bool moved = values.size() != curve_.size();
  for (size_t i = 0; !moved && i < values.size(); ++i) moved = !(std::fabs(values[i] - curve_[i]) < unitsPerPixel * 0.25);
  const bool nodes = NodesMoved();
  if (moved || nodes) Invalidate();
}

KPointF KGraph::ToPixel(double x, double y) const noexcept {
  const KRect p = Plot();
  return {p.left + ToFraction(x) * (p.right - p.left), p.top + (Top() - y) / (Top() - Bottom()) * (p.bottom - p.top)};
}

void KGraph::FromPixel(KPoint at, double& x, double& y) const noexcept {
  const KRect p = Plot();
  x = FromFraction(std::clamp((at.x - p.left) / double(std::max(1, p.right - p.left)), 0.0, 1.0));
  y = Top() - std::clamp((at.y - p.top) / double(std::max(1, p.bottom - p.top)), 0.0, 1.0) * (Top() - Bottom());
}

void KGraph::PaintCurve(KDrawer& drawer, const KStyle& style, const std::vector<double>& xLines,
                        const std::vector<double>& yLines, double fillTo, const std::function<double(double x)>& under) {
  const KRect& r = Bounds();
  drawer.FillRoundRectangle(r, style.Get(KStyle::kRadius), style.Get(KStyle::kGraphBack), 255, kDrawBlend);
  const KRect p = Plot();
  for (double x : xLines) {
    const int32_t px = static_cast<int32_t>(std::lround(ToPixel(x, 0).x));
    drawer.Line({px, p.top}, {px, p.bottom}, style.Get(KStyle::kGraphGrid), 255, kDrawBlend);
  }
  for (double y : yLines) {
    const int32_t py = static_cast<int32_t>(std::lround(ToPixel(Left(), y).y));
    drawer.Line({p.left, py}, {p.right, py}, style.Get(KStyle::kGraphGrid), 255, kDrawBlend);
  }
  curve_ = Sample();
  const std::vector<double>& curve = curve_;
  const double previous = drawer.LineWidth();
  if (under) {
    drawer.SetLineWidth(1.5);
    drawer.PaintHorizontalPolyLine(p, Sample(under), Top(), Bottom(), style.Get(KStyle::kTextDim), 255, kDrawBlend);
  }
  drawer.SetLineWidth(2);
  if (std::isfinite(fillTo))
    drawer.PaintHorizontalGraph(p, curve, Top(), Bottom(), fillTo, style.Get(KStyle::kGraphCurve), style.Get(KStyle::kGraphFill),
                                255, kDrawBlend);
  else
    drawer.PaintHorizontalPolyLine(p, curve, Top(), Bottom(), style.Get(KStyle::kGraphCurve), 255, kDrawBlend);
  drawer.SetLineWidth(previous);
  drawer.RoundRectangle(r, style.Get(KStyle::kRadius), style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
}

// ---- transfer curve

void KTransferGraph::Paint(KDrawer& drawer, const KStyle& style) {
  PaintCurve(drawer, style, {-48, -36, -24, -12}, {-48, -36, -24, -12}, -kRangeDb);
  // The unity line, for reference.
  const KPointF a = ToPixel(-kRangeDb, -kRangeDb), b = ToPixel(0, 0);
  drawer.LineF(a, b, style.Get(KStyle::kGraphGrid), 160, kDrawBlend);
  painted_ = callbacks_.points ? callbacks_.points() : std::vector<KPointF>{};
  const bool active = callbacks_.customActive && callbacks_.customActive();
  if (active) {
    // Points beyond the graph's range (silence at minus infinity) are not drawn.
    for (size_t i = 0; i < painted_.size(); ++i)
      if (painted_[i].x >= -kRangeDb && painted_[i].y >= -kRangeDb)
        PaintNode(drawer, style, ToPixel(painted_[i].x, painted_[i].y), true, static_cast<int32_t>(i) == dragged_);
  }
  const KRect p = Plot();
  drawer.AlignedTextOut({p.left + 6, p.top + 4, p.right - 6, p.top + 18}, KString("Output"), style.LabelFont(),
                        style.Get(KStyle::kTextDim), kAlignLeft | kAlignTop, 255, kDrawBlend);
  drawer.AlignedTextOut({p.left + 6, p.bottom - 18, p.right - 6, p.bottom - 4}, KString("Input"), style.LabelFont(),
                        style.Get(KStyle::kTextDim), kAlignRight | kAlignBottom, 255, kDrawBlend);
}

bool KTransferGraph::NodesMoved() {
  if (!callbacks_.points) return false;
  return Moved(callbacks_.points(), painted_);
}

bool KTransferGraph::OnMouseDown(const KMouseEvent& event) {
  if (!(callbacks_.customActive && callbacks_.customActive()) || !callbacks_.points) return false;
  const std::vector<KPointF> points = callbacks_.points();
  for (size_t i = 0; i < points.size(); ++i) {
    if (Distance(ToPixel(points[i].x, points[i].y), event.at) <= kNodeRadius + 3) {
      dragged_ = static_cast<int32_t>(i);
      if (callbacks_.beforeChange) callbacks_.beforeChange();
      Invalidate();
      return true;
    }
  }
  return false;
}

void KTransferGraph::OnMouseMove(const KMouseEvent& event) {
  if (dragged_ < 0 || !callbacks_.movePoint) return;
  const std::vector<KPointF> points = callbacks_.points();
  if (dragged_ >= static_cast<int32_t>(points.size())) return;
  double x = 0, y = 0;
  FromPixel(event.at, x, y);
  // A point stays between its neighbours, so the curve keeps rising with the input.
  const size_t i = static_cast<size_t>(dragged_);
  const double low = i > 0 ? points[i - 1].x + 0.5 : -kRangeDb;
  const double high = i + 1 < points.size() ? points[i + 1].x - 0.5 : 0;
  callbacks_.movePoint(dragged_, {std::clamp(x, low, std::max(low, high)), y});
  Invalidate();
}

void KTransferGraph::OnMouseUp(const KMouseEvent&) {
  dragged_ = -1;
  Invalidate();
}

// ---- equalizer response

double KResponseGraph::ToFraction(double x) const noexcept { return std::log(std::max(x, 1e-3) / kLowHz) / std::log(kHighHz / kLowHz); }
double KResponseGraph::FromFraction(double t) const noexcept { return kLowHz * std::exp(t * std::log(kHighHz / kLowHz)); }

KPointF KResponseGraph::NodePosition(int32_t node) const {
  const Node& n = nodes_[static_cast<size_t>(node)];
  return ToPixel(n.frequency.Parameter().Working(), n.gain.Parameter().Working());
}

void KResponseGraph::Paint(KDrawer& drawer, const KStyle& style) {
  PaintCurve(drawer, style, {50, 100, 200, 500, 1000, 2000, 5000, 10000}, {-12, 0, 12}, 0);
  const KRect p = Plot();
  const struct { double hz; const char* text; } marks[] = {{100, "100"}, {1000, "1k"}, {10000, "10k"}};
  for (const auto& mark : marks) {
    const int32_t x = static_cast<int32_t>(std::lround(ToPixel(mark.hz, 0).x));
    drawer.AlignedTextOut({x + 3, p.bottom - 16, x + 40, p.bottom - 3}, KString::Static(mark.text), style.LabelFont(),
                          style.Get(KStyle::kTextDim), kAlignLeft | kAlignBottom, 255, kDrawBlend);
  }
  painted_.clear();
  for (int32_t i = 0; i < static_cast<int32_t>(nodes_.size()); ++i) {
    painted_.push_back(NodePosition(i));
    const Node& n = nodes_[static_cast<size_t>(i)];
    PaintNode(drawer, style, painted_.back(), !n.active || n.active(), i == dragged_);
    drawer.AlignedTextOut({int32_t(painted_.back().x) - 8, int32_t(painted_.back().y) - 7, int32_t(painted_.back().x) + 8,
                           int32_t(painted_.back().y) + 7},
                          KFormat("{0}").Arg(i + 1).Text(), KFont(9, KFontStyle::Bold), style.Get(KStyle::kGraphBack),
                          kAlignCentre | kAlignMiddle, 255, kDrawBlend);
  }
}

bool KResponseGraph::NodesMoved() {
  std::vector<KPointF> now;
  for (int32_t i = 0; i < static_cast<int32_t>(nodes_.size()); ++i) now.push_back(NodePosition(i));
  return Moved(now, painted_);
}

KString KResponseGraph::HelpKey() const {
  if (dragged_ >= 0) return nodes_[static_cast<size_t>(dragged_)].frequency.Parameter().Key();
  return nodes_.empty() ? KString() : nodes_.front().frequency.Parameter().Key();
}

bool KResponseGraph::OnMouseDown(const KMouseEvent& event) {
  // The nearest node within reach; later nodes win ties, as they are drawn on top.
  double best = kNodeRadius + 4;
  dragged_ = -1;
  for (int32_t i = 0; i < static_cast<int32_t>(nodes_.size()); ++i) {
    const double d = Distance(NodePosition(i), event.at);
    if (d <= best) {
      best = d;
      dragged_ = i;
    }
  }
  if (dragged_ < 0) return false;
  Node& node = nodes_[static_cast<size_t>(dragged_)];
  node.frequency.Begin();
  node.gain.Begin();
  Invalidate();
  return true;
}

void KResponseGraph::OnMouseMove(const KMouseEvent& event) {
  if (dragged_ < 0) return;
  Node& node = nodes_[static_cast<size_t>(dragged_)];
  double hz = 0, db = 0;
  FromPixel(event.at, hz, db);
  node.frequency.Set(node.frequency.Parameter().Kind().ToNormalized(hz));
  node.gain.Set(node.gain.Parameter().Kind().ToNormalized(db));
  Invalidate();
}

void KResponseGraph::OnMouseUp(const KMouseEvent&) {
  if (dragged_ < 0) return;
  Node& node = nodes_[static_cast<size_t>(dragged_)];
  node.frequency.End();
  node.gain.End();
  dragged_ = -1;
  Invalidate();
}

// ---- saturator shape

void KShapeGraph::Paint(KDrawer& drawer, const KStyle& style) {
  PaintCurve(drawer, style, {-0.5, 0, 0.5}, {-0.5, 0, 0.5}, std::nan(""));
}
