#include "plugins/KMeasurementGraph.h"

#include <algorithm>
#include <cmath>

#include "ui/controls/KStyle.h"

double KMeasurementGraph::ToFraction(double x) const noexcept {
  if (!axes_.logarithmic) return KGraph::ToFraction(x);
  return std::log(std::max(x, 1e-9) / axes_.left) / std::log(axes_.right / axes_.left);
}

double KMeasurementGraph::FromFraction(double t) const noexcept {
  if (!axes_.logarithmic) return KGraph::FromFraction(t);
  return axes_.left * std::exp(t * std::log(axes_.right / axes_.left));
}

void KMeasurementGraph::OnTimer() {
  if (callbacks_.refresh) callbacks_.refresh();
  KGraph::OnTimer();
  if (callbacks_.caption && callbacks_.caption() != painted_) Invalidate();
}

void KMeasurementGraph::Paint(KDrawer& drawer, const KStyle& style) {
  PaintCurve(drawer, style, axes_.xLines, axes_.yLines, axes_.bottom);
  if (!callbacks_.caption) return;
  painted_ = callbacks_.caption();
  const KRect p = Plot();
  drawer.AlignedTextOut({p.left + 4, p.top + 3, p.right - 4, p.top + 18}, painted_, style.LabelFont(), style.Get(KStyle::kText),
                        kAlignRight | kAlignTop, 255, kDrawBlend);
}
