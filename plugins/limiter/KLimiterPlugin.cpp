#include "plugins/limiter/KLimiterPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
// The released gain counts as back at unity this close to it, so that the gain returns to
// exactly 1 and quiet passages come out bit for bit.
constexpr double kUnity = 1.0 - 1e-9;

constexpr KFactoryPreset::Value kMasterSafety[] = {{"ceiling", -1.0}, {"release", 0.2}, {"lookahead", 0.005}};
constexpr KFactoryPreset::Value kLoudMaster[] = {{"inputgain", 6.0}, {"ceiling", -0.3}, {"release", 0.08}};
constexpr KFactoryPreset::Value kDrumCatcher[] = {{"inputgain", 3.0}, {"ceiling", -3.0}, {"release", 0.02}, {"lookahead", 0.001},
                                                  {"linkchannels", 0.0}};
constexpr KFactoryPreset kPresets[] = {{"Master safety", kMasterSafety}, {"Loud master", kLoudMaster}, {"Drum catcher", kDrumCatcher}};
}  // namespace

constinit const KPluginDescription kLimiterDescription{
    .key = "KLimiterPlugin",
    .factory = &KLimiterPlugin::Create,
    .moduleKey = "Limiter",
    .category = "Dynamics",
    .name = "Limiter",
    .vst3SubCategories = "Fx|Dynamics",
    .vst2Id = "TvLi",
    .identity = "KLimiterPlugin",
    .help = &KLimiterHelp,
    .editor = &KLimiterEditor,
    .presets = kPresets,
};

KLimiterPlugin::KLimiterPlugin() : KAudioPlugin(kParameters, kShape) { KLimiterPlugin::SetSampleRate(SampleRate()); }

KAudioPlugin* KLimiterPlugin::Create(KModule*, const KPluginRecord*) { return new KLimiterPlugin; }

int32_t KLimiterPlugin::LookaheadSamples() const noexcept {
  return std::max(1, static_cast<int32_t>(std::lround(GetParameter(kLookahead).Working() * SampleRate())));
}

bool KLimiterPlugin::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  Size(static_cast<int32_t>(std::ceil(kLookaheadKind.Maximum() * sampleRate)) + 1);
  lookahead_ = std::min(LookaheadSamples(), capacity_);
  Clear();
  ReportLatency(lookahead_);
  return true;
}

void KLimiterPlugin::Size(int32_t lookahead) {
  capacity_ = lookahead;
  const auto length = static_cast<size_t>(lookahead) + 2;
  for (Detector& d : detectors_) {
    d.when.assign(length, 0);
    d.need.assign(length, 1.0);
    d.ring.assign(length, 1.0);
  }
  for (auto& line : delay_) line.assign(length, 0.0);
}

void KLimiterPlugin::Clear() noexcept {
  for (Detector& d : detectors_) {
    d.head = d.count = 0;
    d.held = 1.0;
    std::fill(d.ring.begin(), d.ring.end(), 1.0);
    d.sum = lookahead_;
    d.below = 0;
  }
  for (auto& line : delay_) std::fill(line.begin(), line.end(), 0.0);
  delayAt_ = 0;
  now_ = 0;
}

void KLimiterPlugin::ResetState() {
  Clear();
  jump_ = true;
}

void KLimiterPlugin::ProcessUpdate() {
  const double rate = SampleRate();
  ceiling_ = KDecibelsToLinear(GetParameter(kCeiling).Working());
  release_ = KSmoothingCoefficient(rate, GetParameter(kRelease).Working());
  const int32_t lookahead = std::min(LookaheadSamples(), capacity_);
  if (lookahead != lookahead_) {
    lookahead_ = lookahead;
    Clear();
    ReportLatency(lookahead);
  }
  const double gain = KDecibelsToLinear(GetParameter(kInputGain).Working());
  inputGain_.Aim(&gain, static_cast<int32_t>(rate * kGlideSeconds), std::exchange(jump_, false));
  render_ = GetParameter(kLinkChannels).Working() >= 0.5 ? &KLimiterPlugin::Limit<true> : &KLimiterPlugin::Limit<false>;
}

uint32_t KLimiterPlugin::TailSamples() const noexcept {
  const double release = KSmoothingCoefficient(SampleRate(), GetParameter(kRelease).Working());
  const double climb = release > 0.0 ? std::ceil(std::log(1.0 - kUnity) / std::log(release)) : 0.0;
  return 2u * static_cast<uint32_t>(LookaheadSamples()) + static_cast<uint32_t>(climb);
}

// The gain for the sample that leaves the delay now, after `peak` entered it.
inline double KLimiterPlugin::Gain(Detector& d, double peak) noexcept {
  const int32_t size = capacity_ + 2;
  const double need = peak > ceiling_ ? ceiling_ / peak : 1.0;
  // Needs at or above the new one can never be the window's minimum again.
  while (d.count > 0 && d.need[(d.head + d.count - 1) % size] >= need) --d.count;
  const int32_t back = (d.head + d.count++) % size;
  d.when[back] = now_;
  d.need[back] = need;
  if (d.when[d.head] < now_ - lookahead_) d.head = (d.head + 1) % size, --d.count;
  double released = 1.0 - release_ * (1.0 - d.held);
  if (released > kUnity) released = 1.0;
  d.held = std::min(d.need[d.head], released);
  double& old = d.ring[delayAt_];
  d.sum += d.held - old;
  d.below += (d.held < 1.0) - (old < 1.0);
  old = d.held;
  if (d.below == 0) d.sum = lookahead_;
  return d.sum / lookahead_;
}

template <bool Linked>
void KLimiterPlugin::Limit(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  double gains[kMaxChunk];
  inputGain_.Fill(0, gains, n);
  inputGain_.Passed(n);
  for (int32_t i = 0; i < n; ++i) {
    double x[kChannels];
    double peak = 0.0;
    for (int32_t c = 0; c < channels; ++c) {
      const float in = inputs[c][i];
      x[c] = std::isfinite(in) ? in * gains[i] : 0.0;  // a NaN or infinity passes as silence
      peak = std::max(peak, std::abs(x[c]));
    }
    double g[kChannels];
    if constexpr (Linked) {
      g[0] = g[1] = Gain(detectors_[0], peak);
    } else {
      for (int32_t c = 0; c < channels; ++c) g[c] = Gain(detectors_[c], std::abs(x[c]));
    }
    for (int32_t c = 0; c < channels; ++c) {
      double& slot = delay_[c][static_cast<size_t>(delayAt_)];
      outputs[c][i] = static_cast<float>(slot * g[c]);
      slot = x[c];
      lowest_ = std::min(lowest_, g[c]);
    }
    delayAt_ = delayAt_ + 1 == lookahead_ ? 0 : delayAt_ + 1;
    ++now_;
  }
}

void KLimiterPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  lowest_ = 1.0;
  (this->*render_)(inputs, outputs, std::min(ChannelsPerBus(), kChannels), sampleCount);
  reduction_.store(static_cast<float>(std::max(KLinearToDecibels(lowest_), -200.0)), std::memory_order_relaxed);
}
