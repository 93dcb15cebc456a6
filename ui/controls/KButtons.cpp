#include "ui/controls/KButtons.h"

#include <algorithm>
#include <cmath>

#include "ui/controls/KControlPaint.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KStyle.h"

void KSwitch::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  const bool on = IsOn();
  // A pill with a sliding thumb at the left, the name beside it.
  const int32_t cy = (r.top + r.bottom) / 2;
  const KRect pill{r.left + 2, cy - 8, r.left + 33, cy + 8};
  drawer.FillRoundRectangle(pill, 8, on ? style.Get(KStyle::kAccent) : style.Get(KStyle::kKnobTrack), 255, kDrawBlend);
  const double thumbX = on ? pill.right - 8 : pill.left + 8;
  drawer.FillCircle({thumbX, double(cy)}, 6, on ? style.Get(KStyle::kHeader) : style.Get(KStyle::kTextDim), 255, kDrawBlend);
  drawer.AlignedTextOut({pill.right + 8, r.top, r.right, r.bottom}, Label(), style.LabelFont(),
                        on ? style.Get(KStyle::kText) : style.Get(KStyle::kTextDim), kAlignLeft | kAlignMiddle, 255,
                        kDrawBlend);
}

void KSwitch::Flip() {
  Link().Change(IsOn() ? 0.0 : 1.0);
  Invalidate();
}

bool KSwitch::OnMouseDown(const KMouseEvent&) {
  Flip();
  return true;
}

bool KSwitch::OnKey(const KKeyEvent& event) {
  if (event.key != ' ' && event.key != kKeyReturn) return false;
  Flip();
  return true;
}

KButton::KButton(const KRect& bounds, KString caption, Action action, Enabled enabled, KString helpKey)
    : KControl(bounds), caption_(std::move(caption)), action_(std::move(action)), isEnabled_(std::move(enabled)),
      helpKey_(std::move(helpKey)) {
  if (isEnabled_) enabled_ = isEnabled_();
}

void KButton::SetCaption(const KString& caption) {
  if (caption == caption_) return;
  caption_ = caption;
  Invalidate();
}

void KButton::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  drawer.FillRoundRectangle(r, 4, pressed_ ? style.Get(KStyle::kControlHover) : style.Get(KStyle::kControlFace), 255,
                            kDrawBlend);
  drawer.AlignedTextOut(r, caption_, style.LabelFont(), enabled_ ? style.Get(KStyle::kText) : style.Get(KStyle::kTextDim),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
}

bool KButton::OnMouseDown(const KMouseEvent&) {
  if (!enabled_) return true;
  pressed_ = true;
  Invalidate();
  return true;
}

void KButton::OnMouseUp(const KMouseEvent& event) {
  if (!pressed_) return;
  pressed_ = false;
  Invalidate();
  if (KContains(Bounds(), event.at) && action_) action_();
}

void KButton::SetCaptionSource(std::function<KString()> source) {
  captionSource_ = std::move(source);
  SetCaption(captionSource_());
}

void KButton::OnTimer() {
  if (captionSource_) SetCaption(captionSource_());
  if (!isEnabled_) return;
  const bool enabled = isEnabled_();
  if (enabled == enabled_) return;
  enabled_ = enabled;
  Invalidate();
}

int32_t KDropDown::Choice() const noexcept {
  return static_cast<int32_t>(std::lround(Link().Value() * std::max(1, Link().Parameter().Steps())));
}

void KDropDown::Choose(int32_t choice) {
  const int32_t steps = std::max(1, Link().Parameter().Steps());
  Link().Change(std::clamp(choice, 0, steps) / double(steps));
  Invalidate();
}

void KDropDown::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  drawer.AlignedTextOut(KControlPaint::Top(r, 16), Label(), style.LabelFont(), style.Get(KStyle::kText),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
  const KRect box{r.left + 2, r.top + 20, r.right - 2, r.top + 43};
  drawer.FillRoundRectangle(box, 4, style.Get(KStyle::kControlFace), 255, kDrawBlend);
  drawer.AlignedTextOut({box.left + 8, box.top, box.right - 18, box.bottom}, ValueText(), style.ValueFont(),
                        style.Get(KStyle::kValueText), kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  const double ax = box.right - 11, ay = (box.top + box.bottom) / 2.0;
  drawer.FillTriangle({ax - 4, ay - 2}, {ax + 4, ay - 2}, {ax, ay + 3}, style.Get(KStyle::kAccent), 255, kDrawBlend);
}

bool KDropDown::OnMouseDown(const KMouseEvent&) {
  KControlTree* tree = Tree();
  if (!tree) return false;
  const int32_t steps = std::max(1, Link().Parameter().Steps());
  std::vector<KString> items;
  for (int32_t i = 0; i <= steps; ++i) items.push_back(Link().Parameter().TextForNormalized(i / double(steps)));
  const KRect& r = Bounds();
  KControl& menu = tree->Root().Add(std::make_unique<KPopupMenu>(tree->Root().Bounds(), KRect{r.left, r.top + 20, r.right, r.top + 43},
                                                                 std::move(items), Choice(), [this](int32_t i) { Choose(i); }));
  tree->SetFocus(&menu);
  return true;  // the menu takes the following clicks
}

bool KDropDown::OnWheel(const KMouseEvent& event) {
  if (event.wheel != 0) Choose(Choice() + (event.wheel > 0 ? -1 : 1));
  return true;
}
