#pragma once

#include "ui/controls/KControl.h"
#include "ui/controls/KParameterControl.h"

// Fixed text: section titles, captions.
class KTextLabel final : public KControl {
public:
  enum Kind { kCaption, kTitle };
  KTextLabel(const KRect& bounds, KString text, Kind kind = kCaption, uint32_t alignment = kAlignLeft | kAlignMiddle)
      : KControl(bounds), text_(std::move(text)), kind_(kind), alignment_(alignment) {}
  void SetText(const KString& text);
  const KString& Text() const noexcept { return text_; }
  void Paint(KDrawer& drawer, const KStyle& style) override;

private:
  KString text_;
  Kind kind_;
  uint32_t alignment_;
};

// A parameter's name and present display text on one line, following its value.
class KValueLabel final : public KParameterControl {
public:
  using KParameterControl::KParameterControl;
  void Paint(KDrawer& drawer, const KStyle& style) override;
};
