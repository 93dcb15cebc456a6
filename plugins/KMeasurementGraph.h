#pragma once

#include <functional>
#include <vector>

#include "ui/controls/KGraphs.h"

// A graph of something measured rather than set (a spectrum, a loudness history): on every tick
// it lets the measurement refresh, then samples the value function; a caption function may add a
// line of readings in the top right corner. The x axis is linear or logarithmic.
class KMeasurementGraph final : public KGraph {
public:
  struct Axes {
    double left, right, top, bottom;
    bool logarithmic;
    std::vector<double> xLines, yLines;
  };
  struct Callbacks {
    std::function<double(double x)> value;
    std::function<KString()> caption;  // may be empty
    std::function<void()> refresh;     // may be empty
  };

  KMeasurementGraph(const KRect& bounds, Axes axes, Callbacks callbacks, KString helpKey)
      : KGraph(bounds), axes_(std::move(axes)), callbacks_(std::move(callbacks)), helpKey_(std::move(helpKey)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void OnTimer() override;
  KString HelpKey() const override { return helpKey_; }

protected:
  double Left() const noexcept override { return axes_.left; }
  double Right() const noexcept override { return axes_.right; }
  double Top() const noexcept override { return axes_.top; }
  double Bottom() const noexcept override { return axes_.bottom; }
  double ToFraction(double x) const noexcept override;
  double FromFraction(double t) const noexcept override;
  double Evaluate(double x) const override { return callbacks_.value ? callbacks_.value(x) : axes_.bottom; }

private:
  Axes axes_;
  Callbacks callbacks_;
  KString helpKey_;
  KString painted_;  // the caption as last painted
};
