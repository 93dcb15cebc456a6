#include "plugins/KPluginEditors.h"
#include "plugins/tremolo/KTremoloPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape smoothing", 2},
    {"Level", "depth spread", 2},
};
}  // namespace

KEditorDescription KTremoloEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KTremoloPlugin::kLFO));
}
