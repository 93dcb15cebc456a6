#include "plugins/waveshaper/KWaveshaperPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kBuses{1, 1, false, false, false};
constexpr double kHalfPi = 1.5707963267948966;
// Closer inputs than this take the curve at their midpoint: the antiderivatives' difference
// would lose its precision.
constexpr double kClose = 1e-5;

// Each curve with its antiderivative F (continuous, so that the mean over a step that crosses a
// corner is right).
struct HardClip {
  static double f(double x) noexcept { return std::clamp(x, -1.0, 1.0); }
  static double F(double x) noexcept { return std::abs(x) <= 1.0 ? 0.5 * x * x : std::abs(x) - 0.5; }
};
struct Cubic {  // slope 1.5 at zero, flat into full scale at ±1
  static double f(double x) noexcept { return std::abs(x) <= 1.0 ? x * (1.5 - 0.5 * x * x) : std::copysign(1.0, x); }
  static double F(double x) noexcept { return std::abs(x) <= 1.0 ? x * x * (0.75 - 0.125 * x * x) : std::abs(x) - 0.375; }
};
struct SineFold {  // folds back from full scale instead of flattening
  static double f(double x) noexcept { return std::sin(kHalfPi * x); }
  static double F(double x) noexcept { return -std::cos(kHalfPi * x) / kHalfPi; }
};
struct Rectify {  // both halves of the wave upwards: the octave above
  static double f(double x) noexcept { return std::abs(x); }
  static double F(double x) noexcept { return 0.5 * x * std::abs(x); }
};

// The curve's mean between two successive inputs.
template <class Shape>
double Mean(double from, double to) noexcept {
  const double step = to - from;
  return std::abs(step) > kClose ? (Shape::F(to) - Shape::F(from)) / step : Shape::f(0.5 * (from + to));
}

constexpr KFactoryPreset::Value kWarmFuzz[] = {{"drive", 18.0}, {"shape", KWaveshaperPlugin::kCubic}, {"bias", 30.0}, {"outputgain", -9.0}};
constexpr KFactoryPreset::Value kWavefolder[] = {{"drive", 20.0}, {"shape", KWaveshaperPlugin::kSineFold}, {"outputgain", -4.0}};
constexpr KFactoryPreset::Value kOctaveUp[] = {{"drive", 0.0}, {"shape", KWaveshaperPlugin::kRectify}, {"mix", 60.0}, {"outputgain", 0.0}};
constexpr KFactoryPreset::Value kBrickClip[] = {{"drive", 24.0}, {"shape", KWaveshaperPlugin::kHardClip}, {"outputgain", -12.0}};
constexpr KFactoryPreset kPresets[] = {
    {"Warm fuzz", kWarmFuzz}, {"Wavefolder", kWavefolder}, {"Octave up", kOctaveUp}, {"Brick clip", kBrickClip}};
}  // namespace

constinit const KPluginDescription kWaveshaperDescription{
    .key = "KWaveshaperPlugin",
    .factory = &KWaveshaperPlugin::Create,
    .moduleKey = "Waveshaper",
    .category = "Distortion",
    .name = "Waveshaper",
    .vst3SubCategories = "Fx|Distortion",
    .vst2Id = "TvWS",
    .identity = "KWaveshaperPlugin",
    .help = &KWaveshaperHelp,
    .editor = &KWaveshaperEditor,
    .presets = kPresets,
};

KWaveshaperPlugin::KWaveshaperPlugin() : KAudioPlugin(kParameters, kBuses) { KWaveshaperPlugin::ProcessUpdate(); }

KAudioPlugin* KWaveshaperPlugin::Create(KModule*, const KPluginRecord*) { return new KWaveshaperPlugin; }

double KWaveshaperPlugin::Curve(int32_t shape, double x) noexcept {
  switch (shape) {
    case kHardClip: return HardClip::f(x);
    case kSineFold: return SineFold::f(x);
    case kRectify: return Rectify::f(x);
    default: return Cubic::f(x);
  }
}

KFilterSection KWaveshaperPlugin::DCBlocker() const noexcept {
  KFilterSection section;
  section.Design(KFilterSection::kBilinearHighPass, 0.0, kDCBlockerHz, SampleRate(), 1.0);
  return section;
}

uint32_t KWaveshaperPlugin::TailSamples() const noexcept {
  const KFilterSection s = DCBlocker();
  const KSectionRunner::Row row = {s.b0, s.minusA1, s.b1, s.minusA2, s.b2};
  const uint32_t ring = KSectionRunner::RingSamples(&row, 1, 1e-5);
  return ring == UINT32_MAX ? ring : ring + 1;  // and the curve's memory of one input
}

void KWaveshaperPlugin::ProcessUpdate() {
  const double gain = KDecibelsToLinear(GetParameter(kOutputGain).Working());
  const double wet = GetParameter(kMix).Working() / 100.0;
  const double targets[kGlides] = {KDecibelsToLinear(GetParameter(kDrive).Working()), gain * wet, gain * (1.0 - wet)};
  glides_.Aim(targets, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jump_, false));
  bias_ = kFullBias * GetParameter(kBias).Working() / 100.0;
  static constexpr Render kRenders[kShapeCount] = {&KWaveshaperPlugin::Shaped<HardClip>, &KWaveshaperPlugin::Shaped<Cubic>,
                                                   &KWaveshaperPlugin::Shaped<SineFold>, &KWaveshaperPlugin::Shaped<Rectify>};
  render_ = kRenders[std::clamp(static_cast<int32_t>(GetParameter(kShape).Working()), 0, kShapeCount - 1)];
  const KFilterSection blocker = DCBlocker();
  blocker_.SetSections(&blocker, 1);
}

void KWaveshaperPlugin::ResetState() {
  jump_ = true;
  std::fill(std::begin(previous_), std::end(previous_), 0.0);
  blocker_.Reset();
}

template <class Shape>
void KWaveshaperPlugin::Shaped(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  // The working point's own value is taken away: silence in, exact silence out.
  const double bias = bias_, rest = Shape::f(bias_);
  for (int32_t c = 0; c < channels; ++c) {
    const float* in = inputs[c];
    float* wet = wet_[c];
    double previous = previous_[c];
    for (int32_t i = 0; i < n; ++i) {
      const double driven = (std::isfinite(in[i]) ? in[i] : 0.0) * drive_[i] + bias;  // a NaN or infinity passes as silence
      wet[i] = static_cast<float>(Mean<Shape>(previous, driven) - rest);
      previous = driven;
    }
    previous_[c] = previous;
  }
  const float* wetIn[kChannels] = {wet_[0], wet_[1]};
  float* wetOut[kChannels] = {wet_[0], wet_[1]};
  blocker_.Process(wetIn, wetOut, channels, n);
  for (int32_t c = 0; c < channels; ++c) {
    const float* in = inputs[c];
    float* out = outputs[c];
    for (int32_t i = 0; i < n; ++i) out[i] = static_cast<float>(wetGain_[i] * wet_[c][i] + dryGain_[i] * (std::isfinite(in[i]) ? in[i] : 0.0f));
  }
}

void KWaveshaperPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  glides_.Fill(kDriveGlide, drive_, sampleCount);
  glides_.Fill(kWetGlide, wetGain_, sampleCount);
  glides_.Fill(kDryGlide, dryGain_, sampleCount);
  glides_.Passed(sampleCount);
  (this->*render_)(inputs, outputs, std::min(ChannelsPerBus(), kChannels), sampleCount);
}
