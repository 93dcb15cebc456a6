#include "ui/controls/KLabels.h"

#include "ui/controls/KStyle.h"

void KTextLabel::SetText(const KString& text) {
  if (text == text_) return;
  text_ = text;
  Invalidate();
}

void KTextLabel::Paint(KDrawer& drawer, const KStyle& style) {
  drawer.AlignedTextOut(Bounds(), text_, kind_ == kTitle ? style.TitleFont() : style.LabelFont(),
                        kind_ == kTitle ? style.Get(KStyle::kText) : style.Get(KStyle::kTextDim), alignment_, 255, kDrawBlend);
}

void KValueLabel::Paint(KDrawer& drawer, const KStyle& style) {
  drawer.AlignedTextOut(Bounds(), Label(), style.LabelFont(), style.Get(KStyle::kTextDim),
                        kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  drawer.AlignedTextOut(Bounds(), ValueText(), style.ValueFont(), style.Get(KStyle::kValueText),
                        kAlignRight | kAlignMiddle, 255, kDrawBlend);
}
