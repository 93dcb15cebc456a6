// The channel utility through the processing cycle at 48 kHz, as a host drives it.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/utility/KUtilityPlugin.h"

namespace {
using Channels = std::vector<std::vector<float>>;
constexpr double kRate = 48000.0;
const int32_t kGlide = static_cast<int32_t>(kRate * KUtilityPlugin::kGlideSeconds);

// Two unrelated tones, so that every matrix coefficient shows in the output.
Channels Music(int32_t n) {
  Channels c(2, std::vector<float>(static_cast<size_t>(n)));
  for (int32_t i = 0; i < n; ++i) {
    c[0][static_cast<size_t>(i)] = static_cast<float>(0.5 * std::sin(0.05 * i));
    c[1][static_cast<size_t>(i)] = static_cast<float>(0.3 * std::cos(0.031 * i + 1.0));
  }
  return c;
}

Channels Constant(int32_t channels, int32_t n, float value) {
  return Channels(static_cast<size_t>(channels), std::vector<float>(static_cast<size_t>(n), value));
}

// Largest change from one sample to the next in any channel.
float LargestStep(const Channels& c) {
  float largest = 0.0f;
  for (const std::vector<float>& channel : c)
    for (size_t i = 1; i < channel.size(); ++i) largest = std::max(largest, std::fabs(channel[i] - channel[i - 1]));
  return largest;
}

class UtilityTest : public ::testing::Test {
protected:
  UtilityTest() { EXPECT_TRUE(plugin.SetSampleRate(kRate)); }

  void Set(KUtilityPlugin::ParameterIndex p, double working) { plugin.GetParameter(p).SetWorking(working); }

  // One host block; the output has as many channels as the plug-in.
  Channels Run(const Channels& input) {
    const int32_t n = static_cast<int32_t>(input[0].size());
    Channels output = Constant(plugin.OutputChannelCount(), n, 99.0f);
    std::vector<const float*> in;
    std::vector<float*> out;
    for (const std::vector<float>& channel : input) in.push_back(channel.data());
    for (std::vector<float>& channel : output) out.push_back(channel.data());
    plugin.ProcessHostBlock(in.data(), out.data(), n);
    return output;
  }
  // Runs `input` in host blocks of `block` samples and joins the outputs.
  Channels RunInBlocks(const Channels& input, int32_t block) {
    Channels joined(input.size());
    for (size_t start = 0; start < input[0].size(); start += static_cast<size_t>(block)) {
      Channels piece;
      for (const std::vector<float>& channel : input) {
        const size_t end = std::min(channel.size(), start + static_cast<size_t>(block));
        piece.emplace_back(channel.begin() + static_cast<std::ptrdiff_t>(start), channel.begin() + static_cast<std::ptrdiff_t>(end));
      }
      const Channels out = Run(piece);
      for (size_t c = 0; c < out.size(); ++c) joined[c].insert(joined[c].end(), out[c].begin(), out[c].end());
    }
    return joined;
  }
  // Output after every glide has settled: the first block lets the setting land.
  Channels Settled(const Channels& input) {
    Run(Constant(static_cast<int32_t>(input.size()), 2 * kGlide, 0.5f));
    return Run(input);
  }

  KUtilityPlugin plugin;
  const Channels music = Music(1000);
};

void ExpectSamples(const std::vector<float>& actual, const std::vector<float>& expected, float tolerance) {
  ASSERT_EQ(actual.size(), expected.size());
  for (size_t i = 0; i < actual.size(); ++i) ASSERT_NEAR(actual[i], expected[i], tolerance) << "sample " << i;
}
}  // namespace

TEST_F(UtilityTest, ParametersReadAsAUserExpects) {
  struct Row {
    KUtilityPlugin::ParameterIndex index;
    const char* key;
    const char* name;
    const char* unit;
    const char* text;
  };
  const Row rows[] = {{KUtilityPlugin::kGain, "gain", "Gain", "dB", "0.0"},
                      {KUtilityPlugin::kBalance, "balance", "Balance", "", "C"},
                      {KUtilityPlugin::kWidth, "width", "Width", "%", "100"},
                      {KUtilityPlugin::kInvertLeft, "invertleft", "Invert left", "", "Off"},
                      {KUtilityPlugin::kInvertRight, "invertright", "Invert right", "", "Off"},
                      {KUtilityPlugin::kSwap, "swap", "Swap channels", "", "Off"},
                      {KUtilityPlugin::kMono, "mono", "Mono", "", "Off"},
                      {KUtilityPlugin::kMute, "mute", "Mute", "", "Off"}};
  ASSERT_EQ(plugin.ParameterCount(), KUtilityPlugin::kParameterCount);
  for (const Row& row : rows) {
    const KAudioPluginBase::Parameter& p = plugin.GetParameter(row.index);
    EXPECT_EQ(p.Key().ToUtf8(), row.key);
    EXPECT_EQ(p.Name().ToUtf8(), row.name);
    EXPECT_EQ(p.Unit().ToUtf8(), row.unit) << row.key;
    EXPECT_EQ(p.Text().ToUtf8(), row.text) << row.key;
    EXPECT_TRUE(p.IsAutomatable()) << row.key;
  }
  double normalized = 0.0;
  EXPECT_TRUE(plugin.GetParameter(KUtilityPlugin::kBalance).NormalizedFromText("30 L", normalized));
  EXPECT_DOUBLE_EQ(normalized, 0.35);
  EXPECT_EQ(plugin.GetParameter(KUtilityPlugin::kGain).TextForNormalized(1.0).ToUtf8(), "24.0");
  EXPECT_EQ(plugin.GetParameter(KUtilityPlugin::kGain).TextForNormalized(0.0).ToUtf8(), "-60.0");
}

TEST_F(UtilityTest, DefaultsPassAudioUnchanged) {
  const Channels out = RunInBlocks(music, 300);
  EXPECT_EQ(out, music);
}

TEST_F(UtilityTest, SettingsMadeBeforeTheFirstBlockHoldFromItsFirstSample) {
  Set(KUtilityPlugin::kGain, -6.02);
  Set(KUtilityPlugin::kBalance, 100.0);
  const Channels out = Run(music);
  ExpectSamples(out[0], std::vector<float>(music[0].size(), 0.0f), 0.0f);
  for (size_t i = 0; i < music[1].size(); ++i) ASSERT_NEAR(out[1][i], 0.5 * music[1][i], 1e-4) << i;
}

TEST_F(UtilityTest, GainOfSixDecibelsDoubles) {
  Set(KUtilityPlugin::kGain, 6.02);
  const Channels out = Settled(music);
  for (size_t c = 0; c < 2; ++c)
    for (size_t i = 0; i < music[c].size(); ++i) ASSERT_NEAR(out[c][i], 2.0 * music[c][i], 2e-4) << c << " " << i;
}

TEST_F(UtilityTest, BalanceFadesTheOtherSideAndKeepsItsOwnAtUnity) {
  Set(KUtilityPlugin::kBalance, 100.0);
  Channels out = Settled(music);
  EXPECT_EQ(out[0], std::vector<float>(music[0].size(), 0.0f));
  EXPECT_EQ(out[1], music[1]);

  Set(KUtilityPlugin::kBalance, -100.0);
  out = Settled(music);
  EXPECT_EQ(out[0], music[0]);
  EXPECT_EQ(out[1], std::vector<float>(music[1].size(), 0.0f));

  Set(KUtilityPlugin::kBalance, 50.0);  // half way: the left side 3 dB down
  out = Settled(music);
  for (size_t i = 0; i < music[0].size(); ++i) ASSERT_NEAR(out[0][i], std::sqrt(0.5) * music[0][i], 1e-6) << i;
  EXPECT_EQ(out[1], music[1]);
}

TEST_F(UtilityTest, WidthScalesTheSideSignal) {
  std::vector<float> mid(music[0].size());
  for (size_t i = 0; i < mid.size(); ++i) mid[i] = 0.5f * (music[0][i] + music[1][i]);

  Set(KUtilityPlugin::kWidth, 0.0);
  Channels out = Settled(music);
  ExpectSamples(out[0], mid, 1e-6f);
  ExpectSamples(out[1], mid, 1e-6f);

  Set(KUtilityPlugin::kWidth, 200.0);
  Set(KUtilityPlugin::kMono, 1.0);  // the switch wins over any width
  out = Settled(music);
  ExpectSamples(out[0], mid, 1e-6f);
  ExpectSamples(out[1], mid, 1e-6f);

  Set(KUtilityPlugin::kMono, 0.0);
  out = Settled(music);
  for (size_t i = 0; i < music[0].size(); ++i) {
    ASSERT_NEAR(out[0][i] + out[1][i], music[0][i] + music[1][i], 1e-6) << i;          // same mid
    ASSERT_NEAR(out[0][i] - out[1][i], 2.0 * (music[0][i] - music[1][i]), 1e-6) << i;  // twice the side
  }
}

TEST_F(UtilityTest, PolarityAndSwap) {
  std::vector<float> negatedLeft(music[0].size()), negatedRight(music[1].size());
  for (size_t i = 0; i < music[0].size(); ++i) negatedLeft[i] = -music[0][i], negatedRight[i] = -music[1][i];

  Set(KUtilityPlugin::kInvertLeft, 1.0);
  Channels out = Settled(music);
  EXPECT_EQ(out[0], negatedLeft);
  EXPECT_EQ(out[1], music[1]);

  Set(KUtilityPlugin::kInvertLeft, 0.0);
  Set(KUtilityPlugin::kInvertRight, 1.0);
  out = Settled(music);
  EXPECT_EQ(out[0], music[0]);
  EXPECT_EQ(out[1], negatedRight);

  Set(KUtilityPlugin::kInvertRight, 0.0);
  Set(KUtilityPlugin::kSwap, 1.0);
  out = Settled(music);
  EXPECT_EQ(out[0], music[1]);
  EXPECT_EQ(out[1], music[0]);

  // In place, as many hosts process: each output sample must use both inputs before writing.
  Channels buffers = music;
  float* io[] = {buffers[0].data(), buffers[1].data()};
  plugin.ProcessHostBlock(io, io, static_cast<int32_t>(music[0].size()));
  EXPECT_EQ(buffers[0], music[1]);
  EXPECT_EQ(buffers[1], music[0]);
}

TEST_F(UtilityTest, PolarityRepairsAChannelBeforeItIsMixed) {
  // A stereo pair whose right channel was recorded inverted: fixing it and folding to mono
  // must give the signal back, not cancel it.
  Channels miswired = music;
  for (size_t i = 0; i < miswired[1].size(); ++i) miswired[1][i] = -miswired[0][i];
  Set(KUtilityPlugin::kInvertRight, 1.0);
  Set(KUtilityPlugin::kMono, 1.0);
  const Channels out = Settled(miswired);
  ExpectSamples(out[0], music[0], 1e-6f);
  ExpectSamples(out[1], music[0], 1e-6f);
}

TEST_F(UtilityTest, MuteIsSilentOnceTheGlideEnds) {
  Run(music);
  Set(KUtilityPlugin::kMute, 1.0);
  const Channels out = Run(Constant(2, 2 * kGlide, 1.0f));
  EXPECT_GT(out[0][static_cast<size_t>(kGlide - 1)], 0.0f);  // still on its way down
  for (size_t c = 0; c < 2; ++c)
    for (size_t i = static_cast<size_t>(kGlide); i < out[c].size(); ++i) ASSERT_EQ(out[c][i], 0.0f) << c << " " << i;
  EXPECT_EQ(Run(music), Constant(2, 1000, 0.0f));
}

TEST_F(UtilityTest, ChangesGlideWithoutAClick) {
  Run(Constant(2, 100, 1.0f));
  // From unity to silence on a constant input: a straight line over the glide, whichever way
  // the host cuts its blocks.
  Set(KUtilityPlugin::kMute, 1.0);
  Channels out = RunInBlocks(Constant(2, 2 * kGlide, 1.0f), 64);
  const float slope = 1.0f / static_cast<float>(kGlide);
  EXPECT_LE(LargestStep(out), slope * 1.001f);
  EXPECT_NEAR(out[0][0], 1.0f, slope * 1.001f);
  EXPECT_EQ(out[0][static_cast<size_t>(kGlide)], 0.0f);

  // A change in the middle of a glide turns smoothly toward the new target.
  Set(KUtilityPlugin::kMute, 0.0);
  Run(Constant(2, kGlide / 2, 1.0f));
  Set(KUtilityPlugin::kGain, 6.02);
  Set(KUtilityPlugin::kBalance, -100.0);
  out = RunInBlocks(Constant(2, 3 * kGlide, 1.0f), 100);
  EXPECT_LE(LargestStep(out), 2.0f * slope);
  EXPECT_NEAR(out[0].back(), 2.0f, 1e-3f);
  EXPECT_EQ(out[1].back(), 0.0f);

  // A reset lands every setting at once.
  Set(KUtilityPlugin::kGain, 0.0);
  plugin.Reset();
  EXPECT_EQ(Run(Constant(2, 10, 1.0f))[0], std::vector<float>(10, 1.0f));
}

TEST_F(UtilityTest, OneChannelPerBus) {
  ASSERT_TRUE(plugin.SetChannelsPerBus(1));
  ASSERT_EQ(plugin.OutputChannelCount(), 1);
  const Channels mono{music[0]};
  EXPECT_EQ(Run(mono), mono);

  // A single channel has no side to fade, swap or widen: those leave it alone.
  Set(KUtilityPlugin::kBalance, 100.0);
  Set(KUtilityPlugin::kSwap, 1.0);
  Set(KUtilityPlugin::kWidth, 0.0);
  EXPECT_EQ(Settled(mono), mono);

  Set(KUtilityPlugin::kGain, 6.02);
  Set(KUtilityPlugin::kInvertLeft, 1.0);
  Channels out = Settled(mono);
  for (size_t i = 0; i < mono[0].size(); ++i) ASSERT_NEAR(out[0][i], -2.0 * mono[0][i], 2e-4) << i;

  Set(KUtilityPlugin::kMute, 1.0);
  EXPECT_EQ(Settled(mono), Constant(1, 1000, 0.0f));
}
