#include "kernel/KFactoryPreset.h"
#include "plugins/delay/KDelayPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KSectionRunner.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr double kCutQ = 0.7071067811865476;  // Butterworth: no peak at the cut

constexpr KFactoryPreset::Value kSlapback[] = {{"time", 0.09}, {"feedback", 10.0}, {"highcut", 5000.0}, {"mix", 25.0}};
constexpr KFactoryPreset::Value kDottedEighth[] = {{"sync", 10.0}, {"feedback", 45.0}, {"mix", 30.0}};
constexpr KFactoryPreset::Value kWidePingPong[] = {{"sync", 11.0}, {"feedback", 55.0}, {"pingpong", 1.0}, {"lowcut", 200.0}};
constexpr KFactoryPreset::Value kDarkTape[] = {{"time", 0.45}, {"feedback", 70.0}, {"highcut", 2500.0}, {"mix", 35.0}};
constexpr KFactoryPreset kPresets[] = {
    {"Slapback", kSlapback}, {"Dotted eighth", kDottedEighth}, {"Wide ping-pong", kWidePingPong}, {"Dark tape", kDarkTape}};
}  // namespace

KDelayPlugin::KDelayPlugin() : KAudioPlugin(kParameters, kShape) {
  for (KDelayLine& line : lines_) line.Prepare(static_cast<int32_t>(std::ceil(kLongestSeconds * SampleRate())) + 1);
}

KAudioPlugin* KDelayPlugin::Create(KModule*, const KPluginRecord*) { return new KDelayPlugin; }

constinit const KPluginDescription kDelayDescription{
    .key = "KDelayPlugin",
    .factory = &KDelayPlugin::Create,
    .moduleKey = "Delay",
    .category = "Reverb & Delay",
    .name = "Delay",
    .vst3SubCategories = "Fx|Delay",
    .vst2Id = "TvDl",
    .identity = "KDelayPlugin",
    .help = &KDelayHelp,
    .editor = &KDelayEditor,
    .presets = kPresets,
};

bool KDelayPlugin::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  for (KDelayLine& line : lines_) line.Prepare(static_cast<int32_t>(std::ceil(kLongestSeconds * sampleRate)) + 1);
  ResetState();
  return true;
}

void KDelayPlugin::ResetState() {
  for (KDelayLine& line : lines_) line.Clear();
  for (int32_t c = 0; c < kChannels; ++c) {
    lowState_[c].Clear();
    highState_[c].Clear();
  }
  jump_ = true;
}

double KDelayPlugin::DelaySeconds(double tempo) const noexcept {
  const auto note = static_cast<int32_t>(std::lround(GetParameter(kSync).Working())) - 1;
  return std::min(note < 0 ? GetParameter(kTime).Working() : KNoteSeconds(note, tempo), kLongestSeconds);
}

// The lowest low cut and the highest high cut leave their filters out: a plain echo.
void KDelayPlugin::DesignFilters(KFilterSection& lowCut, KFilterSection& highCut) const noexcept {
  const double rate = SampleRate(), low = GetParameter(kLowCut).Working(), high = GetParameter(kHighCut).Working();
  lowCut = KFilterSection{};
  highCut = KFilterSection{};
  if (low > kParameters[kLowCut].kind->Minimum()) lowCut.Design(KFilterSection::kHighPass, 0.0, std::min(low, 0.2 * rate), rate, kCutQ);
  if (high < kParameters[kHighCut].kind->Maximum() && high < 0.45 * rate)
    highCut.Design(KFilterSection::kLowPass, 0.0, high, rate, kCutQ);
}

void KDelayPlugin::Aim(bool jump) noexcept {
  // A time within a millionth of a sample of a whole sample (250 ms at 48 kHz, after its round
  // trip through the normalised value) is read as that sample: exactly, without interpolation.
  const double samples = DelaySeconds(tempo_.load(std::memory_order_relaxed)) * SampleRate();
  const double whole = std::round(samples);
  const double targets[kGlides] = {std::abs(samples - whole) < 1e-6 ? whole : samples,
                                   GetParameter(kFeedback).Working() / 100.0, GetParameter(kMix).Working() / 100.0};
  glides_.Aim(targets, static_cast<int32_t>(kGlideSeconds * SampleRate()), jump);
}

void KDelayPlugin::ProcessUpdate() {
  tempo_.store(KHostTempo(*this), std::memory_order_relaxed);
  Aim(std::exchange(jump_, false));
  DesignFilters(lowCut_, highCut_);
  pingPong_ = GetParameter(kPingPong).Working() >= 0.5 && ChannelsPerBus() == kChannels;
}

// One delay per repeat until feedback has taken an impulse of full scale below −100 dB, and
// the filters' ring; each pass smears a repeat a little further, which the ring counted four
// times covers.
uint32_t KDelayPlugin::TailSamples() const noexcept {
  KFilterSection sections[2];
  DesignFilters(sections[0], sections[1]);
  KSectionRunner::Row rows[2];
  for (int32_t j = 0; j < 2; ++j) std::copy_n(&sections[j].b0, 5, rows[j]);
  const double ring = KSectionRunner::RingSamples(rows, 2, 1e-7);
  const double feedback = GetParameter(kFeedback).Working() / 100.0;
  const double repeats = feedback > 0.0 ? std::ceil(std::log(1e-5) / std::log(feedback)) + 1.0 : 1.0;
  const double delay = DelaySeconds(tempo_.load(std::memory_order_relaxed)) * SampleRate();
  return static_cast<uint32_t>(std::min(repeats * (delay + 2.0) + 4.0 * ring, 4e9));
}

void KDelayPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  if (const double tempo = KHostTempo(*this); tempo != tempo_.load(std::memory_order_relaxed) && GetParameter(kSync).Working() >= 1.0) {
    tempo_.store(tempo, std::memory_order_relaxed);
    Aim(false);
  }
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  const double* low = &lowCut_.b0;
  const double* high = &highCut_.b0;
  for (int32_t done = 0; done < sampleCount; done += kPiece) {
    const int32_t n = std::min(kPiece, sampleCount - done);
    glides_.Fill(kDelayGlide, delay_, n);
    glides_.Fill(kFeedbackGlide, feedback_, n);
    glides_.Fill(kWetGlide, wet_, n);
    glides_.Passed(n);
    if (pingPong_) {
      // The mono sum enters the left line; each line's repeat feeds the other.
      const float* inL = inputs[0] + done;
      const float* inR = inputs[1] + done;
      float* outL = outputs[0] + done;
      float* outR = outputs[1] + done;
      for (int32_t i = 0; i < n; ++i) {
        const double xL = std::isfinite(inL[i]) ? inL[i] : 0.0, xR = std::isfinite(inR[i]) ? inR[i] : 0.0;
        const double yL = KFlushTiny(highState_[0].Step(high, lowState_[0].Step(low, lines_[0].Read(delay_[i]))));
        const double yR = KFlushTiny(highState_[1].Step(high, lowState_[1].Step(low, lines_[1].Read(delay_[i]))));
        lines_[0].Write(KFlushTiny(0.5 * (xL + xR) + feedback_[i] * yR));
        lines_[1].Write(KFlushTiny(feedback_[i] * yL));
        const double dry = 1.0 - wet_[i];
        outL[i] = static_cast<float>(dry * xL + wet_[i] * yL);
        outR[i] = static_cast<float>(dry * xR + wet_[i] * yR);
      }
      continue;
    }
    for (int32_t c = 0; c < channels; ++c) {
      const float* in = inputs[c] + done;
      float* out = outputs[c] + done;
      KDelayLine& line = lines_[c];
      for (int32_t i = 0; i < n; ++i) {
        const double x = std::isfinite(in[i]) ? in[i] : 0.0;
        const double y = KFlushTiny(highState_[c].Step(high, lowState_[c].Step(low, line.Read(delay_[i]))));
        line.Write(KFlushTiny(x + feedback_[i] * y));
        out[i] = static_cast<float>((1.0 - wet_[i]) * x + wet_[i] * y);
      }
    }
  }
}
