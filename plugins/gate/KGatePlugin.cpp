#include "plugins/gate/KGatePlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
// The detector falls this fast whatever the release: the hold bridges the gaps between the
// peaks of low notes, and the release shapes the gain.
constexpr double kDetectorSeconds = 0.01;
// The gain lands on its target this close to it.
constexpr double kLanding = 1e-9;

constexpr KFactoryPreset::Value kDrumGate[] = {{"threshold", -30.0}, {"range", -80.0}, {"attack", 0.0002}, {"hold", 0.04}, {"release", 0.08}};
constexpr KFactoryPreset::Value kNoiseReduction[] = {{"threshold", -55.0}, {"ratio", 2.0}, {"range", -20.0}, {"release", 0.25}};
constexpr KFactoryPreset::Value kVocalCleanup[] = {{"threshold", -45.0}, {"ratio", 4.0}, {"range", -30.0}, {"hold", 0.08}, {"release", 0.3}};
constexpr KFactoryPreset kPresets[] = {{"Drum gate", kDrumGate}, {"Noise reduction", kNoiseReduction}, {"Vocal clean-up", kVocalCleanup}};
}  // namespace

constinit const KPluginDescription kGateDescription{
    .key = "KGatePlugin",
    .factory = &KGatePlugin::Create,
    .moduleKey = "Gate",
    .category = "Dynamics",
    .name = "Gate",
    .vst3SubCategories = "Fx|Dynamics",
    .vst2Id = "TvGa",
    .identity = "KGatePlugin",
    .help = &KGateHelp,
    .editor = &KGateEditor,
    .presets = kPresets,
};

KGatePlugin::KGatePlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KGatePlugin::Create(KModule*, const KPluginRecord*) { return new KGatePlugin; }

KGatePlugin::Law KGatePlugin::Derive() const noexcept {
  const double rate = SampleRate();
  auto value = [this](int32_t p) { return GetParameter(p).Working(); };
  Law law;
  law.threshold = KDecibelsToLinear(value(kThreshold));
  law.slope = value(kRatio) - 1.0;
  law.floor = KDecibelsToLinear(value(kRange));
  law.attack = KSmoothingCoefficient(rate, value(kAttack));
  law.release = KSmoothingCoefficient(rate, value(kRelease));
  law.fall = KSmoothingCoefficient(rate, kDetectorSeconds);
  law.hold = static_cast<int32_t>(std::lround(value(kHold) * rate));
  return law;
}

double KGatePlugin::LawDecibels(double levelDb) const noexcept {
  const double below = std::min(levelDb - GetParameter(kThreshold).Working(), 0.0);
  return std::max(below * (GetParameter(kRatio).Working() - 1.0), GetParameter(kRange).Working());
}

uint32_t KGatePlugin::TailSamples() const noexcept {
  const Law law = Derive();
  if (law.slope <= 0.0 || law.floor >= 1.0) return 0;  // it never closes
  // The level at which the law reaches the range, and how long the detector takes to get there.
  const double quiet = std::min(law.threshold * std::pow(law.floor, 1.0 / law.slope), 1.0);
  const double fall = law.fall > 0.0 && quiet > 0.0 ? std::log(quiet) / std::log(law.fall) : 0.0;
  const double settle = law.release > 0.0 ? std::log(kLanding) / std::log(law.release) : 0.0;
  return static_cast<uint32_t>(law.hold) + static_cast<uint32_t>(std::ceil(fall + settle));
}

void KGatePlugin::ProcessUpdate() {
  law_ = Derive();
  // Closed as far as the range allows, as after a long silence.
  if (std::exchange(rest_, false))
    for (Detector& d : detectors_) d = {0.0, law_.floor, 0};
  render_ = GetParameter(kLinkChannels).Working() >= 0.5 ? &KGatePlugin::Gate<true> : &KGatePlugin::Gate<false>;
}

void KGatePlugin::ResetState() { rest_ = true; }

inline double KGatePlugin::Step(Detector& d, const Law& law, double peak) noexcept {
  d.level = std::max(peak, law.fall * d.level);
  double target = 1.0;
  if (d.level >= law.threshold) d.holding = law.hold;
  else if (d.holding > 0) --d.holding;
  else target = std::max(law.floor, std::pow(d.level / law.threshold, law.slope));
  const double coefficient = target > d.gain ? law.attack : law.release;
  d.gain = target + coefficient * (d.gain - target);
  if (std::abs(d.gain - target) < kLanding) d.gain = target;
  return d.gain;
}

template <bool Linked>
void KGatePlugin::Gate(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  const Law law = law_;
  for (int32_t i = 0; i < n; ++i) {
    double x[kChannels];
    double peak = 0.0;
    for (int32_t c = 0; c < channels; ++c) {
      const float in = inputs[c][i];
      x[c] = std::isfinite(in) ? in : 0.0;  // a NaN or infinity passes as silence
      peak = std::max(peak, std::abs(x[c]));
    }
    if constexpr (Linked) {
      const double g = Step(detectors_[0], law, peak);
      for (int32_t c = 0; c < channels; ++c) outputs[c][i] = static_cast<float>(x[c] * g);
      lowest_ = std::min(lowest_, g);
    } else {
      for (int32_t c = 0; c < channels; ++c) {
        const double g = Step(detectors_[c], law, std::abs(x[c]));
        outputs[c][i] = static_cast<float>(x[c] * g);
        lowest_ = std::min(lowest_, g);
      }
    }
  }
}

void KGatePlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  lowest_ = 1.0;
  (this->*render_)(inputs, outputs, std::min(ChannelsPerBus(), kChannels), sampleCount);
  reduction_.store(static_cast<float>(std::max(KLinearToDecibels(lowest_), -200.0)), std::memory_order_relaxed);
}
