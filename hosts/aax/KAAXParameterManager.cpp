#include "hosts/aax/KAAXParameterManager.h"

#include <algorithm>
#include <utility>

namespace KAAX {

KParameter::KParameter(std::string id, KString name, Type type, double normalizedDefault, bool automatable, ToText toText)
    : id_(std::move(id)), name_(std::move(name)), type_(type), default_(normalizedDefault), automatable_(automatable),
      toText_(std::move(toText)), value_(0.0) {
  SetNormalized(normalizedDefault);
}

void KParameter::SetNormalized(double normalized) noexcept {
  const double clamped = std::clamp(normalized, 0.0, 1.0);
  value_.store(type_ == Type::kTwoState ? (clamped >= 0.5 ? 1.0 : 0.0) : clamped, std::memory_order_release);
}

KString KParameter::Text(double normalized) const {
  if (type_ == Type::kTwoState) return normalized >= 0.5 ? KString("On") : KString("Off");
  return toText_ ? toText_(std::clamp(normalized, 0.0, 1.0)) : KString();
}

KParameter& KParameterManager::Add(std::unique_ptr<KParameter> parameter) {
  parameters_.push_back(std::move(parameter));
  return *parameters_.back();
}

KParameter* KParameterManager::Find(std::string_view id) noexcept {
  for (const auto& parameter : parameters_)
    if (parameter->Id() == id) return parameter.get();
  return nullptr;
}

const KParameter* KParameterManager::Find(std::string_view id) const noexcept {
  return const_cast<KParameterManager*>(this)->Find(id);
}

}  // namespace KAAX
