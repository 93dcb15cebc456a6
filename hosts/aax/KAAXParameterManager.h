#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/aax/KAAXBase.h"
#include "kernel/KString.h"

namespace KAAX {

// One parameter as the host sees it: a text identifier, a name, a normalised value and its
// display. Continuous parameters show through `toText`; two-state ones as "On" and "Off".
class KParameter {
public:
  enum class Type { kContinuous, kTwoState };
  using ToText = std::function<KString(double normalized)>;

  KParameter(std::string id, KString name, Type type, double normalizedDefault, bool automatable, ToText toText);

  const std::string& Id() const noexcept { return id_; }
  const KString& Name() const noexcept { return name_; }
  Type GetType() const noexcept { return type_; }
  bool IsAutomatable() const noexcept { return automatable_; }
  double DefaultNormalized() const noexcept { return default_; }
  double Normalized() const noexcept { return value_.load(std::memory_order_acquire); }
  // Clamped to 0..1; a two-state parameter takes 0 or 1.
  void SetNormalized(double normalized) noexcept;
  KString Text(double normalized) const;

private:
  std::string id_;
  KString name_;
  Type type_;
  double default_;
  bool automatable_;
  ToText toText_;
  std::atomic<double> value_;
};

// The parameters of one effect, in the order they were added; filled once at EffectInit.
class KParameterManager {
public:
  KParameter& Add(std::unique_ptr<KParameter> parameter);
  // Null for an identifier nobody added.
  KParameter* Find(std::string_view id) noexcept;
  const KParameter* Find(std::string_view id) const noexcept;
  int32_t Count() const noexcept { return static_cast<int32_t>(parameters_.size()); }
  KParameter& At(int32_t index) noexcept { return *parameters_[static_cast<size_t>(index)]; }
  const KParameter& At(int32_t index) const noexcept { return *parameters_[static_cast<size_t>(index)]; }

private:
  std::vector<std::unique_ptr<KParameter>> parameters_;
};

}  // namespace KAAX
