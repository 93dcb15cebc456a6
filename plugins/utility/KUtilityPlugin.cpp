#include "plugins/utility/KUtilityPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr double kQuarterTurn = 1.5707963267948966;

void Multiply(double (&m)[4], const double (&by)[4]) {  // m = by x m
  const double r[4] = {by[0] * m[0] + by[1] * m[2], by[0] * m[1] + by[1] * m[3], by[2] * m[0] + by[3] * m[2],
                       by[2] * m[1] + by[3] * m[3]};
  std::copy(std::begin(r), std::end(r), std::begin(m));
}
}  // namespace

KUtilityPlugin::KUtilityPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KUtilityPlugin::Create(KModule*, const KPluginRecord*) { return new KUtilityPlugin; }

namespace {
constexpr KFactoryPreset::Value kMonoCheck[] = {{"mono", 1.0}};
constexpr KFactoryPreset::Value kWide[] = {{"width", 150.0}, {"gain", -1.5}};
constexpr KFactoryPreset::Value kPolarityFlip[] = {{"invertleft", 1.0}, {"invertright", 1.0}};
constexpr KFactoryPreset kPresets[] = {{"Mono check", kMonoCheck}, {"Wide", kWide}, {"Polarity flip", kPolarityFlip}};
}  // namespace

constinit const KPluginDescription kUtilityDescription{
    .key = "KUtilityPlugin",
    .factory = &KUtilityPlugin::Create,
    .moduleKey = "Utility",
    .category = "Stereo",
    .name = "Utility",
    .vst3SubCategories = "Fx|Tools",
    .vst2Id = "TvUt",
    .identity = "KUtilityPlugin",
    .help = &KUtilityHelp,
    .editor = &KUtilityEditor,
    .presets = kPresets,
};

void KUtilityPlugin::TargetMatrix(double (&m)[4]) const {
  auto on = [this](int32_t p) { return GetParameter(p).Working() >= 0.5; };
  const double gain = on(kMute) ? 0.0 : KDecibelsToLinear(GetParameter(kGain).Working());
  // Polarity acts on the inputs: it repairs a miswired channel, so it must come before any mix.
  m[0] = on(kInvertLeft) ? -gain : gain;
  m[1] = m[2] = 0.0;
  m[3] = on(kInvertRight) ? -gain : gain;
  if (ChannelsPerBus() == 1) return;  // one channel: nothing to swap, widen or balance
  if (on(kSwap)) Multiply(m, {0.0, 1.0, 1.0, 0.0});
  // Width scales the side signal: 0 % is mono, 200 % twice as wide.
  const double width = on(kMono) ? 0.0 : GetParameter(kWidth).Working() / 100.0;
  Multiply(m, {0.5 * (1.0 + width), 0.5 * (1.0 - width), 0.5 * (1.0 - width), 0.5 * (1.0 + width)});
  // Balance: the centre leaves both sides at unity; the side turned away fades on a quarter
  // sine, down to exact silence at the end.
  const double balance = GetParameter(kBalance).Working() / 100.0;
  const double left = balance > 0.0 ? std::sin((1.0 - balance) * kQuarterTurn) : 1.0;
  const double right = balance < 0.0 ? std::sin((1.0 + balance) * kQuarterTurn) : 1.0;
  Multiply(m, {left, 0.0, 0.0, right});
}

void KUtilityPlugin::ProcessUpdate() {
  double target[4];
  TargetMatrix(target);
  matrix_.Aim(target, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jumpToTarget_, false));
}

void KUtilityPlugin::ResetState() { jumpToTarget_ = true; }

void KUtilityPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  matrix_.Process(inputs, outputs, ChannelsPerBus(), sampleCount);
}
