#pragma once

#include "ui/controls/KParameterControl.h"

// The behaviour knobs and sliders share: a vertical drag moves the value (Shift for fine steps),
// a double click returns it to the default, the wheel and the arrow keys step it, and a double
// click on the value text opens a field to type a value in the parameter's own display text.
// Every change is one gesture to the host and one undo step; values that change elsewhere
// (automation, undo, presets) are followed on the tree's tick.
class KValueControl : public KParameterControl {
public:
  // Logical pixels of drag for the whole range, and the fine-step divisor.
  static constexpr double kDragTravel = 200;
  static constexpr double kFineFactor = 10;

  using KParameterControl::KParameterControl;

  // The part of the control that shows the value text (where a double click starts typing).
  virtual KRect ValueTextArea() const noexcept = 0;
  // Opens the typing field over the value text.
  void BeginTyping();

  bool OnMouseDown(const KMouseEvent& event) override;
  void OnMouseMove(const KMouseEvent& event) override;
  void OnMouseUp(const KMouseEvent& event) override;
  bool OnDoubleClick(const KMouseEvent& event) override;
  bool OnWheel(const KMouseEvent& event) override;
  bool OnKey(const KKeyEvent& event) override;
  bool IsFocusable() const noexcept override { return true; }

protected:
  // The value at which a bipolar range's arc or bar starts (its default, when the default lies
  // inside the range), else 0.
  double Origin() const noexcept;
  // One step of the wheel or an arrow key.
  double Step(uint32_t modifiers) const noexcept;
  // The label centred in the band at the top, cut short where it is wider than the control.
  void PaintLabel(KDrawer& drawer, const KStyle& style) const;

private:
  bool dragging_ = false;  // the gesture begins with the first change, so a click sends nothing
  double dragStart_ = 0;
  int32_t dragY_ = 0;
  uint32_t dragModifiers_ = 0;
};

// A rotary knob: the name above, a value arc round a cap with a pointer, the value text below.
class KKnob final : public KValueControl {
public:
  using KValueControl::KValueControl;
  KRect ValueTextArea() const noexcept override;
  void Paint(KDrawer& drawer, const KStyle& style) override;
};

// A vertical slider: the name above, a track filled up to the value, the value text below.
class KSlider final : public KValueControl {
public:
  using KValueControl::KValueControl;
  KRect ValueTextArea() const noexcept override;
  void Paint(KDrawer& drawer, const KStyle& style) override;
};
