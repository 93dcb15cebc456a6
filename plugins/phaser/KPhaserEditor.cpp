#include "plugins/KPluginEditors.h"
#include "plugins/phaser/KPhaserPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape spread", 2},
    {"Sweep", "stages low high feedback mix", 3},
};
}  // namespace

KEditorDescription KPhaserEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KPhaserPlugin::kLFO));
}
