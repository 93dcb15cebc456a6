#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/chorus/KChorusPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync depth spread", 2},
    {"Voices", "delay voices mix", 3},
};
// The first voice's delay in milliseconds: the base delay plus the part of the depth the LFO is at.
double VoiceDelay(const KAudioPlugin& plugin, double lfo) {
  const double delay = plugin.GetParameter(KChorusPlugin::kDelay).Working(), depth = plugin.GetParameter(KChorusPlugin::kDepth).Working();
  return 1000.0 * (delay + depth * (0.5 + 0.5 * lfo));
}
}  // namespace

KEditorDescription KChorusEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft,
                                KLFOGraph({52, 0, {{10, "10 ms"}, {20, "20 ms"}, {30, "30 ms"}, {40, "40 ms"}}}, &VoiceDelay, "depth"));
}
