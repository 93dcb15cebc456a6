// The half-band oversampler: round trips, and rejection of images and aliases.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <vector>

#include "dsp/KHalfBandOversampler.h"
#include "tests/core/AllocationCounter.h"

namespace {
using Signal = std::vector<double>;
constexpr double kTwoPi = 6.283185307179586;
// Cycles per base-rate sample: the audio band ends where 20 kHz sits at 44.1 kHz; from its mirror
// image on, everything must be at least kRejection dB down (the designs reach 85.2).
constexpr double kPassEdge = 20.0 / 44.1 / 2.0, kRejection = 84.0;

Signal Sine(size_t length, double frequency) {
  Signal s(length);
  for (size_t i = 0; i < length; ++i) s[i] = std::sin(kTwoPi * frequency * static_cast<double>(i) + 0.3);
  return s;
}

// Level in dB of one frequency in the samples from `start` on (whole periods: no leakage).
double Level(const Signal& s, size_t start, double frequency) {
  std::complex<double> sum;
  for (size_t i = start; i < s.size(); ++i) sum += s[i] * std::polar(1.0, -kTwoPi * frequency * static_cast<double>(i));
  return 20.0 * std::log10(2.0 * std::abs(sum) / static_cast<double>(s.size() - start));
}
}  // namespace

// In pieces of any size, the round trip is the input delayed by exactly Latency() samples, within
// the designs' pass-band ripple; it touches no heap, and once the input falls silent the output
// reaches exact zero (a linear-phase response ends 2·Latency() samples on).
TEST(KHalfBandOversampler, RoundTripIsTheInputDelayedByTheLatency) {
  for (int32_t factor : {1, 2, 4}) {
    KHalfBandOversampler oversampler(factor);
    const auto latency = static_cast<size_t>(oversampler.Latency());
    for (double frequency : {0.002, 0.1, 0.3, kPassEdge}) {
      Signal input = Sine(3000, frequency), output(3000), high(12000);
      std::fill(input.begin() + 2500, input.end(), 0.0);
      KAllocationCounter counter;
      for (int32_t at = 0, k = 0, n; at < 3000; at += n, ++k) {
        n = std::min(3000 - at, std::array{1, 7, 64, 300}[static_cast<size_t>(k % 4)]);
        oversampler.Up(input.data() + at, high.data(), n);
        oversampler.Down(high.data(), output.data() + at, n);
      }
      EXPECT_EQ(counter.Count(), 0);
      double error = 0.0;
      for (size_t i = 200; i < 2400; ++i) error = std::max(error, std::abs(output[i] - input[i - latency]));
      EXPECT_LE(error, factor == 1 ? 0.0 : 2.5e-4) << factor << "x at " << frequency;
      EXPECT_TRUE(std::all_of(output.begin() + static_cast<std::ptrdiff_t>(2500 + 2 * latency), output.end(), [](double v) { return v == 0.0; }));
    }
  }
}

// A high-rate tone anywhere in the stop band, in steps that meet every side lobe, folds into the
// audio band at least kRejection down. The interpolator shares the taps, so its images do too.
TEST(KHalfBandOversampler, RejectsEverythingThatWouldFoldIntoTheAudioBand) {
  for (int32_t factor : {2, 4}) {
    for (double tone = 0.547; tone < factor / 2.0; tone += 0.003) {
      KHalfBandOversampler oversampler(factor);
      Signal high = Sine(1200 * static_cast<size_t>(factor), tone / factor), base(1200);
      oversampler.Down(high.data(), base.data(), 1200);
      EXPECT_LT(Level(base, 200, tone - std::round(tone)), -kRejection) << factor << "x at " << tone;
    }
  }
}
