#include "plugins/KPluginEditors.h"
#include "plugins/autofilter/KAutoFilterPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Filter", "type cutoff resonance depth", 2},
    {"Modulation", "rate sync shape spread", 2},
};
}  // namespace

KEditorDescription KAutoFilterEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KAutoFilterPlugin::kLFO));
}
