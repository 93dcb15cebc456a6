#include "plugins/KPluginEditors.h"
#include "plugins/delay/KDelayPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Time", "time sync feedback", 3},
    {"Repeats", "lowcut highcut pingpong", 3},
    {"Output", "mix", 1},
};
}  // namespace

KEditorDescription KDelayEditor() { return KEditorDescription::Of(kSections); }
