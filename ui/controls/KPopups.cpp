#include "ui/controls/KPopups.h"

#include <algorithm>

#include "ui/controls/KControlTree.h"
#include "ui/controls/KStyle.h"

KTextField::KTextField(const KRect& bounds, const KString& text, Commit commit)
    : KControl(bounds), text_(text), commit_(std::move(commit)) {}

void KTextField::Paint(KDrawer& drawer, const KStyle& style) {
  drawer.FillRoundRectangle(Bounds(), 3, style.Get(KStyle::kGraphBack), 255, kDrawBlend);
  drawer.RoundRectangle(Bounds(), 3, style.Get(KStyle::kAccent), 255, kDrawBlend);
  const KFont font = style.ValueFont();
  const KRect inner = KInset(Bounds(), 3);
  drawer.AlignedTextOut(inner, text_, font, style.Get(KStyle::kValueText), kAlignCentre | kAlignMiddle, 255, kDrawBlend);
  // The caret after the text.
  const double width = font.TextWidth(text_, drawer.Scale());
  const int32_t x = static_cast<int32_t>((inner.left + inner.right + 1 + width) / 2) + 1;
  drawer.Line({x, inner.top + 2}, {x, inner.bottom - 2}, style.Get(KStyle::kAccent), 255, kDrawBlend);
}

bool KTextField::OnKey(const KKeyEvent& event) {
  if (event.key == kKeyReturn) Close(true);
  else if (event.key == kKeyEscape) Close(false);
  else if (event.key == kKeyBackspace) {
    KString shorter;
    shorter.AppendPart(text_, 0, text_.Length() - 1);
    text_ = shorter;
  }
  else if (event.key >= 32 && event.key < 0x10000 && event.key != kKeyDelete) text_.Append(static_cast<char16_t>(event.key));
  else return false;
  Invalidate();
  return true;  // every key stays here while typing
}

void KTextField::OnFocusChanged(bool focused) {
  if (!focused) Close(true);
}

void KTextField::Close(bool accept) {
  if (closed_) return;
  closed_ = true;
  KControlTree* tree = Tree();
  if (tree && tree->Focused() == this) tree->SetFocus(nullptr);
  if (accept && commit_) commit_(text_);
  if (tree) tree->Dismiss(*this);
}

KPopupMenu::KPopupMenu(const KRect& window, const KRect& anchor, std::vector<KString> items, int32_t current, Choose choose)
    : KControl(window), items_(std::move(items)), highlighted_(current), choose_(std::move(choose)) {
  const int32_t width = std::max<int32_t>(static_cast<int32_t>(anchor.Width()), 120);
  const int32_t height = ItemCount() * kItemHeight + 6;
  int32_t top = anchor.bottom + 2;
  if (top + height > window.bottom) top = std::max(window.top, anchor.top - 2 - height);
  const int32_t left = std::clamp(anchor.left, window.left, std::max(window.left, window.right - width));
  list_ = {left, top, left + width - 1, top + height - 1};
}

void KPopupMenu::MarkHeading(int32_t index) {
  if (index < 0 || index >= ItemCount()) return;
  headings_.resize(items_.size());
  headings_[static_cast<size_t>(index)] = true;
  if (highlighted_ == index) highlighted_ = -1;
}

bool KPopupMenu::IsHeading(int32_t index) const noexcept {
  return index >= 0 && static_cast<size_t>(index) < headings_.size() && headings_[static_cast<size_t>(index)];
}

int32_t KPopupMenu::ItemAt(KPoint at) const noexcept {
  if (!KContains(list_, at)) return -1;
  const int32_t index = (at.y - list_.top - 3) / kItemHeight;
  return index >= 0 && index < ItemCount() && !IsHeading(index) ? index : -1;
}

void KPopupMenu::Paint(KDrawer& drawer, const KStyle& style) {
  drawer.FillRoundRectangle({list_.left + 2, list_.top + 3, list_.right + 2, list_.bottom + 4}, 5, 0x70000000, 255, kDrawBlend);
  drawer.FillRoundRectangle(list_, 5, style.Get(KStyle::kControlFace), 255, kDrawBlend);
  drawer.RoundRectangle(list_, 5, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
  for (int32_t i = 0; i < ItemCount(); ++i) {
    const KRect row{list_.left + 3, list_.top + 3 + i * kItemHeight, list_.right - 3, list_.top + 2 + (i + 1) * kItemHeight};
    if (i == highlighted_) drawer.FillRoundRectangle(row, 3, style.Get(KStyle::kAccent), 255, kDrawBlend);
    // A heading sits at the left edge, dim, with a rule above it unless it opens the list.
    const bool heading = IsHeading(i);
    if (heading && i > 0) drawer.FillRectangle({row.left + 4, row.top, row.right - 4, row.top}, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
    const uint32_t ink = heading ? style.Get(KStyle::kTextDim) : i == highlighted_ ? style.Get(KStyle::kHeader) : style.Get(KStyle::kText);
    drawer.AlignedTextOut({row.left + (heading ? 4 : 14), row.top, row.right - 8, row.bottom}, items_[static_cast<size_t>(i)],
                          style.LabelFont(), ink, kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  }
}

bool KPopupMenu::OnMouseDown(const KMouseEvent& event) {
  Close(ItemAt(event.at));
  return true;
}

void KPopupMenu::OnMouseMove(const KMouseEvent& event) {
  const int32_t item = ItemAt(event.at);
  if (item >= 0 && item != highlighted_) {
    highlighted_ = item;
    Invalidate();
  }
}

bool KPopupMenu::OnKey(const KKeyEvent& event) {
  if (event.key == kKeyEscape) Close(-1);
  else if (event.key == kKeyReturn) Close(highlighted_);
  else if (event.key == kKeyUp || event.key == kKeyDown) {
    // Steps over headings; stays put at either end.
    const int32_t step = event.key == kKeyUp ? -1 : 1;
    for (int32_t next = highlighted_ + step; next >= 0 && next < ItemCount(); next += step) {
      if (IsHeading(next)) continue;
      highlighted_ = next;
      break;
    }
    Invalidate();
  }
  return true;
}

void KPopupMenu::Close(int32_t chosen) {
  KControlTree* tree = Tree();
  if (!tree) return;
  if (tree->Focused() == this) tree->SetFocus(nullptr);
  tree->Dismiss(*this);
  if (chosen >= 0 && choose_) choose_(chosen);
}
