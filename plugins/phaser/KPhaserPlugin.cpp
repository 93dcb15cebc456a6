#include "plugins/phaser/KPhaserPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"
#include "dsp/KSectionState.h"
#include "kernel/KFactoryPreset.h"

namespace {
constexpr double kPi = 3.141592653589793;

constexpr KFactoryPreset::Value kSlowSwirl[] = {{"rate", 0.15}, {"stages", 3.0}, {"feedback", 30.0}};
constexpr KFactoryPreset::Value kFunkyFour[] = {{"rate", 1.2}, {"stages", 1.0}, {"feedback", 0.0}, {"low", 400.0}, {"high", 2500.0}};
constexpr KFactoryPreset::Value kDeepResonance[] = {{"rate", 0.3}, {"stages", 5.0}, {"feedback", 80.0}, {"low", 150.0}, {"high", 6000.0}};
constexpr KFactoryPreset kPresets[] = {{"Slow swirl", kSlowSwirl}, {"Funky four-stage", kFunkyFour}, {"Deep resonance", kDeepResonance}};
}  // namespace

KAudioPlugin* KPhaserPlugin::Create(KModule*, const KPluginRecord*) { return new KPhaserPlugin; }

constinit const KPluginDescription kPhaserDescription{
    .key = "KPhaserPlugin",
    .factory = &KPhaserPlugin::Create,
    .moduleKey = "Phaser",
    .category = "Modulation",
    .name = "Phaser",
    .vst3SubCategories = "Fx|Modulation",
    .vst2Id = "TvPh",
    .identity = "KPhaserPlugin",
    .help = &KPhaserHelp,
    .editor = &KPhaserEditor,
    .presets = kPresets,
};

double KPhaserPlugin::Coefficient(double frequency, double sampleRate) noexcept {
  const double t = std::tan(kPi * std::min(frequency, 0.49 * sampleRate) / sampleRate);
  return (t - 1.0) / (t + 1.0);
}

int32_t KPhaserPlugin::StageCount() const noexcept {
  return 2 * (static_cast<int32_t>(std::lround(GetParameter(kStages).Working())) + 1);
}

void KPhaserPlugin::ResetEffect() noexcept {
  for (auto& channel : state_) std::fill(std::begin(channel), std::end(channel), 0.0);
  std::fill(std::begin(last_), std::end(last_), 0.0);
}

void KPhaserPlugin::UpdateEffect(bool jump) noexcept {
  stages_ = StageCount();
  const double low = std::log2(GetParameter(kLow).Working()), high = std::log2(GetParameter(kHigh).Working());
  const double targets[kGlides] = {low, high - low, GetParameter(kFeedback).Working() / 100.0, GetParameter(kMix).Working() / 100.0};
  glides_.Aim(targets, static_cast<int32_t>(0.02 * SampleRate()), jump);
}

// Each stage's impulse response falls as its pole, slowest at the lower limit; the feedback
// repeats the chain's ring until it is 100 dB down.
uint32_t KPhaserPlugin::TailSamples() const noexcept {
  const double rate = SampleRate();
  const double lowest = std::min(GetParameter(kLow).Working(), GetParameter(kHigh).Working());
  const double pole = std::abs(Coefficient(lowest, rate));
  const double ring = StageCount() * std::log(1e-6) / std::log(pole);
  const double feedback = std::abs(GetParameter(kFeedback).Working() / 100.0);
  const double rounds = feedback > 0.0 ? std::ceil(std::log(1e-6) / std::log(feedback)) + 1.0 : 1.0;
  return static_cast<uint32_t>(std::ceil(rounds * (ring + 1.0)));
}

void KPhaserPlugin::ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  const double rate = SampleRate();
  for (int32_t done = 0; done < n; done += kPiece) {
    const int32_t m = std::min(kPiece, n - done);
    for (int32_t k = 0; k < kGlides; ++k) glides_.Fill(k, lanes_[k], m);
    glides_.Passed(m);
    for (int32_t c = 0; c < channels; ++c) {
      lfos_.Fill(c, sweep_, m);
      const float* in = inputs[c] + done;
      float* out = outputs[c] + done;
      double* state = state_[c];
      double last = last_[c];
      for (int32_t i = 0; i < m; ++i) {
        const double x = std::isfinite(in[i]) ? in[i] : 0.0;
        const double a = Coefficient(std::exp2(lanes_[kLowGlide][i] + lanes_[kSpanGlide][i] * (0.5 + 0.5 * sweep_[i])), rate);
        double y = x + lanes_[kFeedbackGlide][i] * last;
        for (int32_t s = 0; s < stages_; ++s) {
          const double v = a * y + state[s];
          state[s] = KFlushTiny(y - a * v);
          y = v;
        }
        last = KFlushTiny(y);
        out[i] = static_cast<float>((1.0 - lanes_[kWetGlide][i]) * x + lanes_[kWetGlide][i] * last);
      }
      last_[c] = last;
    }
  }
}
