#include "plugins/KPluginEditors.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Mid and side", "midgain sidegain", 2},
    {"Routing", "listen mode", 2},
};
}  // namespace

KEditorDescription KMidSideEditor() { return KEditorDescription::Of(kSections); }
