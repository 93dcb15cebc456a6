#include "plugins/KPluginEditors.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Image", "width lowwidth crossover", 3},
};
}  // namespace

KEditorDescription KStereoImagerEditor() { return KEditorDescription::Of(kSections); }
