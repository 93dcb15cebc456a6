#include "plugins/KPluginEditors.h"
#include "plugins/reverb/KReverbPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Room", "predelay decay size damping", 4},
    {"Output", "width mix", 2},
};
}  // namespace

KEditorDescription KReverbEditor() { return KEditorDescription::Of(kSections); }
