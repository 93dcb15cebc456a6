#include <cmath>
#include <memory>

#include "plugins/KPluginEditors.h"
#include "plugins/bitcrusher/KBitCrusherPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Crush", "bits downsample", 2},
    {"Output", "mix outputgain", 2},
};

// The staircase the samples are rounded to at the present resolution.
std::unique_ptr<KControl> StepGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  return std::make_unique<KShapeGraph>(
      bounds,
      [&plugin](double x) {
        const auto bits = static_cast<int32_t>(plugin.GetParameter(KBitCrusherPlugin::kBits).Working());
        return KBitCrusherPlugin::Quantize(x, std::ldexp(1.0, bits - 1));
      },
      KString("bits"));
}

}  // namespace

KEditorDescription KBitCrusherEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &StepGraph); }
