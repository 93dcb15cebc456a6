// The saturator through the processing cycle, in stereo at the usual sample rates.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <numeric>
#include <vector>

#include "core/KParameter.h"
#include "plugins/warmer/KSampleWarmer.h"

namespace {
using Signal = std::vector<float>;
using W = KSampleWarmer;
constexpr double kTwoPi = 6.283185307179586;
constexpr float kRight = -0.5f;  // the right input is the left at -6 dB, inverted

Signal Sine(size_t length, double cycles, double amplitude) {
  Signal s(length);
  for (size_t i = 0; i < length; ++i) s[i] = static_cast<float>(amplitude * std::sin(kTwoPi * cycles * static_cast<double>(i)));
  return s;
}

// A fresh stereo instance run in host blocks of 512: its latency and its outputs.
std::pair<size_t, std::vector<Signal>> Warm(double rate, const std::vector<std::pair<int32_t, double>>& settings, const Signal& left) {
  W plugin;
  EXPECT_TRUE(plugin.SetSampleRate(rate));
  for (auto [index, value] : settings) plugin.GetParameter(index).SetWorking(value);
  std::vector<Signal> in(2, left), out(2, Signal(left.size()));
  for (float& v : in[1]) v *= kRight;
  for (size_t at = 0; at < left.size(); at += 512) {
    const float* i[] = {in[0].data() + at, in[1].data() + at};
    float* o[] = {out[0].data() + at, out[1].data() + at};
    plugin.ProcessHostBlock(i, o, static_cast<int32_t>(std::min<size_t>(512, left.size() - at)));
  }
  return {static_cast<size_t>(plugin.TotalLatency()), out};
}

// Power below 20 kHz (at 48 kHz) off the harmonics of bin k0, against bin k0, in dB; over the
// last 2048 samples, which hold whole periods.
double AliasDecibels(const Signal& s, size_t k0) {
  double fundamental = 0.0, aliases = 0.0;
  for (size_t k = 1; k < 853; ++k) {
    std::complex<double> sum;
    for (size_t i = 0; i < 2048; ++i) sum += std::polar(static_cast<double>(s[s.size() - 2048 + i]), -kTwoPi * static_cast<double>(k * i % 2048) / 2048.0);
    if (k % k0 != 0) aliases += std::norm(sum);
    if (k == k0) fundamental = std::norm(sum);
  }
  return 10.0 * std::log10(aliases / fundamental);
}
}  // namespace

// The host is told the oversampler's delay (4x below 88.2 kHz, 2x above). At 0 % mix the output
// is the input so delayed, bit for bit; every curve has unit slope at zero, so at 0 dB of drive a
// quiet tone comes out so delayed and unchanged (the tube's 5 Hz DC blocker costs 0.3° at 1 kHz).
TEST(KSampleWarmer, BothPathsAreDelayedByTheReportedLatency) {
  for (double rate : {44100.0, 96000.0}) {
    const Signal loud = Sine(3000, 0.0123, 1.5), quiet = Sine(9600, 1000.0 / rate, 1e-3);
    const auto [latency, dry] = Warm(rate, {{W::kDrive, 30.0}, {W::kTone, 80.0}, {W::kMix, 0.0}}, loud);
    for (size_t c = 0; c < 2; ++c)
      for (size_t i = 0; i < loud.size(); ++i) ASSERT_EQ(dry[c][i], i < latency ? 0.0f : (c ? kRight : 1.0f) * loud[i - latency]) << rate << " Hz, channel " << c << ", sample " << i;
    for (int32_t shape = 0; shape < W::kShapeCount; ++shape) {
      const std::vector<Signal> wet = Warm(rate, {{W::kDrive, 0.0}, {W::kShape, shape}}, quiet).second;
      for (size_t i = 4800; i < quiet.size(); ++i) ASSERT_NEAR(wet[1][i], kRight * quiet[i - latency], 1e-5) << rate << " Hz, shape " << shape;
    }
  }
}

// Full tone tilts by kTiltDb about the 1 kHz pivot: down in the bass, up in the treble.
TEST(KSampleWarmer, ToneTiltsAboutItsPivot) {
  for (double hz : {60.0, 16000.0}) {
    const Signal out = Warm(48000.0, {{W::kDrive, 0.0}, {W::kTone, 100.0}}, Sine(24000, hz / 48000.0, 1e-3)).second[0];
    const double power = std::inner_product(out.begin() + 12000, out.end(), out.begin() + 12000, 0.0) / 12000.0;
    EXPECT_NEAR(10.0 * std::log10(power / 0.5e-6), hz > 1000.0 ? W::kTiltDb : -W::kTiltDb, 0.2) << hz << " Hz";
  }
}

// A tone driven 24 dB into tanh: oversampled, what folds back below 20 kHz stays far under what
// the bare curve at the base rate leaves there.
TEST(KSampleWarmer, OversamplingKeepsAliasesFarBelowTheBareCurve) {
  const struct { size_t bin; double bound; } cases[] = {{211, -60.0}, {421, -35.0}};  // 4.9 and 9.9 kHz
  for (auto [bin, bound] : cases) {
    const Signal input = Sine(3 * 2048, static_cast<double>(bin) / 2048.0, 0.5);
    std::vector<double> bare;
    for (float v : input) bare.push_back(v * std::pow(10.0, 24.0 / 20.0));
    W::CurveOf(W::kTanh)(bare.data(), static_cast<int32_t>(bare.size()));
    const double oversampled = AliasDecibels(Warm(48000.0, {{W::kDrive, 24.0}, {W::kShape, W::kTanh}}, input).second[0], bin);
    EXPECT_LT(oversampled, std::min(bound, AliasDecibels(Signal(bare.begin(), bare.end()), bin) - 25.0)) << bin;
  }
}

// NaN and infinities count as zeros, on the wet path too; no DC is left behind the tube curve,
// and once the input stops every filter comes to exact zero.
TEST(KSampleWarmer, NonFiniteInputIsSilenceAndSilenceEndsInZeros) {
  const std::vector<std::pair<int32_t, double>> hot = {{W::kDrive, 36.0}, {W::kShape, W::kTube}, {W::kTone, 50.0}, {W::kMix, 70.0}};
  Signal spoiled = Sine(4 * 44100, 0.031, 0.8);
  std::fill(spoiled.begin() + 44100, spoiled.end(), 0.0f);
  Signal zeroed = spoiled;
  spoiled[100] = NAN, spoiled[700] = INFINITY, spoiled[701] = -INFINITY;
  zeroed[100] = zeroed[700] = zeroed[701] = 0.0f;
  const std::vector<Signal> out = Warm(44100.0, hot, spoiled).second;
  EXPECT_EQ(out, Warm(44100.0, hot, zeroed).second);
  const auto from = out[0].begin() + 22050, to = out[0].begin() + 44100;
  EXPECT_LT(std::abs(std::accumulate(from, to, 0.0)), 0.01 * std::sqrt(22050.0 * std::inner_product(from, to, from, 0.0)));
  for (const Signal& channel : out) EXPECT_TRUE(std::all_of(channel.end() - 512, channel.end(), [](float v) { return v == 0.0f; }));
}
