#include "plugins/warmer/KSampleWarmer.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kPluginShape{1, 1, false, false, false};

// A gentle slope: the tilt's shelves blend over several octaves about the pivot.
constexpr double kTiltQ = 0.5;
// The tube curve's bias: the positive half saturates sooner than the negative one, which adds
// even harmonics and a level-dependent DC offset (removed behind the curve).
constexpr double kTubeBias = 0.25;

// x − 4x³/27 up to |x| = 1.5, where it meets ±1 with zero slope.
void SoftClip(double* samples, int32_t count) noexcept {
  for (int32_t i = 0; i < count; ++i) {
    const double x = std::clamp(samples[i], -1.5, 1.5);
    samples[i] = x - (4.0 / 27.0) * x * x * x;
  }
}

void Tanh(double* samples, int32_t count) noexcept {
  for (int32_t i = 0; i < count; ++i) samples[i] = std::tanh(samples[i]);
}

// tanh moved off centre, shifted back through the origin and scaled to a slope of 1 there;
// it ends at +0.80 and −1.32.
void Tube(double* samples, int32_t count) noexcept {
  const double offset = std::tanh(kTubeBias);
  const double scale = 1.0 / (1.0 - offset * offset);
  for (int32_t i = 0; i < count; ++i) samples[i] = (std::tanh(samples[i] + kTubeBias) - offset) * scale;
}
}  // namespace

KSampleWarmer::Curve KSampleWarmer::CurveOf(int32_t shape) noexcept {
  constexpr Curve kCurves[] = {&SoftClip, &Tanh, &Tube};
  return kCurves[std::clamp(shape, 0, kShapeCount - 1)];
}

int32_t KSampleWarmer::OversamplingFor(double sampleRate) noexcept { return sampleRate < 88200.0 ? 4 : 2; }

KSampleWarmer::KSampleWarmer() : KAudioPlugin(kParameters, kPluginShape) { Configure(); }

KAudioPlugin* KSampleWarmer::Create(KModule*, const KPluginRecord*) { return new KSampleWarmer; }

namespace {
constexpr KFactoryPreset::Value kSubtleWarmth[] = {{"drive", 3.0}, {"mix", 50.0}};
constexpr KFactoryPreset::Value kCrunch[] = {{"drive", 18.0}, {"shape", KSampleWarmer::kSoftClip}, {"outputgain", -6.0}};
constexpr KFactoryPreset::Value kDarkSaturation[] = {{"drive", 12.0}, {"shape", KSampleWarmer::kTanh}, {"tone", -40.0}, {"outputgain", -3.0}};
constexpr KFactoryPreset kPresets[] = {{"Subtle warmth", kSubtleWarmth}, {"Crunch", kCrunch}, {"Dark saturation", kDarkSaturation}};
}  // namespace

constinit const KPluginDescription kSampleWarmerDescription{
    .key = "KSampleWarmer",
    .factory = &KSampleWarmer::Create,
    .moduleKey = "SampleWarmer",
    .category = "Distortion",
    .name = "SampleWarmer",
    .vst3SubCategories = "Fx|Distortion",
    .vst2Id = "TvSW",
    .identity = "KSampleWarmer",
    .help = &KSampleWarmerHelp,
    .editor = &KSampleWarmerEditor,
    .presets = kPresets,
};

bool KSampleWarmer::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  Configure();
  return true;
}

void KSampleWarmer::Configure() noexcept {
  const int32_t factor = OversamplingFor(SampleRate());
  for (KHalfBandOversampler& oversampler : oversamplers_) oversampler.SetFactor(factor);
  latency_ = KHalfBandOversampler::LatencyFor(factor);
  ClearDelay();
  filters_.Reset();
  jump_ = true;
  // The core counts latency at the processing rate and divides by the factor for hosts.
  SetOversampling(factor);
  ReportLatency(latency_ * factor);
}

void KSampleWarmer::ClearDelay() noexcept {
  for (auto& channel : delay_) std::fill(std::begin(channel), std::end(channel), 0.0f);
  delayAt_ = 0;
}

void KSampleWarmer::ResetState() {
  for (KHalfBandOversampler& oversampler : oversamplers_) oversampler.Reset();
  filters_.Reset();
  ClearDelay();
  jump_ = true;
}

void KSampleWarmer::ProcessUpdate() {
  const double rate = SampleRate();
  const double targets[kGlides] = {KDecibelsToLinear(GetParameter(kDrive).Working()),
                                    KDecibelsToLinear(GetParameter(kOutputGain).Working()),
                                    GetParameter(kMix).Working() / 100.0};
  glides_.Aim(targets, static_cast<int32_t>(rate * kGlideSeconds), std::exchange(jump_, false));

  curve_ = CurveOf(static_cast<int32_t>(std::lround(GetParameter(kShape).Working())));
  filters_.SetSections(sections_, DesignFilters(sections_));
}

int32_t KSampleWarmer::DesignFilters(KFilterSection (&sections)[3]) const noexcept {
  const double rate = SampleRate();
  // At very low rates the pivot stays well below the Nyquist frequency.
  const double pivot = std::min(kTiltHz, 0.25 * rate);
  const double tilt = kTiltDb * GetParameter(kTone).Working() / 100.0;
  sections[0].Design(KFilterSection::kLowShelf, -tilt, pivot, rate, kTiltQ);
  sections[1].Design(KFilterSection::kHighShelf, tilt, pivot, rate, kTiltQ);
  sections[2].Design(KFilterSection::kBilinearHighPass, 0.0, kDCBlockerHz, rate, 1.0);
  // Only the asymmetric curve makes DC; the others keep their low end untouched.
  return std::lround(GetParameter(kShape).Working()) == kTube ? 3 : 2;
}

// The dry path's delay, the oversampler's filters on the way up and down (each about as long
// as the latency), then the tilt and the DC blocker ringing out to −140 dB.
uint32_t KSampleWarmer::TailSamples() const noexcept {
  KFilterSection sections[3];
  const int32_t count = DesignFilters(sections);
  KSectionRunner::Row rows[3];
  for (int32_t j = 0; j < count; ++j) {
    const double row[5] = {sections[j].b0, sections[j].minusA1, sections[j].b1, sections[j].minusA2, sections[j].b2};
    std::copy_n(row, 5, rows[j]);
  }
  const uint32_t ring = KSectionRunner::RingSamples(rows, count, 1e-7);
  return ring == UINT32_MAX ? ring : ring + 2u * static_cast<uint32_t>(KHalfBandOversampler::LatencyFor(OversamplingFor(SampleRate())));
}

void KSampleWarmer::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  const float* in[kChannels];
  float* out[kChannels];
  for (int32_t done = 0; done < sampleCount; done += kPiece) {
    for (int32_t c = 0; c < channels; ++c) {
      in[c] = inputs[c] + done;
      out[c] = outputs[c] + done;
    }
    ProcessPiece(in, out, channels, std::min(kPiece, sampleCount - done));
  }
}

void KSampleWarmer::ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels,
                                 int32_t frames) noexcept {
  glides_.Fill(kDriveGlide, driveGain_, frames);
  glides_.Fill(kOutputGlide, outputGain_, frames);
  glides_.Fill(kMixGlide, wetShare_, frames);
  glides_.Passed(frames);
  const int32_t factor = oversamplers_[0].Factor();
  constexpr int32_t kMask = kDelaySize - 1;

  // Every channel's input is read before any output is written: hosts may hand the same
  // buffers for both.
  for (int32_t c = 0; c < channels; ++c) {
    const float* input = inputs[c];
    float* line = delay_[c];
    for (int32_t i = 0, at = delayAt_; i < frames; ++i, at = (at + 1) & kMask) {
      const float x = std::isfinite(input[i]) ? input[i] : 0.0f;
      line[at] = x;
      dry_[c][i] = line[(at - latency_) & kMask];
      base_[i] = x * driveGain_[i];
    }
    oversamplers_[c].Up(base_, high_, frames);
    curve_(high_, factor * frames);
    oversamplers_[c].Down(high_, base_, frames);
    for (int32_t i = 0; i < frames; ++i) wet_[c][i] = static_cast<float>(base_[i]);
  }
  delayAt_ = (delayAt_ + frames) & kMask;

  float* wet[kChannels] = {wet_[0], wet_[1]};
  const float* wetIn[kChannels] = {wet_[0], wet_[1]};
  filters_.Process(wetIn, wet, channels, frames);

  for (int32_t c = 0; c < channels; ++c) {
    float* output = outputs[c];
    for (int32_t i = 0; i < frames; ++i) {
      const double share = wetShare_[i];
      output[i] = static_cast<float>(outputGain_[i] * ((1.0 - share) * dry_[c][i] + share * wet_[c][i]));
    }
  }
}
