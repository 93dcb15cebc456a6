#include "plugins/utility/KUtilityPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"

namespace {
const KDecibelKind kGainKind(-60.0, 24.0);
const KBalanceKind kBalanceKind;
const KLinearKind kWidthKind(0.0, 200.0, "%", "{0.0}");
const KSwitchKind kSwitch;
constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

constexpr KParameterInfo kParameters[] = {
    {"gain", "Gain", &kGainKind, 0.0, kAutomatable},
    {"balance", "Balance", &kBalanceKind, 0.0, kAutomatable},
    {"width", "Width", &kWidthKind, 100.0, kAutomatable},
    {"invertleft", "Invert left", &kSwitch, 0.0, kAutomatable},
    {"invertright", "Invert right", &kSwitch, 0.0, kAutomatable},
    {"swap", "Swap channels", &kSwitch, 0.0, kAutomatable},
    {"mono", "Mono", &kSwitch, 0.0, kAutomatable},
    {"mute", "Mute", &kSwitch, 0.0, kAutomatable},
};
static_assert(std::size(kParameters) == KUtilityPlugin::kParameterCount);

constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr double kQuarterTurn = 1.5707963267948966;

// dB to a linear factor.
double Linear(double decibels) { return std::exp(0.11512925464970228 * decibels); }

void Multiply(double (&m)[4], const double (&by)[4]) {  // m = by x m
  const double r[4] = {by[0] * m[0] + by[1] * m[2], by[0] * m[1] + by[1] * m[3], by[2] * m[0] + by[3] * m[2],
                       by[2] * m[1] + by[3] * m[3]};
  std::copy(std::begin(r), std::end(r), std::begin(m));
}
}  // namespace

KUtilityPlugin::KUtilityPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KUtilityPlugin::Create(KModule*, const KPluginRecord*) { return new KUtilityPlugin; }

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
};

void KUtilityPlugin::TargetMatrix(double (&m)[4]) const {
  auto on = [this](int32_t p) { return GetParameter(p).Working() >= 0.5; };
  const double gain = on(kMute) ? 0.0 : Linear(GetParameter(kGain).Working());
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
  TargetMatrix(target_);
  if (jumpToTarget_) {
    std::copy(std::begin(target_), std::end(target_), std::begin(current_));
    glideLeft_ = 0;
    jumpToTarget_ = false;
    return;
  }
  glideLeft_ = std::max(1, static_cast<int32_t>(SampleRate() * kGlideSeconds));
  for (int k = 0; k < 4; ++k) step_[k] = (target_[k] - current_[k]) / glideLeft_;
}

void KUtilityPlugin::ResetState() { jumpToTarget_ = true; }

void KUtilityPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t gliding = std::min(glideLeft_, sampleCount);
  if (ChannelsPerBus() == 1) {
    const float* in = inputs[0];
    float* out = outputs[0];
    double g = current_[0];
    for (int32_t i = 0; i < gliding; ++i, g += step_[0]) out[i] = static_cast<float>(in[i] * g);
    current_[0] = gliding == glideLeft_ ? target_[0] : g;
    for (int32_t i = gliding; i < sampleCount; ++i) out[i] = static_cast<float>(in[i] * current_[0]);
  } else {
    const float* inL = inputs[0];
    const float* inR = inputs[1];
    float* outL = outputs[0];
    float* outR = outputs[1];
    double a = current_[0], b = current_[1], c = current_[2], d = current_[3];
    for (int32_t i = 0; i < gliding; ++i) {
      const double l = inL[i], r = inR[i];
      outL[i] = static_cast<float>(a * l + b * r);
      outR[i] = static_cast<float>(c * l + d * r);
      a += step_[0], b += step_[1], c += step_[2], d += step_[3];
    }
    if (gliding == glideLeft_) {
      a = target_[0], b = target_[1], c = target_[2], d = target_[3];
    }
    current_[0] = a, current_[1] = b, current_[2] = c, current_[3] = d;
    for (int32_t i = gliding; i < sampleCount; ++i) {
      const double l = inL[i], r = inR[i];
      outL[i] = static_cast<float>(a * l + b * r);
      outR[i] = static_cast<float>(c * l + d * r);
    }
  }
  glideLeft_ -= gliding;
}
