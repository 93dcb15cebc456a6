#include "ui/controls/KParameterControl.h"

void KParameterControl::SetLabel(const KString& label) {
  if (label == label_) return;
  label_ = label;
  Invalidate();
}

KString KParameterControl::ValueText() const {
  KString text = link_.Parameter().Text();
  const KString unit = link_.Parameter().Unit();
  if (!unit.IsEmpty()) text.Append(u' ').Append(unit);
  return text;
}

void KParameterControl::OnTimer() {
  KString name;
  if (link_.Parameter().Kind().CurrentName(name)) SetLabel(name);
  if (link_.TakeOutsideChange()) Invalidate();
}
