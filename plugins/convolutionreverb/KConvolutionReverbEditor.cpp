#include "plugins/KPluginEditors.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Space", "impulse", 1},
    {"Mix", "mix wetlevel width", 3},
};
}  // namespace

KEditorDescription KConvolutionReverbEditor() { return KEditorDescription::Of(kSections); }
