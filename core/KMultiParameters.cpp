#include "core/KMultiParameters.h"

#include <algorithm>
#include <cmath>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "core/KStateSection.h"

namespace {
const KString kMultiParameter = KString::Static("MultiParameter");
const KString kTarget = KString::Static("Target");
const KString kValue = KString::Static("Value");

double NumberOf(const Element& element, const char* name, double fallback) {
  return KStateSection::ReadNumber(element, KString::Static(name), fallback);
}
}  // namespace

double KMultiParameters::TargetValue(const Target& target, double position) noexcept {
  const double shaped = std::pow(std::clamp(position, 0.0, 1.0), target.curve);
  return std::clamp(target.from + (target.to - target.from) * shaped, 0.0, 1.0);
}

void KMultiParameters::Read(const Element& section, KAudioPluginBase& plugin) {
  controls_.clear();
  for (int32_t c = 0; c < section.ChildCount(); ++c) {
    const Element& child = section.GetChild(c);
    if (child.GetName() != kMultiParameter) continue;
    Control control{child.GetAttribute(KString::Static("Name")), std::clamp(NumberOf(child, "Value", 0.0), 0.0, 1.0), c, {}};
    for (int32_t t = 0; t < child.ChildCount(); ++t) {
      const Element& entry = child.GetChild(t);
      if (entry.GetName() != kTarget) continue;
      const KAudioPluginBase::Parameter* parameter = plugin.FindParameter(entry.GetAttribute(KString::Static("Parameter")));
      if (!parameter) continue;
      const double curve = NumberOf(entry, "Curve", 1.0);
      control.targets.push_back({parameter->Index(), std::clamp(NumberOf(entry, "From", 0.0), 0.0, 1.0),
                                 std::clamp(NumberOf(entry, "To", 1.0), 0.0, 1.0), curve > 0.0 ? curve : 1.0});
    }
    controls_.push_back(std::move(control));
  }
}

void KMultiParameters::Move(int32_t index, double value, int32_t glideSamples, KAudioPluginBase& plugin, Element& section) {
  if (index < 0 || index >= Count()) return;
  Control& control = controls_[index];
  value = std::clamp(value, 0.0, 1.0);
  const double start = control.value;
  const int32_t corners = glideSamples > 1 ? kGlidePoints : 2;
  const int32_t length = std::max(glideSamples, 1);
  KAudioPluginBase::RampPoint points[kGlidePoints];
  for (const Target& target : control.targets) {
    for (int32_t k = 0; k < corners; ++k) {
      const double along = static_cast<double>(k) / (corners - 1);
      points[k] = {static_cast<int32_t>(std::lround(length * along)), TargetValue(target, start + (value - start) * along)};
    }
    plugin.PostRamp(target.parameter, std::span(points, static_cast<size_t>(corners)), true);
  }
  control.value = value;
  KStateSection(section.GetChild(control.child), KAudioPlugin::kStore | KAudioPlugin::kRemoveDefaults)
      .ExactNumber(kValue, control.value, 0.0);
}
