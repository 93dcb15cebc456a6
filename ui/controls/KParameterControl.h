#pragma once

#include "ui/controls/KControl.h"
#include "ui/controls/KParameterLink.h"

// A control bound to one parameter: its link, the label it shows (the parameter's name unless
// the editor gives a shorter one, or the name its kind gives at the moment), its help key, and
// following the value and that name on the tree's tick.
class KParameterControl : public KControl {
public:
  KParameterControl(const KRect& bounds, KParameterLink link) : KControl(bounds), link_(link), label_(link.Parameter().Name()) {}

  KParameterLink& Link() noexcept { return link_; }
  const KParameterLink& Link() const noexcept { return link_; }
  const KString& Label() const noexcept { return label_; }
  void SetLabel(const KString& label);
  // The value as the parameter displays it, with its unit.
  KString ValueText() const;

  void OnTimer() override;
  KString HelpKey() const override { return link_.Parameter().Key(); }

private:
  KParameterLink link_;
  KString label_;
};
