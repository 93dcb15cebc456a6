// The channel utility through the processing cycle at 48 kHz, as a host drives it.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "core/KParameter.h"
#include "plugins/utility/KUtilityPlugin.h"

namespace {
using Channels = std::vector<std::vector<float>>;
using U = KUtilityPlugin;
constexpr double kRate = 48000.0;
const int32_t kGlide = static_cast<int32_t>(kRate * U::kGlideSeconds);

Channels Constant(size_t channels, size_t n, float value) { return Channels(channels, std::vector<float>(n, value)); }

// Two unrelated tones, so that every matrix coefficient shows in the output.
Channels Music(size_t n) {
  Channels c = Constant(2, n, 0.0f);
  for (size_t i = 0; i < n; ++i) c[0][i] = 0.5f * std::sin(0.05f * i), c[1][i] = 0.3f * std::cos(0.031f * i + 1.0f);
  return c;
}

// Runs `input` through the plug-in in host blocks of `block` samples, in place when asked.
Channels Process(U& plugin, Channels input, size_t block = 1 << 20, bool inPlace = false) {
  Channels output = inPlace ? Channels{} : Constant(static_cast<size_t>(plugin.OutputChannelCount()), input[0].size(), 99.0f);
  Channels& written = inPlace ? input : output;
  for (size_t start = 0; start < input[0].size(); start += block) {
    std::vector<const float*> in;
    std::vector<float*> out;
    for (const std::vector<float>& channel : input) in.push_back(channel.data() + start);
    for (std::vector<float>& channel : written) out.push_back(channel.data() + start);
    plugin.ProcessHostBlock(in.data(), out.data(), static_cast<int32_t>(std::min(block, input[0].size() - start)));
  }
  return written;
}

float LargestStep(const Channels& c) {
  float largest = 0.0f;
  for (const std::vector<float>& channel : c)
    for (size_t i = 1; i < channel.size(); ++i) largest = std::max(largest, std::fabs(channel[i] - channel[i - 1]));
  return largest;
}

class UtilityTest : public ::testing::Test {
protected:
  UtilityTest() { EXPECT_TRUE(plugin.SetSampleRate(kRate)); }
  void Set(int32_t p, double working) { plugin.GetParameter(p).SetWorking(working); }
  U plugin;
};
}  // namespace

// Every setting is one matrix from input to output: left = a·L + b·R, right = c·L + d·R. Values
// set before the first block hold from its first sample, whether or not the host works in place.
TEST_F(UtilityTest, SettingsMixTheChannelsFromTheFirstSample) {
  const struct {
    std::vector<std::pair<int32_t, double>> settings;
    double a, b, c, d, tolerance;
  } rows[] = {
      {{}, 1, 0, 0, 1, 0},                                                  // defaults: unchanged
      {{{U::kGain, 6.02}}, 2, 0, 0, 2, 1e-4},                               // +6.02 dB doubles
      {{{U::kBalance, 100}}, 0, 0, 0, 1, 0},                                // hard right: left silent, right at unity
      {{{U::kBalance, -100}}, 1, 0, 0, 0, 0},
      {{{U::kBalance, 50}}, std::sqrt(0.5), 0, 0, 1, 1e-6},                 // half way: the far side 3 dB down
      {{{U::kWidth, 0}}, 0.5, 0.5, 0.5, 0.5, 1e-6},                         // no side signal: mono
      {{{U::kWidth, 200}}, 1.5, -0.5, -0.5, 1.5, 1e-6},                     // twice the side signal
      {{{U::kWidth, 200}, {U::kMono, 1}}, 0.5, 0.5, 0.5, 0.5, 1e-6},        // the switch wins over any width
      {{{U::kInvertLeft, 1}}, -1, 0, 0, 1, 0},
      {{{U::kInvertRight, 1}}, 1, 0, 0, -1, 0},
      {{{U::kSwap, 1}}, 0, 1, 1, 0, 0},
      {{{U::kInvertRight, 1}, {U::kMono, 1}}, 0.5, -0.5, 0.5, -0.5, 1e-6},  // polarity repairs a channel before the mix
      {{{U::kMute, 1}}, 0, 0, 0, 0, 0},
  };
  const Channels music = Music(1000);
  for (const auto& [settings, a, b, c, d, tolerance] : rows) {
    for (const bool inPlace : {false, true}) {
      U fresh;
      ASSERT_TRUE(fresh.SetSampleRate(kRate));
      for (const auto& [index, value] : settings) fresh.GetParameter(index).SetWorking(value);
      const Channels out = Process(fresh, music, 1 << 20, inPlace);
      for (size_t i = 0; i < music[0].size(); ++i) {
        const double l = music[0][i], r = music[1][i];
        ASSERT_NEAR(out[0][i], a * l + b * r, tolerance) << "left " << i << " of " << a << " " << b << " in place " << inPlace;
        ASSERT_NEAR(out[1][i], c * l + d * r, tolerance) << "right " << i << " of " << c << " " << d << " in place " << inPlace;
      }
    }
  }
}

TEST_F(UtilityTest, ChangesGlideWithoutAClick) {
  Process(plugin, Constant(2, 100, 1.0f));
  // From unity to silence on a constant input: a straight line over the glide, however the host
  // cuts its blocks, then exact silence.
  Set(U::kMute, 1.0);
  Channels out = Process(plugin, Constant(2, 2 * kGlide, 1.0f), 64);
  const float slope = 1.0f / static_cast<float>(kGlide);
  EXPECT_LE(LargestStep(out), slope * 1.001f);
  EXPECT_NEAR(out[0][0], 1.0f, slope * 1.001f);
  EXPECT_GT(out[1][kGlide - 1], 0.0f);  // still on its way down
  for (const std::vector<float>& channel : out)
    EXPECT_EQ(std::vector<float>(channel.begin() + kGlide, channel.end()), std::vector<float>(kGlide, 0.0f));
  // A change in the middle of a glide turns smoothly toward the new target.
  Set(U::kMute, 0.0);
  Process(plugin, Constant(2, kGlide / 2, 1.0f));
  Set(U::kGain, 6.02);
  Set(U::kBalance, -100.0);
  out = Process(plugin, Constant(2, 3 * kGlide, 1.0f), 100);
  EXPECT_LE(LargestStep(out), 2.0f * slope);
  EXPECT_NEAR(out[0].back(), 2.0f, 1e-3f);
  EXPECT_EQ(out[1].back(), 0.0f);
  Set(U::kGain, 0.0);  // a reset lands every setting at once
  Set(U::kBalance, 0.0);
  plugin.Reset();
  EXPECT_EQ(Process(plugin, Constant(2, 10, 1.0f)), Constant(2, 10, 1.0f));
}

TEST_F(UtilityTest, OneChannelPerBusHasNoSideToFadeSwapOrWiden) {
  ASSERT_TRUE(plugin.SetChannelsPerBus(1));
  ASSERT_EQ(plugin.OutputChannelCount(), 1);
  for (const auto& [index, value] : {std::pair{U::kBalance, 100.0}, {U::kSwap, 1.0}, {U::kWidth, 0.0}, {U::kGain, 6.02}, {U::kInvertLeft, 1.0}})
    Set(index, value);
  const Channels mono{Music(1000)[0]}, out = Process(plugin, mono);
  for (size_t i = 0; i < mono[0].size(); ++i) ASSERT_NEAR(out[0][i], -2.0 * mono[0][i], 1e-4) << i;
}
