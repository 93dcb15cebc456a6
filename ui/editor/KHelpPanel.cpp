#include "ui/editor/KHelpPanel.h"

#include <algorithm>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextLayout.h"
#include "ui/KRichTextRenderer.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KStyle.h"

namespace {

constexpr int32_t kMargin = 14;

}  // namespace

KHelpPanel::KHelpPanel(const KRect& window, const KString& markup) : KControl(window), markup_(markup) {
  const int32_t width = std::min<int32_t>(kWidth, static_cast<int32_t>(window.Width()) - 24);
  const KRichTextLayout layout(KRenderHelpMarkup(markup_), width - 2 * kMargin);
  textHeight_ = layout.Height();
  const int32_t height = std::min<int32_t>(textHeight_ + 2 * kMargin, static_cast<int32_t>(window.Height()) - 24);
  const int32_t left = window.left + (static_cast<int32_t>(window.Width()) - width) / 2;
  const int32_t top = window.top + (static_cast<int32_t>(window.Height()) - height) / 2;
  card_ = {left, top, left + width - 1, top + height - 1};
}

void KHelpPanel::Paint(KDrawer& drawer, const KStyle& style) {
  // Opaque throughout: the card is painted again whenever something under it repaints.
  drawer.FillRectangle(KInset(card_, -3), style.Get(KStyle::kHeader), 255, kDrawCopy);
  drawer.FillRoundRectangle(card_, 8, 0xFFFFFFFF, 255, kDrawBlend);
  drawer.RoundRectangle(card_, 8, style.Get(KStyle::kAccent), 255, kDrawBlend);
  const KRichTextLayout layout(KRenderHelpMarkup(markup_), static_cast<int32_t>(card_.Width()) - 2 * kMargin, drawer.Scale());
  layout.Draw(drawer, {card_.left + kMargin, card_.top + kMargin});
}

bool KHelpPanel::OnMouseDown(const KMouseEvent&) {
  Close();
  return true;
}

bool KHelpPanel::OnKey(const KKeyEvent&) {
  Close();
  return true;
}

void KHelpPanel::Close() {
  if (KControlTree* tree = Tree()) {
    if (tree->Focused() == this) tree->SetFocus(nullptr);
    tree->Dismiss(*this);
  }
}
