#include "ui/editor/KEditorPanels.h"

#include "ui/controls/KStyle.h"

void KEditorBackground::Paint(KDrawer& drawer, const KStyle& style) {
  if (const KBitmap* texture = style.BackgroundBitmap())
    drawer.PatBlt(Bounds(), *texture, texture->Bounds(), 255, kDrawCopy);
  else
    drawer.FillRectangleGradient(Bounds(), style.Get(KStyle::kBackground), style.Get(KStyle::kHeader), KGradient::Vertical, 255,
                                 kDrawCopy);
}

void KEditorBackground::PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) {
  // Only sections and the title bar lie on the background, and they repaint whole: a plain fill
  // serves for the rare control placed on it directly.
  drawer.FillRectangle(area, style.Get(KStyle::kBackground), 255, kDrawCopy);
}

void KSectionPanel::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  const double radius = style.Get(KStyle::kRadius);
  drawer.FillRoundRectangle({r.left, r.top + 1, r.right, r.bottom + 2}, radius, 0x50000000, 255, kDrawBlend);
  drawer.FillRoundRectangle(r, radius, style.Get(KStyle::kPanel), 255, kDrawBlend);
  drawer.RoundRectangle(r, radius, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
  drawer.AlignedTextOut({r.left + 12, r.top + 2, r.right - 12, r.top + kTitleHeight}, title_, style.LabelFont().WithStyle(KFontStyle::Bold),
                        style.Get(KStyle::kTextDim), kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  drawer.Line({r.left + 12, r.top + kTitleHeight}, {r.right - 12, r.top + kTitleHeight}, style.Get(KStyle::kPanelBorder), 255,
              kDrawBlend);
}

void KSectionPanel::PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) {
  drawer.FillRectangle(area, style.Get(KStyle::kPanel), 255, kDrawCopy);
}

void KHeaderBar::Paint(KDrawer& drawer, const KStyle& style) {
  const KRect& r = Bounds();
  drawer.FillRectangle(r, style.Get(KStyle::kHeader), 255, kDrawCopy);
  drawer.FillRectangle({r.left, r.bottom, r.right, r.bottom}, style.Get(KStyle::kPanelBorder), 255, kDrawCopy);
  // The accent stripe at the left edge.
  drawer.FillRectangle({r.left, r.top, r.left + 3, r.bottom - 1}, style.Get(KStyle::kAccent), 255, kDrawCopy);
}

void KHeaderBar::PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) {
  drawer.FillRectangle(area, style.Get(KStyle::kHeader), 255, kDrawCopy);
}
