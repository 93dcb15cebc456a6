#include "plugins/transient/KTransientShaperPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
// Keeps the ratios finite in silence; far below any sample a float can hold but zero.
constexpr double kFloor = 1e-12;
// At ±100 % a ratio is raised to this power.
constexpr double kFullExponent = 0.5;
const double kMaxLog = std::log(KDecibelsToLinear(KTransientShaperPlugin::kMaxDecibels));

constexpr KFactoryPreset::Value kPunchyDrums[] = {{"attack", 60.0}, {"sustain", -20.0}};
constexpr KFactoryPreset::Value kTightRoom[] = {{"sustain", -70.0}, {"outputgain", 2.0}};
constexpr KFactoryPreset::Value kSoftPick[] = {{"attack", -50.0}, {"sustain", 30.0}};
constexpr KFactoryPreset kPresets[] = {{"Punchy drums", kPunchyDrums}, {"Tight room", kTightRoom}, {"Soft pick", kSoftPick}};
}  // namespace

constinit const KPluginDescription kTransientShaperDescription{
    .key = "KTransientShaperPlugin",
    .factory = &KTransientShaperPlugin::Create,
    .moduleKey = "TransientShaper",
    .category = "Dynamics",
    .name = "TransientShaper",
    .vst3SubCategories = "Fx|Dynamics",
    .vst2Id = "TvTS",
    .identity = "KTransientShaperPlugin",
    .help = &KTransientShaperHelp,
    .editor = &KTransientShaperEditor,
    .presets = kPresets,
};

KTransientShaperPlugin::KTransientShaperPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KTransientShaperPlugin::Create(KModule*, const KPluginRecord*) { return new KTransientShaperPlugin; }

uint32_t KTransientShaperPlugin::TailSamples() const noexcept {
  return static_cast<uint32_t>(std::ceil(std::log(1e5) * kSlowFall * SampleRate()));
}

void KTransientShaperPlugin::ProcessUpdate() {
  const double rate = SampleRate();
  quick_.rise = KSmoothingCoefficient(rate, kQuickRise);
  quick_.fall = KSmoothingCoefficient(rate, kQuickFall);
  riser_.rise = KSmoothingCoefficient(rate, kSlowRise);
  riser_.fall = KSmoothingCoefficient(rate, kQuickFall);
  faller_.rise = KSmoothingCoefficient(rate, kQuickRise);
  faller_.fall = KSmoothingCoefficient(rate, kSlowFall);
  const double targets[kGlides] = {kFullExponent * GetParameter(kAttack).Working() / 100.0,
                                   kFullExponent * GetParameter(kSustain).Working() / 100.0,
                                   KDecibelsToLinear(GetParameter(kOutputGain).Working())};
  glides_.Aim(targets, static_cast<int32_t>(rate * kGlideSeconds), std::exchange(jump_, false));
}

void KTransientShaperPlugin::ResetState() {
  jump_ = true;
  quick_.value = riser_.value = faller_.value = 0.0;
}

void KTransientShaperPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  glides_.Fill(kAttackGlide, attack_, sampleCount);
  glides_.Fill(kSustainGlide, sustain_, sampleCount);
  glides_.Fill(kOutputGlide, output_, sampleCount);
  glides_.Passed(sampleCount);
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  for (int32_t i = 0; i < sampleCount; ++i) {
    double x[kChannels];
    double peak = 0.0;
    for (int32_t c = 0; c < channels; ++c) {
      const float in = inputs[c][i];
      x[c] = std::isfinite(in) ? in : 0.0;  // a NaN or infinity passes as silence
      peak = std::max(peak, std::abs(x[c]));
    }
    const double quick = quick_.Follow(peak) + kFloor;
    const double onset = std::log(quick / (riser_.Follow(peak) + kFloor));
    const double decay = std::log((faller_.Follow(peak) + kFloor) / quick);
    const double shaped = std::clamp(attack_[i] * onset + sustain_[i] * decay, -kMaxLog, kMaxLog);
    const double g = output_[i] * std::exp(shaped);
    for (int32_t c = 0; c < channels; ++c) outputs[c][i] = static_cast<float>(x[c] * g);
  }
}
