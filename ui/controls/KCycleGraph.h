#pragma once

#include <functional>
#include <vector>

#include "ui/controls/KGraphs.h"

// What an LFO does over two of its cycles: the value it moves (a delay, a level, a frequency)
// against the cycle, with a marker where the LFO is now, and a dimmer curve for a second
// channel running apart. The value's range and its grid come with the graph; a frequency is
// given as log2 of hertz, so that octaves are even.
class KCycleGraph final : public KGraph {
public:
  struct Mark {
    double value;
    const char* text;
  };
  struct Axes {
    double top, bottom;
    std::vector<Mark> marks;  // grid lines with their labels
  };
  struct Callbacks {
    std::function<double(double cycles)> value;
    std::function<double(double cycles)> second;  // may be empty
    std::function<double()> phase;                // where the LFO is now, in cycles; may be empty
  };
  static constexpr double kCycles = 2;

  KCycleGraph(const KRect& bounds, Axes axes, Callbacks callbacks, KString helpKey)
      : KGraph(bounds), axes_(std::move(axes)), callbacks_(std::move(callbacks)), helpKey_(std::move(helpKey)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void OnTimer() override;
  KString HelpKey() const override { return helpKey_; }
  // Where the marker of the LFO's present phase is drawn (in the first cycle).
  KPointF Marker() const;

protected:
  double Left() const noexcept override { return -kLead * kCycles; }
  double Right() const noexcept override { return kCycles; }
  double Top() const noexcept override { return axes_.top; }
  double Bottom() const noexcept override { return axes_.bottom; }
  double Evaluate(double x) const override { return callbacks_.value ? callbacks_.value(x) : axes_.bottom; }

private:
  Axes axes_;
  Callbacks callbacks_;
  KString helpKey_;
  KPointF painted_{-1, -1};  // the marker as last painted
};
