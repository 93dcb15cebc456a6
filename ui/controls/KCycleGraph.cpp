#include "ui/controls/KCycleGraph.h"

#include <cmath>

#include "ui/controls/KStyle.h"

KPointF KCycleGraph::Marker() const {
  const double phase = callbacks_.phase ? callbacks_.phase() : 0.0;
  const double at = std::isfinite(phase) ? phase - std::floor(phase) : 0.0;
  return ToPixel(at, Evaluate(at));
}

void KCycleGraph::OnTimer() {
  KGraph::OnTimer();
  const KPointF now = Marker();
  if (std::fabs(now.x - painted_.x) >= 0.5 || std::fabs(now.y - painted_.y) >= 0.5) Invalidate();
}

void KCycleGraph::Paint(KDrawer& drawer, const KStyle& style) {
  std::vector<double> yLines;
  for (const Mark& mark : axes_.marks) yLines.push_back(mark.value);
  PaintCurve(drawer, style, {0.0, 0.5, 1.0, 1.5}, yLines, std::nan(""), callbacks_.second);
  const KRect p = Plot();
  for (const Mark& mark : axes_.marks) {
    const int32_t y = static_cast<int32_t>(std::lround(ToPixel(0, mark.value).y));
    // At the right, clear of the marker, which starts its cycles at the left.
    drawer.AlignedTextOut({p.left + 4, y - 14, p.right - 4, y - 1}, KString::Static(mark.text), style.LabelFont(),
                          style.Get(KStyle::kTextDim), kAlignRight | kAlignBottom, 255, kDrawBlend);
  }
  // Where the LFO is now: a line across the plot and a dot on the curve.
  painted_ = Marker();
  drawer.LineF({painted_.x, double(p.top)}, {painted_.x, double(p.bottom)}, style.Get(KStyle::kAccent), 110, kDrawBlend);
  drawer.FillCircle(painted_, 5, style.Get(KStyle::kAccent), 255, kDrawBlend);
  drawer.Circle(painted_, 5, style.Get(KStyle::kGraphBack), 255, kDrawBlend);
}
