#pragma once

#include "ui/controls/KControl.h"

// The help window over the editor: a control's help in help-text mark-up, laid out on a card in
// the middle of the window. It takes the whole window so that a click anywhere or any key
// closes it.
class KHelpPanel final : public KControl {
public:
  static constexpr int32_t kWidth = 420;
  KHelpPanel(const KRect& window, const KString& markup);

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  bool OnKey(const KKeyEvent& event) override;
  bool IsFocusable() const noexcept override { return true; }
  const KString& Markup() const noexcept { return markup_; }
  const KRect& Card() const noexcept { return card_; }

private:
  void Close();
  KString markup_;
  KRect card_;
  int32_t textHeight_ = 0;
};
