#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/autopan/KAutoPanPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape smoothing", 2},
    {"Balance", "width", 1},
};
// The balance, −1 left to +1 right.
double Balance(const KAudioPlugin& plugin, double lfo) { return plugin.GetParameter(KAutoPanPlugin::kWidth).Working() / 100.0 * lfo; }
}  // namespace

KEditorDescription KAutoPanEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft,
                                KLFOGraph({1.15, -1.15, {{-1, "L"}, {0, "C"}, {1, "R"}}}, &Balance, "width"));
}
