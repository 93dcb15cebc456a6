#include "plugins/KPluginEditors.h"
#include "plugins/transient/KTransientShaperPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Shape", "attack sustain", 2},
    {"Output", "outputgain", 1},
};
}  // namespace

KEditorDescription KTransientShaperEditor() { return KEditorDescription::Of(kSections); }
