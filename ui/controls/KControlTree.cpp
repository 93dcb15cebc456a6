#include "ui/controls/KControlTree.h"

#include <algorithm>
#include <cstdlib>

namespace {

// Visits every control, parents before children.
template <class F>
void ForEach(KControl& control, F&& visit) {
  visit(control);
  for (int32_t i = 0; i < control.ChildCount(); ++i) ForEach(control.Child(i), visit);
}

bool IsInside(const KControl* control, const KControl& ancestor) noexcept {
  for (; control; control = control->Parent())
    if (control == &ancestor) return true;
  return false;
}

}  // namespace

KControlTree::KControlTree(const KRect& bounds) : root_(std::make_unique<KControl>(bounds)) {
  root_->SetTree(this);
  AddDirty(bounds);
}

KControlTree::~KControlTree() = default;

void KControlTree::SetStyle(const KStyle& style) noexcept {
  style_ = &style;
  InvalidateAll();
}

bool KControlTree::MouseDown(const KMouseEvent& event, uint64_t timeMs) {
  mouse_ = event.at;
  const bool doubleClick = clickPending_ && timeMs - lastClickMs_ <= kDoubleClickMs &&
                           std::abs(event.at.x - lastClick_.x) <= kDoubleClickDistance &&
                           std::abs(event.at.y - lastClick_.y) <= kDoubleClickDistance;
  // The third click of a quick run starts a new pair.
  clickPending_ = !doubleClick;
  lastClickMs_ = timeMs;
  lastClick_ = event.at;
  KControl* target = root_->FindAt(event.at);
  if (!target) return false;
  if (target->IsFocusable()) SetFocus(target);
  // A click outside the focused control ends its editing (a text field commits).
  else if (focused_ && !IsInside(target, *focused_)) SetFocus(nullptr);
  bool taken = false;
  for (KControl* control = target; control && !taken; control = control->Parent()) {
    if (doubleClick) taken = control->OnDoubleClick(event);
    else if ((taken = control->OnMouseDown(event))) captured_ = control;
  }
  RemoveDismissed();
  return taken;
}

void KControlTree::MouseMove(const KMouseEvent& event) {
  mouse_ = event.at;
  if (captured_) captured_->OnMouseMove(event);
  RemoveDismissed();
}

void KControlTree::MouseUp(const KMouseEvent& event) {
  mouse_ = event.at;
  if (KControl* control = captured_) {
    captured_ = nullptr;
    control->OnMouseUp(event);
  }
  RemoveDismissed();
}

bool KControlTree::Wheel(const KMouseEvent& event) {
  bool taken = false;
  for (KControl* control = root_->FindAt(event.at); control && !taken; control = control->Parent())
    taken = control->OnWheel(event);
  RemoveDismissed();
  return taken;
}

bool KControlTree::Key(const KKeyEvent& event) {
  // The focused control first, then its parents, then the control under the mouse and its
  // parents (so that F1 and the editor's shortcuts work without a focus).
  bool taken = false;
  for (KControl* control = focused_; control && !taken; control = control->Parent()) taken = control->OnKey(event);
  for (KControl* control = root_->FindAt(mouse_); control && !taken; control = control->Parent())
    taken = !IsInside(focused_, *control) && control->OnKey(event);
  RemoveDismissed();
  return taken;
}

void KControlTree::Tick() {
  ForEach(*root_, [](KControl& control) {
    if (control.IsVisible()) control.OnTimer();
  });
  RemoveDismissed();
}

void KControlTree::Dismiss(KControl& control) {
  if (std::find(dismissed_.begin(), dismissed_.end(), &control) == dismissed_.end()) dismissed_.push_back(&control);
}

void KControlTree::RemoveDismissed() {
  std::vector<KControl*> leaving;
  leaving.swap(dismissed_);
  for (KControl* control : leaving) root_->Remove(*control);
}

void KControlTree::SetFocus(KControl* control) {
  if (control == focused_) return;
  KControl* previous = focused_;
  focused_ = control;
  if (previous) previous->OnFocusChanged(false);
  if (control) control->OnFocusChanged(true);
}

void KControlTree::InvalidateAll() noexcept { root_->Invalidate(); }

void KControlTree::InvalidateArea(const KRect& area) noexcept {
  // The topmost controls that meet the area repaint whole; their backdrop covers the rest.
  AddDirty(area);
  bool any = false;
  for (int32_t i = 0; i < root_->ChildCount(); ++i) {
    KControl& child = root_->Child(i);
    if (!KIntersects(child.Bounds(), area)) continue;
    if (child.ChildCount() == 0 || KUnion(child.Bounds(), area) == child.Bounds()) {
      child.Invalidate();
      any = true;
      continue;
    }
    for (int32_t j = 0; j < child.ChildCount(); ++j)
      if (KIntersects(child.Child(j).Bounds(), area)) child.Child(j).Invalidate();
    any = true;
  }
  if (!any) root_->Invalidate();
}

void KControlTree::Forget(const KControl& control) noexcept {
  if (IsInside(captured_, control)) captured_ = nullptr;
  if (IsInside(focused_, control)) focused_ = nullptr;
}

KRect KControlTree::Paint(KDrawer& drawer) {
  KRect painted{};
  if (!style_) return painted;
  PaintControl(*root_, drawer, false, painted);
  dirtyArea_ = {};
  return painted;
}

void KControlTree::PaintControl(KControl& control, KDrawer& drawer, bool forced, KRect& painted) {
  if (!control.IsVisible()) {
    control.MarkClean();
    return;
  }
  if (forced || control.IsDirty()) {
    if (!forced && control.Parent()) control.Parent()->PaintBackdrop(drawer, *style_, control.Bounds());
    control.Paint(drawer, *style_);
    painted = KUnion(painted, control.Bounds());
    control.dirty_ = false;
    for (int32_t i = 0; i < control.ChildCount(); ++i) PaintControl(control.Child(i), drawer, true, painted);
    return;
  }
  // Children may overlap an earlier sibling only at the root (pop-ups): a pop-up over something
  // just painted is painted again.
  for (int32_t i = 0; i < control.ChildCount(); ++i) {
    KControl& child = control.Child(i);
    const bool covered = &control == root_.get() && KIntersects(child.Bounds(), painted);
    PaintControl(child, drawer, covered && !child.IsDirty(), painted);
  }
}
