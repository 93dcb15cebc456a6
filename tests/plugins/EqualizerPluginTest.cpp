// The 8-band equalizer through the processing cycle at 48 kHz, as a host drives it.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <functional>
#include <limits>
#include <vector>

#include "core/KParameter.h"
#include "plugins/equalizer/KEqualizerPlugin.h"

namespace {
using Channels = std::vector<std::vector<float>>;
using E = KEqualizerPlugin;
constexpr double kRate = 48000.0, kPi = 3.141592653589793;

Channels Sine(double amplitude, double hz, size_t n = 28800) {
  Channels c(2, std::vector<float>(n));
  for (size_t i = 0; i < n; ++i)
    for (size_t ch = 0; ch < 2; ++ch) c[ch][i] = static_cast<float>(amplitude * std::sin(2.0 * kPi * hz * i / kRate + ch));
  return c;
}

// Host blocks of `block` samples; `before(k)` runs ahead of block k, as automation would.
Channels Play(E& plugin, const Channels& in, size_t block = 300, const std::function<void(size_t)>& before = {}) {
  Channels out(2, std::vector<float>(in[0].size(), 99.0f));
  for (size_t at = 0, k = 0; at < in[0].size(); at += block, ++k) {
    if (before) before(k);
    const float* i[] = {&in[0][at], &in[1][at]};
    float* o[] = {&out[0][at], &out[1][at]};
    plugin.ProcessHostBlock(i, o, static_cast<int32_t>(std::min(block, in[0].size() - at)));
  }
  return out;
}

// RMS of the last 0.1 s of the left channel (whole periods of any multiple of 10 Hz) over the input's.
double Gain(const Channels& out, const Channels& in) {
  double o = 0.0, i = 0.0;
  for (size_t k = in[0].size() - 4800; k < in[0].size(); ++k) o += out[0][k] * out[0][k], i += in[0][k] * in[0][k];
  return std::sqrt(o / i);
}

// What a designed section does to the amplitude of a tone of `hz`.
double Response(const KFilterSection& s, double hz) {
  const std::complex<double> z = std::polar(1.0, -2.0 * kPi * hz / kRate);
  return std::abs((s.b0 + s.b1 * z + s.b2 * z * z) / (1.0 - s.minusA1 * z - s.minusA2 * z * z));
}

struct EqualizerTest : ::testing::Test {
  EqualizerTest() { EXPECT_TRUE(plugin.SetSampleRate(kRate)); }
  void Set(E::BandField f, double v, int32_t band = 0, E* on = nullptr) { (on ? on : &plugin)->GetParameter(E::Index(band, f)).SetWorking(v); }
  E plugin;
};
}  // namespace

TEST_F(EqualizerTest, TransparentAtDefaults) {
  for (const Channels& in : {Sine(0.7, 97.0, 3000), Sine(0.9, 17000.0, 3000)}) EXPECT_EQ(Play(plugin, in), in);
}

TEST_F(EqualizerTest, EveryTypeNameSelectsItsTypeCode) {
  ASSERT_EQ(plugin.ParameterCount(), 41);
  EXPECT_EQ(plugin.GetParameter(E::Index(7, E::kFrequency)).Name().ToUtf8(), "Band 8 frequency");
  const char* const names[] = {"Peak", "Matched peak", "Low shelf", "High shelf", "Low-pass", "High-pass", "One-pole low-pass",
                               "One-pole high-pass", "Band-pass", "Notch", "All-pass", "First-order all-pass",
                               "Low-pass with zero", "High-pass with zero", "First-order low-pass", "First-order high-pass"};
  // Band 5 at 1 kHz, +12 dB, Q 1 on a 1 kHz tone: a peak gives +12 dB, every type what its design says.
  Set(E::kFrequency, 1000.0, 4), Set(E::kGain, 12.0, 4), Set(E::kQ, 1.0, 4);
  auto& type = plugin.GetParameter(E::Index(4, E::kType));
  const Channels in = Sine(0.25, 1000.0);
  for (int32_t code = KFilterSection::kTypeCount - 1; code >= 0; --code) {
    double normalized = -1.0;
    ASSERT_TRUE(type.NormalizedFromText(KString::Static(names[code]), normalized)) << names[code];
    type.SetNormalized(normalized);
    const double gain = Gain(Play(plugin, in), in);
    EXPECT_EQ(plugin.BandDesign(4).type, code) << names[code];
    EXPECT_NEAR(gain, Response(plugin.BandDesign(4), 1000.0), 2e-4) << names[code];
    if (code == KFilterSection::kPeak) { EXPECT_NEAR(20.0 * std::log10(gain), 12.0, 0.01); }
  }
  plugin.SetSampleRate(32000.0), Set(E::kFrequency, 20000.0, 4);  // above 0.499 of the rate: designed at that limit
  Play(plugin, Sine(0.1, 440.0, 64));
  EXPECT_EQ(plugin.BandDesign(4).frequency, 0.499 * 32000.0);
}

TEST_F(EqualizerTest, AutomationGlidesWithoutClicks) {
  // A +12 dB peak swept from 200 Hz to 5 kHz across a 1 kHz tone in 50 ms, a jump every 32 samples; then a
  // type change and a switch-off. The tone's own largest step at 4x gain is 4·a·2 sin(π f/fs); a click exceeds it.
  constexpr double kAmplitude = 0.2, kTone = 1000.0;
  Set(E::kGain, 12.0), Set(E::kQ, 2.0), Set(E::kFrequency, 200.0);
  const Channels in = Sine(kAmplitude, kTone, 9600);
  Play(plugin, in);
  const Channels out = Play(plugin, in, 32, [&](size_t k) {
    if (k <= 75) Set(E::kFrequency, 200.0 * std::pow(25.0, k / 75.0));
    if (k == 120) Set(E::kType, KFilterSection::kHighShelf);
    if (k == 200) Set(E::kEnable, 0.0);
  });
  float largest = 0.0f;
  for (const auto& channel : out)
    for (size_t i = 1; i < channel.size(); ++i) largest = std::max(largest, std::fabs(channel[i] - channel[i - 1]));
  EXPECT_LT(largest, 1.1 * 4.0 * kAmplitude * 2.0 * std::sin(kPi * kTone / kRate));
  for (size_t c = 0; c < 2; ++c)  // every glide lands: the band switched off passes the input
    for (size_t i = in[c].size() - 500; i < in[c].size(); ++i) ASSERT_EQ(out[c][i], in[c][i]) << i;
}

TEST_F(EqualizerTest, BadSamplesSpoilOneBlockAndSilenceEndsInZeros) {
  const Channels tone = Sine(0.5, 1000.0, 256);
  for (const float bad : {std::numeric_limits<float>::quiet_NaN(), -std::numeric_limits<float>::infinity()}) {
    E spoiled, fresh;
    for (E* p : {&spoiled, &fresh}) Set(E::kGain, 12.0, 1, p), Set(E::kType, KFilterSection::kLowPass, 6, p);
    Channels poisoned = tone;
    poisoned[0][50] = poisoned[1][50] = bad;
    Play(spoiled, tone);
    Play(spoiled, poisoned);
    EXPECT_EQ(Play(spoiled, tone), Play(fresh, tone)) << bad;
  }
  Set(E::kGain, 12.0), Set(E::kGain, -9.0, 1);
  Play(plugin, tone);
  Play(plugin, Sine(0.0, 1.0, 24000));  // 0.5 s: the 60 Hz peak rings longest, and it is long gone
  EXPECT_EQ(Play(plugin, Sine(0.0, 1.0, 300)), Sine(0.0, 1.0, 300));
}
