#include "kernel/KFactoryPreset.h"
#include "plugins/flanger/KFlangerPlugin.h"

namespace {
constexpr KFactoryPreset::Value kJetPlane[] = {{"rate", 0.1}, {"depth", 0.005}, {"feedback", 80.0}};
constexpr KFactoryPreset::Value kGentleSweep[] = {{"rate", 0.3}, {"shape", KLFO::kSine}, {"feedback", 20.0}, {"mix", 40.0}};
constexpr KFactoryPreset::Value kMetallic[] = {{"rate", 2.0}, {"delay", 0.0005}, {"depth", 0.001}, {"feedback", -85.0}};
constexpr KFactoryPreset kPresets[] = {{"Jet plane", kJetPlane}, {"Gentle sweep", kGentleSweep}, {"Metallic", kMetallic}};
}  // namespace

KAudioPlugin* KFlangerPlugin::Create(KModule*, const KPluginRecord*) { return new KFlangerPlugin; }

constinit const KPluginDescription kFlangerDescription{
    .key = "KFlangerPlugin",
    .factory = &KFlangerPlugin::Create,
    .moduleKey = "Flanger",
    .category = "Modulation",
    .name = "Flanger",
    .vst3SubCategories = "Fx|Modulation",
    .vst2Id = "TvFl",
    .identity = "KFlangerPlugin",
    .help = &KFlangerHelp,
    .editor = &KFlangerEditor,
    .presets = kPresets,
};
