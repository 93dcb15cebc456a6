#include "kernel/KFactoryPreset.h"
#include "plugins/chorus/KChorusPlugin.h"

namespace {
constexpr KFactoryPreset::Value kSubtleWidth[] = {{"rate", 0.4}, {"depth", 0.0015}, {"voices", 1.0}, {"spread", 180.0}, {"mix", 35.0}};
constexpr KFactoryPreset::Value kLush[] = {{"rate", 0.6}, {"depth", 0.005}, {"delay", 0.02}, {"voices", 4.0}};
constexpr KFactoryPreset::Value kVibrato[] = {{"rate", 5.0}, {"depth", 0.002}, {"delay", 0.005}, {"voices", 1.0}, {"mix", 100.0}};
constexpr KFactoryPreset kPresets[] = {{"Subtle width", kSubtleWidth}, {"Lush ensemble", kLush}, {"Vibrato", kVibrato}};
}  // namespace

KAudioPlugin* KChorusPlugin::Create(KModule*, const KPluginRecord*) { return new KChorusPlugin; }

constinit const KPluginDescription kChorusDescription{
    .key = "KChorusPlugin",
    .factory = &KChorusPlugin::Create,
    .moduleKey = "Chorus",
    .category = "Modulation",
    .name = "Chorus",
    .vst3SubCategories = "Fx|Modulation",
    .vst2Id = "TvCh",
    .identity = "KChorusPlugin",
    .help = &KChorusHelp,
    .editor = &KChorusEditor,
    .presets = kPresets,
};
