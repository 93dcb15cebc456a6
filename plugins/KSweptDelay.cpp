#include "plugins/KSweptDelay.h"

#include <algorithm>
#include <cmath>

#include "dsp/KSectionState.h"

void KSweptDelay::Prepare(double sampleRate, double longestSeconds) {
  rate_ = sampleRate;
  for (KDelayLine& line : lines_) line.Prepare(static_cast<int32_t>(std::ceil(longestSeconds * sampleRate)) + 4);
}

void KSweptDelay::Clear() noexcept {
  for (KDelayLine& line : lines_) line.Clear();
}

void KSweptDelay::Update(const Settings& s, bool jump) noexcept {
  voices_ = std::clamp(s.voices, 1, kMaxVoices);
  voiceScale_ = 1.0 / voices_;
  const double targets[kGlides] = {s.delay * rate_, s.depth * rate_, s.feedback, s.mix};
  glides_.Aim(targets, static_cast<int32_t>(0.02 * rate_), jump);
}

uint32_t KSweptDelay::TailSamples(const Settings& s, double sampleRate) noexcept {
  const double longest = (s.delay * (1.0 + kVoiceSpread * (kMaxVoices - 1)) + s.depth) * sampleRate + 4.0;
  const double feedback = std::min(std::abs(s.feedback), 0.99);
  const double rounds = feedback > 0.0 ? std::ceil(std::log(1e-5) / std::log(feedback)) + 1.0 : 1.0;
  return static_cast<uint32_t>(std::ceil(rounds * longest));
}

void KSweptDelay::Process(KPluginLFOs& lfos, const float* const* inputs, float* const* outputs, int32_t channels,
                          int32_t n) noexcept {
  for (int32_t done = 0; done < n; done += kPiece) {
    const int32_t m = std::min(kPiece, n - done);
    for (int32_t k = 0; k < kGlides; ++k) glides_.Fill(k, lanes_[k], m);
    glides_.Passed(m);
    const double* delay = lanes_[kDelayGlide];
    const double* depth = lanes_[kDepthGlide];
    const double* feedback = lanes_[kFeedbackGlide];
    const double* wet = lanes_[kWetGlide];
    for (int32_t c = 0; c < channels; ++c) {
      lfos.Fill(c, sweep_, m);
      const float* in = inputs[c] + done;
      float* out = outputs[c] + done;
      KDelayLine& line = lines_[c];
      for (int32_t i = 0; i < m; ++i) {
        const double x = std::isfinite(in[i]) ? in[i] : 0.0;
        const double up = 0.5 + 0.5 * sweep_[i], down = 1.0 - up;
        const double first = line.Read(delay[i] + depth[i] * up);
        double sum = first;
        for (int32_t v = 1; v < voices_; ++v)
          sum += line.Read(delay[i] * (1.0 + kVoiceSpread * v) + depth[i] * (v % 2 ? down : up));
        line.Write(KFlushTiny(x + feedback[i] * first));
        out[i] = static_cast<float>((1.0 - wet[i]) * x + wet[i] * voiceScale_ * sum);
      }
    }
  }
}
