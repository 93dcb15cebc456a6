#pragma once

#include <functional>
#include <vector>

#include "ui/controls/KControl.h"
#include "ui/controls/KParameterLink.h"

// A graph over a rectangle: a grid, a curve sampled from a function on every tick (so it follows
// automation and presets; it repaints only when the curve moved by a pixel's worth), and
// draggable nodes.
class KGraph : public KControl {
public:
  static constexpr int32_t kSamples = 160;
  static constexpr double kNodeRadius = 6;
  // Room before zero on axes that start at zero (time, phase), as a share of their length, so
  // that what happens at zero is not cut by the frame.
  static constexpr double kLead = 0.02;

  explicit KGraph(const KRect& bounds) noexcept : KControl(bounds) {}
  void OnTimer() override;
  // The curve as painted last (y in the graph's units), for tests and for the painting.
  const std::vector<double>& Curve() const noexcept { return curve_; }

protected:
  KRect Plot() const noexcept { return KInset(Bounds(), 1); }
  // The graph's units at the plot's edges.
  virtual double Left() const noexcept = 0;
  virtual double Right() const noexcept = 0;
  virtual double Top() const noexcept = 0;
  virtual double Bottom() const noexcept = 0;
  // x in units to a fraction of the width (logarithmic axes override both).
  virtual double ToFraction(double x) const noexcept { return (x - Left()) / (Right() - Left()); }
  virtual double FromFraction(double t) const noexcept { return Left() + t * (Right() - Left()); }
  virtual double Evaluate(double x) const = 0;
  // Answers whether anything besides the curve moved (nodes).
  virtual bool NodesMoved() { return false; }

  KPointF ToPixel(double x, double y) const noexcept;
  void FromPixel(KPoint at, double& x, double& y) const noexcept;
  // Face, grid lines at `xLines` and `yLines` (in units), the curve (filled down to `fillTo`
  // when it is finite) and its outline; `under`, when given, is a dimmer second curve drawn
  // beneath it (another channel, another band of frequencies).
  void PaintCurve(KDrawer& drawer, const KStyle& style, const std::vector<double>& xLines, const std::vector<double>& yLines,
                  double fillTo, const std::function<double(double x)>& under = {});

private:
  std::vector<double> Sample(const std::function<double(double x)>& value) const;
  std::vector<double> Sample() const;
  std::vector<double> curve_;
};

// The compressor's transfer curve, input level against output level in dB, with the custom
// shape's points to drag while the shape is in use. Dragging a point is one undo step.
class KTransferGraph final : public KGraph {
public:
  struct Callbacks {
    std::function<double(double inputDb)> law;
    std::function<bool()> customActive;
    std::function<std::vector<KPointF>()> points;  // dB
    std::function<void(int32_t index, KPointF point)> movePoint;  // dB
    std::function<void()> beforeChange;  // records the undo step
  };
  static constexpr double kRangeDb = 60;

  KTransferGraph(const KRect& bounds, Callbacks callbacks) : KGraph(bounds), callbacks_(std::move(callbacks)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  void OnMouseMove(const KMouseEvent& event) override;
  void OnMouseUp(const KMouseEvent& event) override;
  KString HelpKey() const override { return KString("customshape"); }

protected:
  double Left() const noexcept override { return -kRangeDb; }
  double Right() const noexcept override { return 0; }
  double Top() const noexcept override { return 0; }
  double Bottom() const noexcept override { return -kRangeDb; }
  double Evaluate(double x) const override { return callbacks_.law ? callbacks_.law(x) : x; }
  bool NodesMoved() override;

private:
  Callbacks callbacks_;
  std::vector<KPointF> painted_;
  int32_t dragged_ = -1;
};

// An equalizer's summed response over a logarithmic frequency axis, with one node per band that
// drags the band's frequency (across) and gain (up and down) in one gesture of each.
class KResponseGraph final : public KGraph {
public:
  struct Node {
    KParameterLink frequency;
    KParameterLink gain;
    std::function<bool()> active;
  };
  static constexpr double kLowHz = 20, kHighHz = 20000, kRangeDb = 24;

  KResponseGraph(const KRect& bounds, std::function<double(double hz)> response, std::vector<Node> nodes)
      : KGraph(bounds), response_(std::move(response)), nodes_(std::move(nodes)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  void OnMouseMove(const KMouseEvent& event) override;
  void OnMouseUp(const KMouseEvent& event) override;
  KString HelpKey() const override;
  // Where a node is drawn.
  KPointF NodePosition(int32_t node) const;

protected:
  double Left() const noexcept override { return kLowHz; }
  double Right() const noexcept override { return kHighHz; }
  double Top() const noexcept override { return kRangeDb; }
  double Bottom() const noexcept override { return -kRangeDb; }
  double ToFraction(double x) const noexcept override;
  double FromFraction(double t) const noexcept override;
  double Evaluate(double x) const override { return response_ ? response_(x) : 0; }
  bool NodesMoved() override;

private:
  std::function<double(double)> response_;
  std::vector<Node> nodes_;
  std::vector<KPointF> painted_;
  int32_t dragged_ = -1;
};

// A waveshaper's curve: output against input over -1..1.
class KShapeGraph final : public KGraph {
public:
  KShapeGraph(const KRect& bounds, std::function<double(double)> shape, KString helpKey)
      : KGraph(bounds), shape_(std::move(shape)), helpKey_(std::move(helpKey)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  KString HelpKey() const override { return helpKey_; }

protected:
  double Left() const noexcept override { return -1; }
  double Right() const noexcept override { return 1; }
  double Top() const noexcept override { return 1.1; }
  double Bottom() const noexcept override { return -1.1; }
  double Evaluate(double x) const override { return shape_ ? shape_(x) : x; }

private:
  std::function<double(double)> shape_;
  KString helpKey_;
};
