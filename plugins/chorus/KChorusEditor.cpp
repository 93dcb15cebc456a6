#include "plugins/KPluginEditors.h"
#include "plugins/chorus/KChorusPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Modulation", "rate sync depth spread", 2},
    {"Voices", "delay voices mix", 3},
};
}  // namespace

KEditorDescription KChorusEditor() {
  return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, KLFOGraph(KChorusPlugin::kLFO));
}
