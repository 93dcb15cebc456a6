#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "kernel/KString.h"
#include "ui/KDrawer.h"
#include "ui/controls/KControlEvents.h"

class KControlTree;
class KStyle;

// One element of an editor: a rectangle of the window that paints itself and answers events.
// Controls form a tree; a parent owns its children, which lie inside its bounds and do not
// overlap each other (pop-ups are children of the root, painted last). Coordinates are logical
// and absolute (the window's), so hit testing and painting need no translation.
class KControl {
public:
  explicit KControl(const KRect& bounds = {}) noexcept : bounds_(bounds) {}
  KControl(const KControl&) = delete;
  KControl& operator=(const KControl&) = delete;
  virtual ~KControl();

  const KRect& Bounds() const noexcept { return bounds_; }
  // Moves the control; its old and new places are repainted.
  void SetBounds(const KRect& bounds);
  bool IsVisible() const noexcept { return visible_; }
  void SetVisible(bool visible);

  // ---- the tree
  KControl* Parent() const noexcept { return parent_; }
  KControlTree* Tree() const noexcept;
  template <class T, class... Args>
  T& Emplace(Args&&... args) {
    return static_cast<T&>(Add(std::make_unique<T>(std::forward<Args>(args)...)));
  }
  KControl& Add(std::unique_ptr<KControl> child);
  // Removes and destroys a child; its area is repainted.
  void Remove(KControl& child);
  int32_t ChildCount() const noexcept { return static_cast<int32_t>(children_.size()); }
  KControl& Child(int32_t index) const noexcept { return *children_[static_cast<size_t>(index)]; }
  // The deepest visible control under `at` that takes the point, or null.
  KControl* FindAt(KPoint at) noexcept;

  // ---- painting
  // Asks for this control (and everything inside it) to be painted again.
  void Invalidate() noexcept;
  bool IsDirty() const noexcept { return dirty_; }
  // Paints the control alone; children paint themselves after it.
  virtual void Paint(KDrawer& /*drawer*/, const KStyle& /*style*/) {}
  // Paints what lies behind `area` of a child about to be repainted alone. The default asks the
  // parent; a control with a solid face fills the area with it.
  virtual void PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area);

  // ---- events; the tree calls them on the control under the mouse, the captured control or the
  // focused one. Answers of true: the event was taken (mouse down: the control captures the mouse
  // until the button is released).
  virtual bool HitTest(KPoint at) const noexcept { return KContains(bounds_, at); }
  virtual bool OnMouseDown(const KMouseEvent& /*event*/) { return false; }
  virtual void OnMouseMove(const KMouseEvent& /*event*/) {}
  virtual void OnMouseUp(const KMouseEvent& /*event*/) {}
  virtual bool OnDoubleClick(const KMouseEvent& /*event*/) { return false; }
  virtual bool OnWheel(const KMouseEvent& /*event*/) { return false; }
  virtual bool OnKey(const KKeyEvent& /*event*/) { return false; }
  // The tree's periodic tick: follow values that change elsewhere (automation, meters).
  virtual void OnTimer() {}
  virtual bool IsFocusable() const noexcept { return false; }
  virtual void OnFocusChanged(bool /*focused*/) {}
  // The key of the help shown for this control on F1; empty: the parent's.
  virtual KString HelpKey() const { return {}; }

private:
  friend class KControlTree;
  void SetTree(KControlTree* tree) noexcept;
  void MarkClean() noexcept;

  KRect bounds_;
  KControl* parent_ = nullptr;
  KControlTree* tree_ = nullptr;  // set on the root, read through the parents
  std::vector<std::unique_ptr<KControl>> children_;
  bool visible_ = true;
  bool dirty_ = true;
};
