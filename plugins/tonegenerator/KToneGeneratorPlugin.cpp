#include "plugins/tonegenerator/KToneGeneratorPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr double kTwoPi = 6.283185307179586;

// The correction that rounds off a unit step at phase 0 over the samples on either side of it,
// removing most of the aliasing a naive step brings.
inline double StepCorrection(double phase, double increment) noexcept {
  if (phase < increment) {
    const double t = phase / increment;
    return t + t - t * t - 1.0;
  }
  if (phase > 1.0 - increment) {
    const double t = (phase - 1.0) / increment;
    return t * t + t + t + 1.0;
  }
  return 0.0;
}
}  // namespace

KToneGeneratorPlugin::KToneGeneratorPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KToneGeneratorPlugin::Create(KModule*, const KPluginRecord*) { return new KToneGeneratorPlugin; }

namespace {
constexpr KFactoryPreset::Value kLineUp[] = {{"play", 1.0}, {"output", 1.0}};
constexpr KFactoryPreset::Value kBassCheck[] = {{"play", 1.0}, {"frequency", 50.0}, {"level", -20.0}};
constexpr KFactoryPreset::Value kNoiseValues[] = {{"play", 1.0}, {"waveform", 4.0}, {"level", -24.0}, {"output", 1.0}};
constexpr KFactoryPreset kPresets[] = {{"Line-up 1 kHz", kLineUp}, {"Bass check 50 Hz", kBassCheck}, {"White noise", kNoiseValues}};
}  // namespace

constinit const KPluginDescription kToneGeneratorDescription{
    .key = "KToneGeneratorPlugin",
    .factory = &KToneGeneratorPlugin::Create,
    .moduleKey = "ToneGenerator",
    .category = "Special",
    .name = "ToneGenerator",
    .vst3SubCategories = "Fx|Generator",
    .vst2Id = "TvTg",
    .identity = "KToneGeneratorPlugin",
    .help = &KToneGeneratorHelp,
    .editor = &KToneGeneratorEditor,
    .presets = kPresets,
};

template <int Wave>
double KToneGeneratorPlugin::Next(KToneGeneratorPlugin& self) noexcept {
  const double p = self.phase_, dt = self.increment_;
  self.phase_ = p + dt >= 1.0 ? p + dt - 1.0 : p + dt;
  if constexpr (Wave == kSine) return std::sin(kTwoPi * p);
  if constexpr (Wave == kTriangle) return p < 0.5 ? 4.0 * p - 1.0 : 3.0 - 4.0 * p;
  if constexpr (Wave == kSquare) {
    const double half = p + 0.5 >= 1.0 ? p - 0.5 : p + 0.5;
    return (p < 0.5 ? 1.0 : -1.0) + StepCorrection(p, dt) - StepCorrection(half, dt);
  }
  if constexpr (Wave == kSawtooth) return 2.0 * p - 1.0 - StepCorrection(p, dt);
  if constexpr (Wave == kNoise) {
    self.noise_ = self.noise_ * 6364136223846793005ull + 1442695040888963407ull;
    return static_cast<double>(self.noise_ >> 11) * 0x1.0p-52 - 1.0;
  }
  return 0.0;
}

void KToneGeneratorPlugin::ProcessUpdate() {
  static constexpr Oscillator kOscillators[] = {&Next<kSine>, &Next<kTriangle>, &Next<kSquare>, &Next<kSawtooth>, &Next<kNoise>};
  const auto wave = std::clamp<int32_t>(static_cast<int32_t>(GetParameter(kWaveform).Working()), 0, kNoise);
  oscillator_ = kOscillators[wave];
  increment_ = std::min(GetParameter(kFrequency).Working(), 0.499 * SampleRate()) / SampleRate();
  const bool playing = GetParameter(kPlay).Working() >= 0.5;
  const double tone = playing ? KDecibelsToLinear(GetParameter(kLevel).Working()) : 0.0;
  const double input = playing && GetParameter(kOutput).Working() >= 0.5 ? 0.0 : 1.0;
  const double target[2] = {tone, input};
  gains_.Aim(target, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jumpToTarget_, false));
}

void KToneGeneratorPlugin::ResetState() {
  phase_ = 0.0;
  noise_ = 1;
  jumpToTarget_ = true;
}

void KToneGeneratorPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = ChannelsPerBus();
  const int32_t gliding = std::min(gains_.left, sampleCount);
  double tone = gains_.value[0], input = gains_.value[1];
  // At rest and silent, the oscillator rests too: the input passes through untouched.
  if (gliding == 0 && tone == 0.0) {
    for (int32_t c = 0; c < channels; ++c)
      if (outputs[c] != inputs[c]) std::copy_n(inputs[c], sampleCount, outputs[c]);
    return;
  }
  for (int32_t i = 0; i < sampleCount; ++i) {
    if (i < gliding) tone += gains_.step[0], input += gains_.step[1];
    const double v = tone * oscillator_(*this);
    for (int32_t c = 0; c < channels; ++c) outputs[c][i] = static_cast<float>(input * inputs[c][i] + v);
  }
  gains_.value[0] = tone;
  gains_.value[1] = input;
  gains_.Passed(gliding);
}
