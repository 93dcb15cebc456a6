#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/tremolo/KTremoloPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape smoothing", 2},
    {"Level", "depth spread", 2},
};
// The level in percent: full at the LFO's top, 100 − depth at its bottom.
double Level(const KAudioPlugin& plugin, double lfo) {
  return 100.0 - plugin.GetParameter(KTremoloPlugin::kDepth).Working() * (0.5 - 0.5 * lfo);
}
}  // namespace

KEditorDescription KTremoloEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft,
                                KLFOGraph({112, -4, {{25, "25 %"}, {50, "50 %"}, {75, "75 %"}, {100, "100 %"}}}, &Level, "depth"));
}
