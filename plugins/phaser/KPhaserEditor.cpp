#include <cmath>

#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/phaser/KPhaserPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape spread", 2},
    {"Sweep", "stages low high feedback mix", 3},
};
// The stages' corner, as log2 of hertz: the sweep runs evenly in octaves from low to high.
double Corner(const KAudioPlugin& plugin, double lfo) {
  const double low = std::log2(plugin.GetParameter(KPhaserPlugin::kLow).Working());
  const double high = std::log2(plugin.GetParameter(KPhaserPlugin::kHigh).Working());
  return low + (high - low) * (0.5 + 0.5 * lfo);
}
}  // namespace

KEditorDescription KPhaserEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KFrequencyCycleAxes(), &Corner, "low"));
}
