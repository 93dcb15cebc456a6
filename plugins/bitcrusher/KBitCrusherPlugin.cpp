#include "plugins/bitcrusher/KBitCrusherPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};

constexpr KFactoryPreset::Value kEightBitGame[] = {{"bits", 8.0}, {"downsample", 4.0}, {"outputgain", -3.0}};
constexpr KFactoryPreset::Value kEarlySampler[] = {{"bits", 12.0}, {"downsample", 2.0}, {"mix", 70.0}};
constexpr KFactoryPreset::Value kDestroyed[] = {{"bits", 3.0}, {"downsample", 16.0}, {"mix", 50.0}, {"outputgain", -6.0}};
constexpr KFactoryPreset kPresets[] = {{"8-bit game", kEightBitGame}, {"Early sampler", kEarlySampler}, {"Destroyed", kDestroyed}};
}  // namespace

constinit const KPluginDescription kBitCrusherDescription{
    .key = "KBitCrusherPlugin",
    .factory = &KBitCrusherPlugin::Create,
    .moduleKey = "BitCrusher",
    .category = "Distortion",
    .name = "BitCrusher",
    .vst3SubCategories = "Fx|Distortion",
    .vst2Id = "TvBC",
    .identity = "KBitCrusherPlugin",
    .help = &KBitCrusherHelp,
    .editor = &KBitCrusherEditor,
    .presets = kPresets,
};

KBitCrusherPlugin::KBitCrusherPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KBitCrusherPlugin::Create(KModule*, const KPluginRecord*) { return new KBitCrusherPlugin; }

double KBitCrusherPlugin::Quantize(double x, double halfLevels) noexcept {
  // Levels k / halfLevels for k from −halfLevels to halfLevels − 1: full scale clips one step low.
  const double step = std::floor(x * halfLevels + 0.5);
  return std::clamp(step, -halfLevels, halfLevels - 1.0) / halfLevels;
}

uint32_t KBitCrusherPlugin::TailSamples() const noexcept {
  return static_cast<uint32_t>(GetParameter(kDownsample).Working()) - 1u;
}

void KBitCrusherPlugin::ProcessUpdate() {
  halfLevels_ = std::ldexp(1.0, static_cast<int32_t>(GetParameter(kBits).Working()) - 1);
  hold_ = static_cast<int32_t>(GetParameter(kDownsample).Working());
  const double gain = KDecibelsToLinear(GetParameter(kOutputGain).Working());
  const double wet = GetParameter(kMix).Working() / 100.0;
  const double targets[kGlides] = {gain * wet, gain * (1.0 - wet)};
  glides_.Aim(targets, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jump_, false));
}

void KBitCrusherPlugin::ResetState() {
  jump_ = true;
  phase_ = 0;
  std::fill(std::begin(held_), std::end(held_), 0.0);
}

void KBitCrusherPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  glides_.Fill(kWetGlide, wet_, sampleCount);
  glides_.Fill(kDryGlide, dry_, sampleCount);
  glides_.Passed(sampleCount);
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  // A held phase past a shortened hold takes a new sample at once.
  const int32_t start = std::min(phase_, hold_ - 1);
  for (int32_t c = 0; c < channels; ++c) {
    const float* in = inputs[c];
    float* out = outputs[c];
    double held = held_[c];
    int32_t phase = start;
    for (int32_t i = 0; i < sampleCount; ++i) {
      const double x = std::isfinite(in[i]) ? in[i] : 0.0;  // a NaN or infinity passes as silence
      if (phase == 0) held = Quantize(x, halfLevels_);
      phase = phase + 1 == hold_ ? 0 : phase + 1;
      out[i] = static_cast<float>(wet_[i] * held + dry_[i] * x);
    }
    held_[c] = held;
    if (c + 1 == channels) phase_ = phase;
  }
}
