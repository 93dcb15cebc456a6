#include "ui/controls/KValueControl.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "ui/controls/KControlPaint.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KStyle.h"

namespace {

constexpr int32_t kLabelHeight = 16;
constexpr int32_t kValueHeight = 16;
// The knob's travel: 270 degrees, centred on 12 o'clock.
constexpr double kStartAngle = -0.75 * std::numbers::pi;
constexpr double kEndAngle = 0.75 * std::numbers::pi;

}  // namespace

void KValueControl::BeginTyping() {
  KControlTree* tree = Tree();
  if (!tree) return;
  const KRect area = ValueTextArea();
  KTextField& field = static_cast<KTextField&>(tree->Root().Add(std::make_unique<KTextField>(
      KRect{area.left - 4, area.top - 2, area.right + 4, area.bottom + 2}, Link().Parameter().Text(),
      [this](const KString& text) {
        double normalized = 0;
        if (Link().Parameter().NormalizedFromText(text, normalized)) Link().Change(normalized);
        Invalidate();
      })));
  tree->SetFocus(&field);
}

bool KValueControl::OnMouseDown(const KMouseEvent& event) {
  dragging_ = false;
  dragStart_ = Link().Value();
  dragY_ = event.at.y;
  dragModifiers_ = event.modifiers;
  return true;
}

void KValueControl::OnMouseMove(const KMouseEvent& event) {
  // A change of the fine modifier mid-drag restarts from here, so the value never jumps.
  if ((event.modifiers & kModShift) != (dragModifiers_ & kModShift)) {
    dragStart_ = Link().Value();
    dragY_ = event.at.y;
    dragModifiers_ = event.modifiers;
  }
  const double travel = kDragTravel * ((event.modifiers & kModShift) ? kFineFactor : 1);
  const double target = std::clamp(dragStart_ + (dragY_ - event.at.y) / travel, 0.0, 1.0);
  if (Link().Snap(target) != Link().Value()) {
    if (!dragging_) Link().Begin();
    dragging_ = true;
    Link().Set(target);
    Invalidate();
  }
}

void KValueControl::OnMouseUp(const KMouseEvent&) {
  if (dragging_) Link().End();
  dragging_ = false;
}

bool KValueControl::OnDoubleClick(const KMouseEvent& event) {
  if (KContains(ValueTextArea(), event.at)) {
    BeginTyping();
  } else {
    Link().Change(Link().Parameter().DefaultNormalized());
    Invalidate();
  }
  return true;
}

double KValueControl::Step(uint32_t modifiers) const noexcept {
  const int32_t steps = Link().Parameter().Steps();
  if (steps > 0) return 1.0 / steps;
  return (modifiers & kModShift) ? 0.001 : 0.01;
}

bool KValueControl::OnWheel(const KMouseEvent& event) {
  if (event.wheel == 0) return true;
  Link().Change(Link().Value() + (event.wheel > 0 ? 1 : -1) * Step(event.modifiers));
  Invalidate();
  return true;
}

bool KValueControl::OnKey(const KKeyEvent& event) {
  double direction = 0;
  if (event.key == kKeyUp || event.key == kKeyRight) direction = 1;
  else if (event.key == kKeyDown || event.key == kKeyLeft) direction = -1;
  else if (event.key == kKeyReturn) {
    BeginTyping();
    return true;
  } else {
    return false;
  }
  Link().Change(Link().Value() + direction * Step(event.modifiers));
  Invalidate();
  return true;
}

double KValueControl::Origin() const noexcept {
  const KValueKind& kind = Link().Parameter().Kind();
  if (kind.Minimum() < 0 && kind.Maximum() > 0) return kind.ToNormalized(0);
  return 0;
}

void KValueControl::PaintLabel(KDrawer& drawer, const KStyle& style) const {
  const KRect band = KControlPaint::Top(Bounds(), kLabelHeight);
  drawer.AlignedTextOut(band, KControlPaint::Fitted(drawer, Label(), style.LabelFont(), band), style.LabelFont(),
                        style.Get(KStyle::kText), kAlignCentre | kAlignMiddle, 255, kDrawBlend);
}

KRect KKnob::ValueTextArea() const noexcept { return KControlPaint::Bottom(Bounds(), kValueHeight); }

void KKnob::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  const double value = Link().Value();
  PaintLabel(drawer, style);
  const double size = std::min<double>({style.Get(KStyle::kKnob), double(r.Width()) - 8,
                                        double(r.Height()) - kLabelHeight - kValueHeight - 6});
  const KPointF centre{(r.left + r.right) / 2.0, r.top + kLabelHeight + 3 + size / 2};
  const double radius = size / 2;
  const double angle = kStartAngle + value * (kEndAngle - kStartAngle);
  const double origin = kStartAngle + Origin() * (kEndAngle - kStartAngle);
  const double ring = std::max(2.5, radius * 0.12);
  KControlPaint::Arc(drawer, centre, radius - ring / 2, kStartAngle, kEndAngle, ring, style.Get(KStyle::kKnobTrack));
  KControlPaint::Arc(drawer, centre, radius - ring / 2, origin, angle, ring, style.Get(KStyle::kAccent));
  const double cap = radius - ring - 3;
  drawer.FillCircle({centre.x, centre.y + 1.5}, cap, 0x60000000, 255, kDrawBlend);  // shadow
  drawer.FillCircle(centre, cap, style.Get(KStyle::kKnobBody), 255, kDrawBlend);
  drawer.Circle(centre, cap - 0.5, 0x18FFFFFF, 255, kDrawBlend);
  const double previous = drawer.LineWidth();
  drawer.SetLineWidth(2);
  drawer.LineF(KControlPaint::Polar(centre, cap * 0.35, angle), KControlPaint::Polar(centre, cap * 0.85, angle),
               style.Get(KStyle::kValueText), 255, kDrawBlend);
  drawer.SetLineWidth(previous);
  drawer.AlignedTextOut(ValueTextArea(), ValueText(), style.ValueFont(), style.Get(KStyle::kValueText),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
}

KRect KSlider::ValueTextArea() const noexcept { return KControlPaint::Bottom(Bounds(), kValueHeight); }

void KSlider::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  PaintLabel(drawer, style);
  const int32_t cx = (r.left + r.right) / 2;
  const KRect track{cx - 3, r.top + kLabelHeight + 8, cx + 3, r.bottom - kValueHeight - 8};
  drawer.FillRoundRectangle(track, 3, style.Get(KStyle::kKnobTrack), 255, kDrawBlend);
  const auto yOf = [&](double v) { return static_cast<int32_t>(std::lround(track.bottom - v * (track.bottom - track.top))); };
  const int32_t y = yOf(Link().Value());
  const int32_t y0 = yOf(Origin());
  drawer.FillRoundRectangle({track.left, std::min(y, y0), track.right, std::max(y, y0)}, 3, style.Get(KStyle::kAccent), 255,
                            kDrawBlend);
  drawer.FillRoundRectangle({cx - 11, y - 5, cx + 11, y + 5}, 3, style.Get(KStyle::kKnobBody), 255, kDrawBlend);
  drawer.Line({cx - 7, y}, {cx + 7, y}, style.Get(KStyle::kValueText), 255, kDrawBlend);
  drawer.AlignedTextOut(ValueTextArea(), ValueText(), style.ValueFont(), style.Get(KStyle::kValueText),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
}
