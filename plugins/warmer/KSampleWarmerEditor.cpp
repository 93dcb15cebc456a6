#include <algorithm>
#include <cmath>

#include "plugins/KPluginEditors.h"
#include "plugins/warmer/KSampleWarmer.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Saturation", "drive shape tone", 3},
    {"Output", "outputgain mix", 2},
};

// The chosen curve at the present drive, as the signal meets it (tone and oversampling aside).
std::unique_ptr<KControl> ShapeGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  return std::make_unique<KShapeGraph>(
      bounds,
      [&plugin](double x) {
        const auto shape = static_cast<int32_t>(plugin.GetParameter(KSampleWarmer::kShape).Working());
        double sample = x * std::pow(10.0, plugin.GetParameter(KSampleWarmer::kDrive).Working() / 20.0);
        KSampleWarmer::CurveOf(shape)(&sample, 1);
        return sample;
      },
      KString("shape"));
}

}  // namespace

KEditorDescription KSampleWarmerEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &ShapeGraph); }
