#pragma once

#include <functional>
#include <vector>

#include "ui/controls/KControl.h"

// A field to type a value into, over another control's text. Return (or a click elsewhere)
// hands the text to `commit`; Escape closes it without. It removes itself either way.
class KTextField final : public KControl {
public:
  using Commit = std::function<void(const KString& text)>;
  KTextField(const KRect& bounds, const KString& text, Commit commit);
  const KString& Text() const noexcept { return text_; }

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnKey(const KKeyEvent& event) override;
  bool OnMouseDown(const KMouseEvent&) override { return true; }
  bool IsFocusable() const noexcept override { return true; }
  void OnFocusChanged(bool focused) override;

private:
  void Close(bool accept);
  KString text_;
  Commit commit_;
  bool closed_ = false;
};

// A list of choices over the whole window, opened below (or above) an anchor: a click on an
// item hands its index to `choose`; a click anywhere else, or Escape, closes it. Up, Down and
// Return choose with the keyboard. Items marked as headings title the items below them: drawn
// dim, never highlighted, never chosen.
class KPopupMenu final : public KControl {
public:
  using Choose = std::function<void(int32_t index)>;
  static constexpr int32_t kItemHeight = 22;

  KPopupMenu(const KRect& window, const KRect& anchor, std::vector<KString> items, int32_t current, Choose choose);
  const KRect& ListArea() const noexcept { return list_; }
  int32_t ItemCount() const noexcept { return static_cast<int32_t>(items_.size()); }
  const KString& Item(int32_t index) const noexcept { return items_[static_cast<size_t>(index)]; }
  void MarkHeading(int32_t index);
  bool IsHeading(int32_t index) const noexcept;
  int32_t Highlighted() const noexcept { return highlighted_; }

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  void OnMouseMove(const KMouseEvent& event) override;
  bool OnKey(const KKeyEvent& event) override;
  bool IsFocusable() const noexcept override { return true; }

private:
  int32_t ItemAt(KPoint at) const noexcept;
  void Close(int32_t chosen);
  std::vector<KString> items_;
  std::vector<bool> headings_;
  KRect list_;
  int32_t highlighted_;
  Choose choose_;
};
