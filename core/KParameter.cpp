#include "core/KParameter.h"

#include "core/KAudioPluginHost.h"

KParameterValue::KParameterValue(KAudioPluginBase& owner, const KValueKind& kind, double normalized) noexcept
    : owner_(owner), kind_(kind), normalized_(normalized) {}

void KParameterValue::SetNormalized(double normalized) noexcept {
  normalized = normalized > 0.0 ? (normalized < 1.0 ? normalized : 1.0) : 0.0;  // NaN becomes 0
  if (normalized_.exchange(normalized, std::memory_order_acq_rel) != normalized) owner_.MarkUpdatePending();
}

void KParameterValue::SetModulation(double offset) noexcept {
  if (modulation_.exchange(offset, std::memory_order_relaxed) != offset) owner_.MarkUpdatePending();
}

KAudioPluginBase::Parameter::Parameter(KAudioPluginBase& owner, int32_t index, const KParameterInfo& info)
    : owner_(owner), index_(index), info_(info), value_(owner, *info.kind, info.kind->ToNormalized(info.defaultValue)) {}

bool KAudioPluginBase::Parameter::NormalizedFromText(const KString& text, double& normalized) const {
  double working;
  if (!info_.kind->FromText(text, working)) return false;
  normalized = info_.kind->ToNormalized(working);
  return true;
}

void KAudioPluginBase::Parameter::TouchAutomation(int32_t kind) {
  if (KAudioPluginHost* host = owner_.Interface()) host->GestureNotice(index_, kind);
}
