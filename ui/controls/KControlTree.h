#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "ui/controls/KControl.h"

// The root of an editor's controls and its event dispatch: the mouse goes to the control under
// it or to the one that captured it, keys to the focused control and then up its parents, the
// tick to every control. It keeps the dirty region, so that a repaint paints only the controls
// that asked for it (over the backdrop of their parents) and the window presents only that area.
class KControlTree {
public:
  static constexpr uint64_t kDoubleClickMs = 400;
  static constexpr int32_t kDoubleClickDistance = 4;

  explicit KControlTree(const KRect& bounds);
  ~KControlTree();
  KControl& Root() noexcept { return *root_; }
  const KStyle* Style() const noexcept { return style_; }
  void SetStyle(const KStyle& style) noexcept;

  // ---- events, in logical coordinates; `timeMs` is a millisecond clock that tells a double
  // click from two clicks. Answers whether a control took the event.
  bool MouseDown(const KMouseEvent& event, uint64_t timeMs);
  void MouseMove(const KMouseEvent& event);
  void MouseUp(const KMouseEvent& event);
  bool Wheel(const KMouseEvent& event);
  bool Key(const KKeyEvent& event);
  void Tick();
  KControl* Captured() const noexcept { return captured_; }
  KControl* Focused() const noexcept { return focused_; }
  void SetFocus(KControl* control);
  KPoint MousePosition() const noexcept { return mouse_; }
  // Removes a child of the root once the event being dispatched is done (a pop-up closing
  // itself from its own handler).
  void Dismiss(KControl& control);

  // ---- painting
  // The area that needs repainting (empty when nothing does).
  const KRect& DirtyArea() const noexcept { return dirtyArea_; }
  bool NeedsPaint() const noexcept { return !dirtyArea_.IsEmpty(); }
  // Paints every dirty control and everything inside it; answers the area painted.
  KRect Paint(KDrawer& drawer);
  // Everything again.
  void InvalidateAll() noexcept;
  // Repaints whatever lies in `area` (used when a pop-up leaves).
  void InvalidateArea(const KRect& area) noexcept;

private:
  friend class KControl;
  void AddDirty(const KRect& area) noexcept { dirtyArea_ = KUnion(dirtyArea_, area); }
  // A control leaves the tree: it must not stay captured, focused or hovered.
  void Forget(const KControl& control) noexcept;
  void RemoveDismissed();
  void PaintControl(KControl& control, KDrawer& drawer, bool forced, KRect& painted);

  std::unique_ptr<KControl> root_;
  const KStyle* style_ = nullptr;
  KControl* captured_ = nullptr;
  KControl* focused_ = nullptr;
  KPoint mouse_{};
  KRect dirtyArea_{};
  uint64_t lastClickMs_ = 0;
  KPoint lastClick_{};
  bool clickPending_ = false;
  std::vector<KControl*> dismissed_;
};
