#include "plugins/KPluginEditors.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Level and image", "gain balance width", 3},
    {"Channels", "invertleft invertright swap mono mute", 1},
};
}  // namespace

KEditorDescription KUtilityEditor() { return KEditorDescription::Of(kSections); }
