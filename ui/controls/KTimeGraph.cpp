#include "ui/controls/KTimeGraph.h"

#include <algorithm>
#include <cmath>

#include "kernel/KFormat.h"
#include "ui/controls/KStyle.h"

namespace {

KString TimeText(double seconds) {
  if (seconds < 1.0) return KFormat("{0} ms").Arg(static_cast<int32_t>(std::lround(seconds * 1000))).Text();
  if (seconds == std::round(seconds)) return KFormat("{0} s").Arg(static_cast<int32_t>(seconds)).Text();
  return KFormat("{0.1} s").Arg(seconds).Text();
}

}  // namespace

double KTimeGraph::RoundSpan(double seconds) noexcept {
  if (!(seconds > 1e-4)) return 1e-4;
  const double decade = std::pow(10.0, std::floor(std::log10(seconds)));
  for (double step : {1.0, 2.0, 2.5, 5.0, 10.0})
    if (step * decade >= seconds * (1 - 1e-12)) return step * decade;
  return 10 * decade;
}

double KTimeGraph::Evaluate(double x) const {
  // Below the foot the curve rests on it, so that silence draws as nothing.
  return callbacks_.level ? std::max(callbacks_.level(x), -kRangeDb - 1) : -kRangeDb - 1;
}

bool KTimeGraph::Refresh() {
  const double span = RoundSpan(callbacks_.span ? callbacks_.span() : 1.0);
  std::vector<Tap> taps = callbacks_.taps ? callbacks_.taps() : std::vector<Tap>{};
  // Only what the picture has room for: within the span and above the foot.
  std::erase_if(taps, [span](const Tap& t) { return !(t.seconds <= span && t.decibels > -kRangeDb); });
  KString caption = callbacks_.caption ? callbacks_.caption() : KString();
  bool moved = span != span_ || caption != caption_ || taps.size() != taps_.size();
  for (size_t i = 0; !moved && i < taps.size(); ++i)
    moved = std::fabs(taps[i].seconds - taps_[i].seconds) > 1e-3 * span || std::fabs(taps[i].decibels - taps_[i].decibels) > 0.05 ||
            taps[i].side != taps_[i].side;
  span_ = span;
  taps_ = std::move(taps);
  caption_ = std::move(caption);
  return moved;
}

void KTimeGraph::OnTimer() {
  if (Refresh()) Invalidate();
  KGraph::OnTimer();
}

void KTimeGraph::Paint(KDrawer& drawer, const KStyle& style) {
  Refresh();
  // Four or five grid lines, as the span's leading digit divides.
  const double lead = span_ / std::pow(10.0, std::floor(std::log10(span_) + 1e-9));
  const double step = span_ / (std::lround(lead) == 2 ? 4 : 5);
  std::vector<double> xLines;
  for (double t = step; t < span_ * (1 - 1e-9); t += step) xLines.push_back(t);
  PaintCurve(drawer, style, xLines, {-12, -24, -36, -48}, -kRangeDb - 1, callbacks_.second);
  const KRect p = Plot();
  for (double t : xLines) {
    const int32_t x = static_cast<int32_t>(std::lround(ToPixel(t, 0).x));
    drawer.AlignedTextOut({x + 3, p.bottom - 16, x + 60, p.bottom - 3}, TimeText(t), style.LabelFont(), style.Get(KStyle::kTextDim),
                          kAlignLeft | kAlignBottom, 255, kDrawBlend);
  }
  for (double db : {-12.0, -24.0, -36.0, -48.0}) {
    const int32_t y = static_cast<int32_t>(std::lround(ToPixel(0, db).y));
    drawer.AlignedTextOut({p.left + 4, y - 14, p.left + 60, y - 1}, KFormat("{0} dB").Arg(static_cast<int32_t>(db)).Text(),
                          style.LabelFont(), style.Get(KStyle::kTextDim), kAlignLeft | kAlignBottom, 255, kDrawBlend);
  }
  // Stems from the foot, the left side in the accent's colour, the right in the curve's.
  const double previous = drawer.LineWidth();
  drawer.SetLineWidth(3);
  for (const Tap& tap : taps_) {
    const KColor colour = tap.side > 0 ? style.Get(KStyle::kGraphCurve) : style.Get(KStyle::kAccent);
    const KPointF top = TapTop(tap);
    drawer.LineF({top.x, double(p.bottom)}, top, colour, 255, kDrawBlend);
    drawer.FillCircle(top, 4, colour, 255, kDrawBlend);
  }
  drawer.SetLineWidth(previous);
  if (!caption_.IsEmpty())
    drawer.AlignedTextOut({p.left + 4, p.top + 3, p.right - 6, p.top + 18}, caption_, style.LabelFont(), style.Get(KStyle::kText),
                          kAlignRight | kAlignTop, 255, kDrawBlend);
}
