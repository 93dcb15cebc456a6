#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "dsp/KDelayLine.h"

namespace {

constexpr double kTwoPi = 6.283185307179586;

std::vector<double> Delayed(KDelayLine& line, const std::vector<double>& in, const std::vector<double>& delays) {
  std::vector<double> out(in.size());
  line.Run(in.data(), delays.data(), out.data(), static_cast<int32_t>(in.size()));
  return out;
}

// Linear interpolation, the cheap read a delay line could have used instead.
double LinearRead(const std::vector<double>& x, double at) {
  const int32_t i = static_cast<int32_t>(std::floor(at));
  const double f = at - i;
  return x[static_cast<size_t>(i)] + f * (x[static_cast<size_t>(i + 1)] - x[static_cast<size_t>(i)]);
}

}  // namespace

// 250 ms at 48 kHz is exactly 12000 samples, also after the ring has wrapped many times; half a
// sample more spreads an impulse over the interpolator's four points with its known weights.
TEST(KDelayLine, WholeAndHalfSampleDelaysOfAnImpulse) {
  KDelayLine line;
  line.Prepare(static_cast<int32_t>(0.3 * 48000));
  const int32_t n = 12000 * 7;
  for (double delay : {0.25 * 48000.0, 0.25 * 48000.0 + 0.5}) {
    line.Clear();
    std::vector<double> in(n, 0.0), delays(n, delay);
    in[0] = 1.0;
    in[12000 * 5] = -0.5;  // long after the ring has wrapped
    const std::vector<double> out = Delayed(line, in, delays);
    if (delay == 12000.0) {
      for (int32_t i = 0; i < n; ++i) {
        const double want = i == 12000 ? 1.0 : (i == 12000 * 6 ? -0.5 : 0.0);
        ASSERT_EQ(out[static_cast<size_t>(i)], want) << i;
      }
    } else {
      const double weights[4] = {-1.0 / 16, 9.0 / 16, 9.0 / 16, -1.0 / 16};
      for (int32_t k = 0; k < 4; ++k) EXPECT_NEAR(out[static_cast<size_t>(11999 + k)], weights[k], 1e-15) << k;
      double energy = 0.0;
      for (double v : out) energy += v * v;
      EXPECT_NEAR(energy, 1.25 * (2.0 * (1.0 + 81.0) / 256.0), 1e-12);  // nothing else anywhere
    }
  }
}

// A sine read at a fixed fraction of a sample matches the sine shifted by that much, closely at
// low frequencies; reads clamp to the line's bounds.
TEST(KDelayLine, FractionalReadsAndBounds) {
  KDelayLine line;
  line.Prepare(100);
  EXPECT_EQ(line.Longest(), 100.0);
  const double w = kTwoPi * 1000.0 / 48000.0;
  std::vector<double> in(400), delays(400, 10.3);
  for (size_t i = 0; i < in.size(); ++i) in[i] = std::sin(w * static_cast<double>(i));
  const std::vector<double> out = Delayed(line, in, delays);
  for (size_t i = 20; i < out.size(); ++i) EXPECT_NEAR(out[i], std::sin(w * (static_cast<double>(i) - 10.3)), 5e-5) << i;
  // Beyond the bounds: the longest delay, and the shortest of two samples.
  EXPECT_EQ(line.Read(1e9), line.Read(100.0));
  EXPECT_EQ(line.Read(-4.0), line.Read(2.0));
  EXPECT_EQ(line.Read(2.0), in[398]);
  EXPECT_EQ(line.ReadWhole(1), in[399]);
  EXPECT_EQ(line.Read(100.0), in[300]);
}

// A delay swept by a slow sine (chorus-like, 5 ± 3 ms at 0.8 Hz) reads a 3 kHz tone as the tone
// at the moving time, with no clicks: the error stays far below that of linear interpolation.
TEST(KDelayLine, ModulatedReadIsSmoothAndCleanerThanLinear) {
  const double rate = 48000.0, w = kTwoPi * 3000.0 / rate;
  const int32_t n = 48000;
  KDelayLine line;
  line.Prepare(480);
  std::vector<double> in(n), delays(n);
  for (int32_t i = 0; i < n; ++i) {
    in[static_cast<size_t>(i)] = std::sin(w * i);
    delays[static_cast<size_t>(i)] = rate * (0.005 + 0.003 * std::sin(kTwoPi * 0.8 * i / rate));
  }
  const std::vector<double> out = Delayed(line, in, delays);
  double hermite = 0.0, linear = 0.0, jump = 0.0;
  for (int32_t i = 600; i < n; ++i) {
    const double at = i - delays[static_cast<size_t>(i)];
    const double exact = std::sin(w * at);
    hermite = std::max(hermite, std::abs(out[static_cast<size_t>(i)] - exact));
    linear = std::max(linear, std::abs(LinearRead(in, at) - exact));
    jump = std::max(jump, std::abs(out[static_cast<size_t>(i)] - out[static_cast<size_t>(i - 1)]));
  }
  EXPECT_LT(hermite, 2e-3);
  EXPECT_LT(hermite * 4.0, linear);
  // The tone's own steepest step, a little faster while the delay shrinks: no sample jumps more.
  EXPECT_LT(jump, w * (1.0 + kTwoPi * 0.8 * 0.003) * 1.01);
}
