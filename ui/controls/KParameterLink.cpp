#include "ui/controls/KParameterLink.h"

#include <algorithm>
#include <cmath>
#include <vector>

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

void KChangeParameters(KAudioPlugin& plugin, KEditorHost* host, const std::function<void()>& change) {
  std::vector<double> before(static_cast<size_t>(plugin.ParameterCount()));
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) before[static_cast<size_t>(i)] = plugin.GetParameter(i).Normalized();
  change();
  if (!host) return;
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) {
    const double now = plugin.GetParameter(i).Normalized();
    if (now == before[static_cast<size_t>(i)]) continue;
    host->BeginEdit(i);
    host->PerformEdit(i, now);
    host->EndEdit(i);
  }
}
