#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/flanger/KFlangerPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape spread", 2},
    {"Comb", "delay depth feedback mix", 2},
};
// The comb's delay in milliseconds: the base delay plus the part of the depth the LFO is at.
double CombDelay(const KAudioPlugin& plugin, double lfo) {
  const double delay = plugin.GetParameter(KFlangerPlugin::kDelay).Working(), depth = plugin.GetParameter(KFlangerPlugin::kDepth).Working();
  return 1000.0 * (delay + depth * (0.5 + 0.5 * lfo));
}
}  // namespace

KEditorDescription KFlangerEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft,
                                KLFOGraph({19, 0, {{5, "5 ms"}, {10, "10 ms"}, {15, "15 ms"}}}, &CombDelay, "depth"));
}
