#include "plugins/stereoimager/KStereoImagerPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KSectionStage.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr double kButterworthQ = 0.7071067811865476;
}  // namespace

KStereoImagerPlugin::KStereoImagerPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KStereoImagerPlugin::Create(KModule*, const KPluginRecord*) { return new KStereoImagerPlugin; }

namespace {
constexpr KFactoryPreset::Value kMonoBass[] = {{"width", 100.0}, {"lowwidth", 0.0}, {"crossover", 120.0}};
constexpr KFactoryPreset::Value kWideMix[] = {{"width", 150.0}, {"lowwidth", 60.0}};
constexpr KFactoryPreset::Value kNarrow[] = {{"width", 60.0}, {"lowwidth", 60.0}};
constexpr KFactoryPreset kPresets[] = {{"Mono bass", kMonoBass}, {"Wide mix", kWideMix}, {"Narrow", kNarrow}};
}  // namespace

constinit const KPluginDescription kStereoImagerDescription{
    .key = "KStereoImagerPlugin",
    .factory = &KStereoImagerPlugin::Create,
    .moduleKey = "StereoImager",
    .category = "Stereo",
    .name = "StereoImager",
    .vst3SubCategories = "Fx|Spatial",
    .vst2Id = "TvSi",
    .identity = "KStereoImagerPlugin",
    .help = &KStereoImagerHelp,
    .editor = &KStereoImagerEditor,
    .presets = kPresets,
};

void KStereoImagerPlugin::ProcessUpdate() {
  const double crossover = GetParameter(kCrossover).Working();
  lowPass_.Design(KFilterSection::kLowPass, 0.0, crossover, SampleRate(), kButterworthQ);
  highPass_.Design(KFilterSection::kHighPass, 0.0, crossover, SampleRate(), kButterworthQ);
  const double target[2] = {GetParameter(kWidth).Working() / 100.0, GetParameter(kLowWidth).Working() / 100.0};
  gains_.Aim(target, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jumpToTarget_, false));
}

void KStereoImagerPlugin::ResetState() {
  std::fill(&state_[0][0], &state_[0][0] + 8, 0.0);
  jumpToTarget_ = true;
}

// side' = high·highs(side) + low·lows(side).
void KStereoImagerPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  if (ChannelsPerBus() == 1) {
    if (outputs[0] != inputs[0]) std::copy_n(inputs[0], sampleCount, outputs[0]);
    return;
  }
  const int32_t gliding = std::min(gains_.left, sampleCount);
  double high = gains_.value[0], low = gains_.value[1];
  const double stepHigh = gains_.step[0], stepLow = gains_.step[1];
  const float* inL = inputs[0];
  const float* inR = inputs[1];
  float* outL = outputs[0];
  float* outR = outputs[1];
  double(&z)[4][2] = state_;
  for (int32_t i = 0; i < sampleCount; ++i) {
    if (i < gliding) high += stepHigh, low += stepLow;
    const double mid = 0.5 * (inL[i] + static_cast<double>(inR[i])), side = 0.5 * (inL[i] - static_cast<double>(inR[i]));
    const double lows = KSectionStage(lowPass_, KSectionStage(lowPass_, side, z[0]), z[1]);
    const double highs = KSectionStage(highPass_, KSectionStage(highPass_, side, z[2]), z[3]);
    const double shaped = high * highs + low * lows;
    outL[i] = static_cast<float>(mid + shaped);
    outR[i] = static_cast<float>(mid - shaped);
  }
  gains_.value[0] = high;
  gains_.value[1] = low;
  gains_.Passed(gliding);
  // After the sound, the filter comes to rest at exact zero once it has fallen 240 dB, instead of
  // decaying through the denormals for seconds; a NaN would stay in it for good and goes too.
  double size = 0.0;
  for (const double(&stage)[2] : z) size += std::abs(stage[0]) + std::abs(stage[1]);
  if (!(size >= 1e-12) || !std::isfinite(size)) std::fill(&state_[0][0], &state_[0][0] + 8, 0.0);
}
