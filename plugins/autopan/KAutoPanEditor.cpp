#include "plugins/KPluginEditors.h"
#include "plugins/autopan/KAutoPanPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync shape smoothing", 2},
    {"Balance", "width", 1},
};
}  // namespace

KEditorDescription KAutoPanEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KAutoPanPlugin::kLFO));
}
