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
};

void KAutoPanPlugin::UpdateEffect(bool jump) noexcept {
  const double width = GetParameter(kWidth).Working() / 100.0;
  width_.Aim(&width, static_cast<int32_t>(0.02 * SampleRate()), jump);
}

void KAutoPanPlugin::ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  for (int32_t done = 0; done < n; done += kPiece) {
    const int32_t m = std::min(kPiece, n - done);
    width_.Fill(0, widthLane_, m);
    width_.Passed(m);
    lfos_.Fill(0, sweep_, m);
    if (channels < 2) {
      for (int32_t i = 0; i < m; ++i) outputs[0][done + i] = std::isfinite(inputs[0][done + i]) ? inputs[0][done + i] : 0.0f;
      continue;
    }
    const float* inL = inputs[0] + done;
    const float* inR = inputs[1] + done;
    float* outL = outputs[0] + done;
    float* outR = outputs[1] + done;
    for (int32_t i = 0; i < m; ++i) {
      // The balance from −1 (left) to +1 (right): the side turned away fades, the other stays.
      const double balance = widthLane_[i] * sweep_[i];
      const double left = 1.0 - std::max(balance, 0.0), right = 1.0 + std::min(balance, 0.0);
      const double xL = std::isfinite(inL[i]) ? inL[i] : 0.0, xR = std::isfinite(inR[i]) ? inR[i] : 0.0;
      outL[i] = static_cast<float>(left * xL);
      outR[i] = static_cast<float>(right * xR);
    }
  }
}
