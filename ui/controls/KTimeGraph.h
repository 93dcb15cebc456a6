#pragma once

#include <functional>
#include <vector>

#include "ui/controls/KGraphs.h"

// What follows a single sound over time: level in dB (0 at the top, −kRangeDb at the foot)
// against seconds, from 0 to a span that follows the settings, rounded up to 1, 2, 2.5 or 5 of
// a power of ten so that the grid reads in round times. It may show an envelope (a filled curve,
// and a dimmer second one), taps (single sounds such as echoes, drawn as stems) and a caption.
class KTimeGraph final : public KGraph {
public:
  struct Tap {
    double seconds;
    double decibels;
    int32_t side;  // 0 both, −1 left, +1 right
  };
  struct Callbacks {
    std::function<double()> span;                 // the seconds to show at least
    std::function<double(double seconds)> level;  // dB; may be empty
    std::function<double(double seconds)> second; // dB; may be empty
    std::function<std::vector<Tap>()> taps;       // may be empty
    std::function<KString()> caption;             // may be empty
  };
  static constexpr double kRangeDb = 60;

  KTimeGraph(const KRect& bounds, Callbacks callbacks, KString helpKey)
      : KGraph(bounds), callbacks_(std::move(callbacks)), helpKey_(std::move(helpKey)) {
    Refresh();
  }
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void OnTimer() override;
  KString HelpKey() const override { return helpKey_; }

  // The smallest 1, 2, 2.5 or 5 times a power of ten at or above `seconds`.
  static double RoundSpan(double seconds) noexcept;
  double Span() const noexcept { return span_; }
  // The taps as last painted, and where a tap's top is drawn.
  const std::vector<Tap>& Taps() const noexcept { return taps_; }
  KPointF TapTop(const Tap& tap) const noexcept { return ToPixel(tap.seconds, tap.decibels); }

protected:
  double Left() const noexcept override { return -kLead * span_; }
  double Right() const noexcept override { return span_; }
  double Top() const noexcept override { return 0; }
  double Bottom() const noexcept override { return -kRangeDb; }
  double Evaluate(double x) const override;

private:
  // Takes the span, the taps and the caption from the settings; answers whether any moved.
  bool Refresh();

  Callbacks callbacks_;
  KString helpKey_;
  double span_ = 1;
  std::vector<Tap> taps_;
  KString caption_;
};
