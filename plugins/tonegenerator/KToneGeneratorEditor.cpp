#include "plugins/KPluginEditors.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Tone", "waveform frequency level", 3},
    {"Output", "output play", 1},
};
}  // namespace

KEditorDescription KToneGeneratorEditor() { return KEditorDescription::Of(kSections); }
