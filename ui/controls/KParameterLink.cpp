#include "ui/controls/KParameterLink.h"

#include <algorithm>
#include <cmath>

#include "ui/controls/KEditorHost.h"

double KParameterLink::Snap(double normalized) const noexcept {
  normalized = std::clamp(normalized, 0.0, 1.0);
  const int32_t steps = Parameter().Steps();
  return steps > 0 ? std::round(normalized * steps) / steps : normalized;
}

void KParameterLink::Begin() {
  if (depth_++ == 0 && host_) host_->BeginEdit(index_);
}

void KParameterLink::Set(double normalized) {
  normalized = Snap(normalized);
  const double before = Value();
  if (normalized == before) return;
  // The history keeps the value from before the change; changes within its window merge.
  plugin_.UndoStore(index_, before);
  Parameter().SetNormalized(normalized);
  shown_ = Value();
  if (host_) host_->PerformEdit(index_, shown_);
}

void KParameterLink::End() {
  if (depth_ == 0) return;
  if (--depth_ == 0 && host_) host_->EndEdit(index_);
}

void KParameterLink::Change(double normalized) {
  Begin();
  Set(normalized);
  End();
}

bool KParameterLink::TakeOutsideChange() noexcept {
  const double value = Value();
  if (value == shown_) return false;
  shown_ = value;
  return true;
}
