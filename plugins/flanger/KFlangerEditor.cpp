#include "plugins/KPluginEditors.h"
#include "plugins/flanger/KFlangerPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape spread", 2},
    {"Comb", "delay depth feedback mix", 2},
};
}  // namespace

KEditorDescription KFlangerEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KFlangerPlugin::kLFO));
}
