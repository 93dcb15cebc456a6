#include "ui/controls/KControl.h"

#include <algorithm>

#include "ui/controls/KControlTree.h"

KControl::~KControl() = default;

KControlTree* KControl::Tree() const noexcept {
  const KControl* control = this;
  while (control->parent_) control = control->parent_;
  return control->tree_;
}

void KControl::SetBounds(const KRect& bounds) {
  if (bounds == bounds_) return;
  if (KControlTree* tree = Tree()) tree->InvalidateArea(bounds_);
  bounds_ = bounds;
  Invalidate();
}

void KControl::SetVisible(bool visible) {
  if (visible == visible_) return;
  visible_ = visible;
  if (KControlTree* tree = Tree()) {
    if (!visible) tree->Forget(*this);
    tree->InvalidateArea(bounds_);
  }
}

KControl& KControl::Add(std::unique_ptr<KControl> child) {
  child->parent_ = this;
  children_.push_back(std::move(child));
  children_.back()->Invalidate();
  return *children_.back();
}

void KControl::Remove(KControl& child) {
  const auto found = std::find_if(children_.begin(), children_.end(), [&](const auto& c) { return c.get() == &child; });
  if (found == children_.end()) return;
  if (KControlTree* tree = Tree()) {
    tree->Forget(child);
    tree->InvalidateArea(child.bounds_);
  }
  children_.erase(found);
}

KControl* KControl::FindAt(KPoint at) noexcept {
  if (!visible_ || !KContains(bounds_, at)) return nullptr;
  // Later children lie on top.
  for (auto child = children_.rbegin(); child != children_.rend(); ++child)
    if (KControl* found = (*child)->FindAt(at)) return found;
  return HitTest(at) ? this : nullptr;
}

void KControl::Invalidate() noexcept {
  dirty_ = true;
  if (KControlTree* tree = Tree()) tree->AddDirty(bounds_);
}

void KControl::PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) {
  if (parent_) parent_->PaintBackdrop(drawer, style, area);
}

void KControl::SetTree(KControlTree* tree) noexcept { tree_ = tree; }

void KControl::MarkClean() noexcept {
  dirty_ = false;
  for (auto& child : children_) child->MarkClean();
}
