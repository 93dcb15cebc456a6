#include <memory>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"
#include "plugins/KPluginEditors.h"
#include "plugins/waveshaper/KWaveshaperPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

using W = KWaveshaperPlugin;

constexpr KEditorSection kSections[] = {
    {"Shape", "drive shape bias", 3},
    {"Output", "outputgain mix", 2},
};

// The curve as the signal meets it at the present drive and bias.
std::unique_ptr<KControl> ShapeGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  return std::make_unique<KShapeGraph>(
      bounds,
      [&plugin](double x) {
        const auto shape = static_cast<int32_t>(plugin.GetParameter(W::kShape).Working());
        const double bias = W::kFullBias * plugin.GetParameter(W::kBias).Working() / 100.0;
        const double drive = KDecibelsToLinear(plugin.GetParameter(W::kDrive).Working());
        return W::Curve(shape, x * drive + bias) - W::Curve(shape, bias);
      },
      KString("shape"));
}

}  // namespace

KEditorDescription KWaveshaperEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &ShapeGraph); }
