#include "dsp/KHalfBandOversampler.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <iterator>

namespace {

// Kaiser window shapes, each the one that gives its doubling the deepest stop band for its
// length and transition band.
constexpr double kOuterBeta = 8.44;
constexpr double kInnerBeta = 10.09;
constexpr double kPi = 3.141592653589793;

// Modified Bessel function of the first kind, order 0, by its power series (the terms fall
// fast for the window's arguments, all below 15).
double BesselI0(double x) noexcept {
  double sum = 1.0, term = 1.0;
  for (int k = 1; k < 100 && term > 1e-17 * sum; ++k) {
    const double half = x / (2.0 * k);
    term *= half * half;
    sum += term;
  }
  return sum;
}

}  // namespace

KHalfBandOversampler::Stage::Stage(int32_t pairs, double beta) noexcept : pairs_(std::clamp(pairs, 1, kMaxPairs)) {
  // The ideal half-band response sin(πo/2)/(πo) at odd offsets o, under a Kaiser window that
  // reaches zero at offset 2K (the first even offset past the last pair). The taps are then
  // scaled to sum to 1/4, so that with the centre tap of 1/2 the gain at DC is exactly 1 and the
  // interpolated phase passes a constant unchanged.
  const double halfWidth = 2.0 * pairs_;
  double sum = 0.0;
  for (int32_t j = 0; j < pairs_; ++j) {
    const double offset = 2.0 * j + 1.0;
    const double r = offset / halfWidth;
    const double window = BesselI0(beta * std::sqrt(1.0 - r * r)) / BesselI0(beta);
    taps_[j] = (j % 2 == 0 ? 1.0 : -1.0) / (kPi * offset) * window;
    sum += taps_[j];
  }
  for (int32_t j = 0; j < pairs_; ++j) {
    taps_[j] *= 0.25 / sum;
    doubled_[j] = 2.0 * taps_[j];
  }
  up_.length = paired_.length = 2 * pairs_;
  SetPhase(0);
}

void KHalfBandOversampler::Stage::SetPhase(int32_t phase) noexcept {
  phase_ = phase == 1 ? 1 : 0;
  // Phase 0 takes the odd samples as centres, K of them behind the newest pair; phase 1 the
  // even ones, which sit one high-rate sample later in the window.
  centres_.length = pairs_ + 1 - phase_;
  Reset();
}

void KHalfBandOversampler::Stage::Reset() noexcept {
  for (History* h : {&up_, &paired_, &centres_}) {
    std::fill(std::begin(h->data), std::end(h->data), 0.0);
    h->at = 0;
  }
}

double KHalfBandOversampler::Stage::PairSum(const double* window, const double* taps) const noexcept {
  const double* below = window + pairs_ - 1;
  const double* above = window + pairs_;
  // Two running sums: a single chain of dependent additions would wait on the adder's latency
  // for every pair.
  double even = 0.0, odd = 0.0;
  int32_t j = 0;
  for (; j + 2 <= pairs_; j += 2) {
    even += taps[j] * (below[-j] + above[j]);
    odd += taps[j + 1] * (below[-j - 1] + above[j + 1]);
  }
  if (j < pairs_) even += taps[j] * (below[-j] + above[j]);
  return even + odd;
}

void KHalfBandOversampler::Stage::Up(const double* input, double* output, int32_t frames) noexcept {
  // Of the filtered zero-stuffed stream, the sample between two inputs is the tap-pair sum and
  // the one on an input is that input itself (centre tap 1/2, doubled).
  for (int32_t i = 0; i < frames; ++i) {
    up_.Push(input[i]);
    const double* window = up_.Window();
    const double between = PairSum(window, doubled_);
    const double on = window[pairs_];
    output[2 * i] = between;
    output[2 * i + 1] = on;
  }
}

void KHalfBandOversampler::Stage::Down(const double* input, double* output, int32_t frames) noexcept {
  for (int32_t i = 0; i < frames; ++i) {
    const double paired = input[2 * i + phase_];
    const double centre = input[2 * i + 1 - phase_];
    paired_.Push(paired);
    centres_.Push(centre);
    output[i] = 0.5 * centres_.Window()[0] + PairSum(paired_.Window(), taps_);
  }
}

KHalfBandOversampler::KHalfBandOversampler(int32_t factor) noexcept
    : outer_(kOuterPairs, kOuterBeta), inner_(kInnerPairs, kInnerBeta) {
  SetFactor(factor);
}

void KHalfBandOversampler::SetFactor(int32_t factor) noexcept {
  factor_ = factor == 2 || factor == 4 ? factor : 1;
  // Each round trip through one doubling delays by 2K − 1 samples of its own rate, an odd
  // number. Alone, the outer doubling's is even at the high rate and phase 0 lands on whole base
  // samples; behind the inner pair's odd delay the outer decimator takes phase 1 instead.
  outer_.SetPhase(factor_ == 4 ? 1 : 0);
  inner_.SetPhase(0);
}

void KHalfBandOversampler::Reset() noexcept {
  outer_.Reset();
  inner_.Reset();
}

void KHalfBandOversampler::Up(const double* input, double* output, int32_t frames) noexcept {
  if (frames <= 0) return;
  if (factor_ == 1) {
    std::copy(input, input + frames, output);
  } else if (factor_ == 2) {
    outer_.Up(input, output, frames);
  } else {
    // The outer doubling writes into the top half; the inner one reads it from there while
    // filling the buffer from the start, never overtaking its reading.
    double* middle = output + 2 * frames;
    outer_.Up(input, middle, frames);
    inner_.Up(middle, output, 2 * frames);
  }
}

void KHalfBandOversampler::Down(double* input, double* output, int32_t frames) noexcept {
  if (frames <= 0) return;
  if (factor_ == 1) {
    std::copy(input, input + frames, output);
  } else if (factor_ == 2) {
    outer_.Down(input, output, frames);
  } else {
    inner_.Down(input, input, 2 * frames);
    outer_.Down(input, output, frames);
  }
}
