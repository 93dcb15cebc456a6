#include "plugins/autopan/KAutoPanPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"
#include "kernel/KFactoryPreset.h"

namespace {
constexpr KFactoryPreset::Value kGentleDrift[] = {{"rate", 0.2}, {"width", 50.0}};
constexpr KFactoryPreset::Value kEighthBounce[] = {{"sync", 11.0}, {"shape", KLFO::kSquare}, {"smoothing", 0.01}};
constexpr KFactoryPreset::Value kRandomPositions[] = {{"sync", 8.0}, {"shape", KLFO::kSampleAndHold}, {"width", 70.0}, {"smoothing", 0.02}};
constexpr KFactoryPreset kPresets[] = {{"Gentle drift", kGentleDrift}, {"Eighth bounce", kEighthBounce}, {"Random positions", kRandomPositions}};
}  // namespace

KAudioPlugin* KAutoPanPlugin::Create(KModule*, const KPluginRecord*) { return new KAutoPanPlugin; }

constinit const KPluginDescription kAutoPanDescription{
    .key = "KAutoPanPlugin",
    .factory = &KAutoPanPlugin::Create,
    .moduleKey = "AutoPan",
    .category = "Stereo",
    .name = "AutoPan",
    .vst3SubCategories = "Fx|Spatial",
    .vst2Id = "TvAP",
    .identity = "KAutoPanPlugin",
    .help = &KAutoPanHelp,
    .editor = &KAutoPanEditor,
    .presets = kPresets,
};

void KAutoPanPlugin::ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t from, int32_t n,
                                  const double* width) noexcept {
  lfos_.Fill(0, sweep_, n);
  if (channels < 2) {
    for (int32_t i = 0; i < n; ++i) outputs[0][from + i] = std::isfinite(inputs[0][from + i]) ? inputs[0][from + i] : 0.0f;
    return;
  }
  const float* inL = inputs[0] + from;
  const float* inR = inputs[1] + from;
  float* outL = outputs[0] + from;
  float* outR = outputs[1] + from;
  for (int32_t i = 0; i < n; ++i) {
    // The balance from −1 (left) to +1 (right): the side turned away fades, the other stays.
    const double balance = width[i] * sweep_[i];
    const double left = 1.0 - std::max(balance, 0.0), right = 1.0 + std::min(balance, 0.0);
    const double xL = std::isfinite(inL[i]) ? inL[i] : 0.0, xR = std::isfinite(inR[i]) ? inR[i] : 0.0;
    outL[i] = static_cast<float>(left * xL);
    outR[i] = static_cast<float>(right * xR);
  }
}
