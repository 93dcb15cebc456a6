#pragma once

#include "ui/controls/KControl.h"

// The editor's backdrop: the window's colour (and the skin's texture, when it has one).
class KEditorBackground : public KControl {
public:
  using KControl::KControl;
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) override;
};

// A framed section with its title; controls inside it repaint over its solid face.
class KSectionPanel final : public KControl {
public:
  static constexpr int32_t kTitleHeight = 26;
  KSectionPanel(const KRect& bounds, KString title) : KControl(bounds), title_(std::move(title)) {}
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) override;

private:
  KString title_;
};

// The title bar's face.
class KHeaderBar final : public KControl {
public:
  using KControl::KControl;
  void Paint(KDrawer& drawer, const KStyle& style) override;
  void PaintBackdrop(KDrawer& drawer, const KStyle& style, const KRect& area) override;
};
