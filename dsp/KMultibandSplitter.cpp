#include "dsp/KMultibandSplitter.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"

namespace {

// Butterworth sections: squared, they are the Linkwitz-Riley halves.
constexpr double kButterworthQ = 0.7071067811865476;
// State below this (−400 dB) is silence; clearing it keeps denormals out and lets silence
// come out as exact zeros.
constexpr double kSilent = 1e-20;

KMultibandSplitter::Section Designed(int32_t type, double frequency, double sampleRate) noexcept {
  KFilterSection design;
  design.Design(type, 0.0, frequency, sampleRate, kButterworthQ);
  return {design.b0, design.minusA1, design.b1, design.minusA2, design.b2};
}

// One sample through one section in transposed direct form II.
inline double Tick(const KMultibandSplitter::Section& k, double& s1, double& s2, double x) noexcept {
  const double y = k.b0 * x + s1;
  s1 = k.b1 * x + k.minusA1 * y + s2;
  s2 = k.b2 * x + k.minusA2 * y;
  return y;
}

}  // namespace

void KMultibandSplitter::Prepare(int32_t maxFrames) {
  maxFrames_ = std::max(maxFrames, 1);
  rest_.assign(static_cast<size_t>(maxFrames_), 0.0);
  Reset();
}

void KMultibandSplitter::SetCrossovers(const double* frequencies, int32_t bands, double sampleRate) noexcept {
  bands = std::clamp(bands, kMinBands, kMaxBands);
  if (bands != bands_) Reset();
  bands_ = bands;
  double floor = kLowestFrequency;
  for (int32_t k = 0; k + 1 < bands; ++k) {
    const double f = std::clamp(frequencies[k], floor, kHighestShare * sampleRate);
    frequencies_[k] = floor = f;
    low_[k] = Designed(KFilterSection::kLowPass, f, sampleRate);
    high_[k] = Designed(KFilterSection::kHighPass, f, sampleRate);
    allPass_[k] = Designed(KFilterSection::kAllPass, f, sampleRate);
  }
}

void KMultibandSplitter::Reset() noexcept {
  for (ChannelState& state : channels_) state = {};
}

uint32_t KMultibandSplitter::RingSamples(double fall) const noexcept {
  KSectionRunner::Row rows[2 * kMaxCrossovers];
  int32_t count = 0;
  for (int32_t k = 0; k + 1 < bands_; ++k) {
    const Section& s = allPass_[k];
    for (int32_t twice = 0; twice < 2; ++twice) {
      const double row[5] = {s.b0, s.minusA1, s.b1, s.minusA2, s.b2};
      std::copy_n(row, 5, rows[count++]);
    }
  }
  return KSectionRunner::RingSamples(rows, count, fall);
}

template <int Turns>
void KMultibandSplitter::Split(const KMultibandSplitter& self, int32_t k, ChannelState& state, double* rest, float* out,
                               int32_t frames) noexcept {
  const Section low = self.low_[k], high = self.high_[k];
  State* s = state.split[k];
  State l1 = s[kLow1], l2 = s[kLow2], h1 = s[kHigh1], h2 = s[kHigh2];
  // The phase turns of the crossovers above, which the bands above pass in their halves.
  constexpr int kSlots = Turns > 0 ? Turns : 1;
  Section turn[kSlots];
  State p[kSlots];
  for (int m = 0; m < Turns; ++m) turn[m] = self.allPass_[k + 1 + m], p[m] = state.phase[k][k + 1 + m];
  for (int32_t i = 0; i < frames; ++i) {
    const double x = rest[i];
    double y = Tick(low, l2.s1, l2.s2, Tick(low, l1.s1, l1.s2, x));
    rest[i] = Tick(high, h2.s1, h2.s2, Tick(high, h1.s1, h1.s2, x));
    for (int m = 0; m < Turns; ++m) y = Tick(turn[m], p[m].s1, p[m].s2, y);
    out[i] = static_cast<float>(y);
  }
  s[kLow1] = l1, s[kLow2] = l2, s[kHigh1] = h1, s[kHigh2] = h2;
  for (int m = 0; m < Turns; ++m) state.phase[k][k + 1 + m] = p[m];
}

void KMultibandSplitter::Process(int32_t channel, const float* input, float* const* bands, int32_t frames) noexcept {
  using Kernel = void (*)(const KMultibandSplitter&, int32_t, ChannelState&, double*, float*, int32_t) noexcept;
  // Indexed by the number of crossovers above the one being split.
  static constexpr Kernel kSplits[kMaxCrossovers] = {Split<0>, Split<1>, Split<2>, Split<3>, Split<4>};
  frames = std::min(frames, maxFrames_);
  ChannelState& state = channels_[channel];
  double* rest = rest_.data();
  for (int32_t i = 0; i < frames; ++i) rest[i] = input[i];
  const int32_t crossovers = bands_ - 1;
  for (int32_t k = 0; k < crossovers; ++k) kSplits[crossovers - 1 - k](*this, k, state, rest, bands[k], frames);
  float* top = bands[crossovers];
  for (int32_t i = 0; i < frames; ++i) top[i] = static_cast<float>(rest[i]);
  Settle(state);
}

void KMultibandSplitter::Settle(ChannelState& state) noexcept {
  auto settle = [](State& s) {
    for (double* v : {&s.s1, &s.s2}) {
      const double magnitude = std::abs(*v);
      if (!(magnitude >= kSilent && magnitude <= std::numeric_limits<double>::max())) *v = 0.0;
    }
  };
  for (auto& crossover : state.split)
    for (State& s : crossover) settle(s);
  for (auto& band : state.phase)
    for (State& s : band) settle(s);
}
