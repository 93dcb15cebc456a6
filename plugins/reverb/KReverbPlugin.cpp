#include "kernel/KFactoryPreset.h"
#include "plugins/reverb/KReverbPlugin.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KSectionState.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};

// Line lengths at 100 % size, in seconds: unrelated, so that their echoes never line up.
constexpr double kLineSeconds[KReverbPlugin::kLines] = {0.0297, 0.0371, 0.0411, 0.0437, 0.0533, 0.0619, 0.0713, 0.0797};
constexpr double kDiffuserSeconds[KReverbPlugin::kDiffusers] = {0.0047, 0.0036, 0.0127, 0.0093};
constexpr double kDiffusion = 0.6;
// The damping filters' pole at full damping.
constexpr double kMostDamping = 0.7;
// Output signs: the left takes the lines as they are, the right every other one inverted; the
// two patterns are orthogonal.
constexpr double kRightSign[KReverbPlugin::kLines] = {1, -1, 1, -1, 1, -1, 1, -1};
constexpr double kOutputScale = 0.35355339059327373;  // 1/√8

constexpr KFactoryPreset::Value kSmallRoom[] = {{"predelay", 0.005}, {"decay", 0.6}, {"size", 60.0}, {"damping", 50.0}};
constexpr KFactoryPreset::Value kHall[] = {{"predelay", 0.025}, {"decay", 3.2}, {"size", 160.0}, {"mix", 30.0}};
constexpr KFactoryPreset::Value kBrightPlate[] = {{"decay", 1.8}, {"size", 80.0}, {"damping", 5.0}, {"mix", 20.0}};
constexpr KFactoryPreset::Value kEndlessPad[] = {{"decay", 15.0}, {"size", 200.0}, {"damping", 60.0}, {"mix", 50.0}};
constexpr KFactoryPreset kPresets[] = {
    {"Small room", kSmallRoom}, {"Hall", kHall}, {"Bright plate", kBrightPlate}, {"Endless pad", kEndlessPad}};

// In place: the 8-point Hadamard transform scaled by 1/√8, which is orthogonal.
void Hadamard(double (&v)[KReverbPlugin::kLines]) noexcept {
  for (int32_t span = 1; span < KReverbPlugin::kLines; span *= 2)
    for (int32_t i = 0; i < KReverbPlugin::kLines; i += 2 * span)
      for (int32_t j = i; j < i + span; ++j) {
        const double a = v[j], b = v[j + span];
        v[j] = a + b;
        v[j + span] = a - b;
      }
  for (double& x : v) x *= kOutputScale;
}
}  // namespace

KReverbPlugin::KReverbPlugin() : KAudioPlugin(kParameters, kShape) { Prepare(); }

KAudioPlugin* KReverbPlugin::Create(KModule*, const KPluginRecord*) { return new KReverbPlugin; }

constinit const KPluginDescription kReverbDescription{
    .key = "KReverbPlugin",
    .factory = &KReverbPlugin::Create,
    .moduleKey = "Reverb",
    .category = "Reverb & Delay",
    .name = "Reverb",
    .vst3SubCategories = "Fx|Reverb",
    .vst2Id = "TvRv",
    .identity = "KReverbPlugin",
    .help = &KReverbHelp,
    .editor = &KReverbEditor,
    .presets = kPresets,
};

int32_t KReverbPlugin::LineLength(int32_t line) const noexcept {
  return std::max(3, static_cast<int32_t>(std::lround(kLineSeconds[line] * GetParameter(kSize).Working() / 100.0 * SampleRate())));
}

int32_t KReverbPlugin::DiffuserLength(int32_t diffuser) const noexcept {
  return std::max(1, static_cast<int32_t>(std::lround(kDiffuserSeconds[diffuser] * SampleRate())));
}

int32_t KReverbPlugin::PreDelaySamples() const noexcept {
  return std::max(1, static_cast<int32_t>(std::lround(GetParameter(kPreDelay).Working() * SampleRate())));
}

// Sizes every line for the longest lengths the parameters allow, so that the size may change
// on the audio thread without allocating.
void KReverbPlugin::Prepare() {
  const double rate = SampleRate();
  preDelay_.Prepare(static_cast<int32_t>(std::ceil(kParameters[kPreDelay].kind->Maximum() * rate)) + 1);
  for (int32_t d = 0; d < kDiffusers; ++d) diffusers_[d].Prepare(DiffuserLength(d) + 1);
  for (int32_t j = 0; j < kLines; ++j)
    lines_[j].Prepare(static_cast<int32_t>(std::ceil(kLineSeconds[j] * kParameters[kSize].kind->Maximum() / 100.0 * rate)) + 1);
  ResetState();
}

bool KReverbPlugin::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  Prepare();
  return true;
}

void KReverbPlugin::ResetState() {
  preDelay_.Clear();
  for (KDelayLine& line : diffusers_) line.Clear();
  for (KDelayLine& line : lines_) line.Clear();
  std::fill(std::begin(lowPass_), std::end(lowPass_), 0.0);
  jump_ = true;
}

void KReverbPlugin::ProcessUpdate() {
  const double rate = SampleRate(), decay = GetParameter(kDecay).Working();
  for (int32_t j = 0; j < kLines; ++j) lengths_[j] = LineLength(j);
  for (int32_t d = 0; d < kDiffusers; ++d) diffuserLengths_[d] = DiffuserLength(d);
  double targets[kGlides];
  for (int32_t j = 0; j < kLines; ++j) targets[j] = std::pow(10.0, -3.0 * lengths_[j] / (decay * rate));
  targets[kDampingGlide] = kMostDamping * GetParameter(kDamping).Working() / 100.0;
  const double wet = GetParameter(kMix).Working() / 100.0, width = GetParameter(kWidth).Working() / 100.0;
  targets[kDryGlide] = 1.0 - wet;
  targets[kWetGlide] = wet;
  targets[kSideGlide] = wet * width;
  glides_.Aim(targets, static_cast<int32_t>(kGlideSeconds * rate), std::exchange(jump_, false));
}

double KReverbPlugin::DecaySeconds(double hz) const noexcept {
  const double rate = SampleRate(), decay = GetParameter(kDecay).Working();
  double mean = 0.0;
  for (int32_t j = 0; j < kLines; ++j) mean += LineLength(j) / double(kLines);
  // The damping filter (1 − p) / (1 − p·z⁻¹) at the frequency, in dB per pass.
  const double pole = kMostDamping * GetParameter(kDamping).Working() / 100.0;
  const std::complex<double> z = std::polar(1.0, -2.0 * 3.141592653589793 * std::min(hz, 0.5 * rate) / rate);
  const double passDb = 20.0 * std::log10(std::abs((1.0 - pole) / (1.0 - pole * z)));
  const double fallPerSecond = 60.0 / decay - passDb * rate / mean;
  return 60.0 / fallPerSecond;
}

// The pre-delay and the diffusers' smear, then the network's fall by 100 dB (a little more
// than 5/3 of the decay time) and the longest line's last echo.
uint32_t KReverbPlugin::TailSamples() const noexcept {
  const double rate = SampleRate();
  double diffusers = 0.0;
  for (int32_t d = 0; d < kDiffusers; ++d) diffusers += DiffuserLength(d);
  // An allpass of gain g rings on for log(1e-5)/log(g) rounds of its length.
  diffusers *= std::ceil(std::log(1e-5) / std::log(kDiffusion));
  const double fall = 1.75 * GetParameter(kDecay).Working() * rate;
  return static_cast<uint32_t>(PreDelaySamples() + diffusers + fall + LineLength(kLines - 1));
}

void KReverbPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = std::min(ChannelsPerBus(), 2);
  const int32_t preDelay = PreDelaySamples();
  const double inputShare = 1.0 / channels;
  const double sideShare = channels == 2 ? 1.0 : 0.0;  // one channel: the mid alone
  for (int32_t done = 0; done < sampleCount; done += kPiece) {
    const int32_t n = std::min(kPiece, sampleCount - done);
    for (int32_t k = 0; k < kGlides; ++k) glides_.Fill(k, lanes_[k], n);
    glides_.Passed(n);
    const float* inL = inputs[0] + done;
    const float* inR = inputs[channels - 1] + done;
    float* outL = outputs[0] + done;
    float* outR = outputs[channels - 1] + done;
    for (int32_t i = 0; i < n; ++i) {
      const double xL = std::isfinite(inL[i]) ? inL[i] : 0.0, xR = std::isfinite(inR[i]) ? inR[i] : 0.0;
      double x = preDelay_.ReadWhole(preDelay);
      preDelay_.Write(inputShare * (channels == 2 ? xL + xR : xL));
      for (int32_t d = 0; d < kDiffusers; ++d) {
        const double z = diffusers_[d].ReadWhole(diffuserLengths_[d]);
        const double w = KFlushTiny(x + kDiffusion * z);
        diffusers_[d].Write(w);
        x = z - kDiffusion * w;
      }
      double v[kLines];
      double left = 0.0, right = 0.0;
      const double pole = lanes_[kDampingGlide][i];
      for (int32_t j = 0; j < kLines; ++j) {
        lowPass_[j] = KFlushTiny((1.0 - pole) * lines_[j].ReadWhole(lengths_[j]) + pole * lowPass_[j]);
        v[j] = lowPass_[j];
        left += v[j];
        right += kRightSign[j] * v[j];
      }
      Hadamard(v);
      for (int32_t j = 0; j < kLines; ++j) lines_[j].Write(KFlushTiny(lanes_[j][i] * v[j] + (j % 2 ? -x : x)));
      // Mid and side of the two outputs; the side scaled by the width.
      const double mid = 0.5 * kOutputScale * (left + right), side = 0.5 * kOutputScale * (left - right);
      const double dry = lanes_[kDryGlide][i], wet = lanes_[kWetGlide][i], wide = sideShare * lanes_[kSideGlide][i];
      outL[i] = static_cast<float>(dry * xL + wet * mid + wide * side);
      outR[i] = static_cast<float>(dry * xR + wet * mid - wide * side);
    }
  }
}
