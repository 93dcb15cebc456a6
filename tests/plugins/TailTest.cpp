// The tails plug-ins report: after an impulse, the output past the reported tail is silence to
// −100 dB, and no more than eight times what rings above it; a plug-in without memory reports
// 0, and the compressor's detector is at rest once its tail has passed.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <tuple>
#include <vector>

#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/equalizer/KEqualizerPlugin.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "plugins/warmer/KSampleWarmer.h"

namespace {
constexpr double kRate = 48000.0;
using Settings = std::vector<std::pair<int32_t, double>>;

// A unit impulse in every input channel, then silence, through host blocks of 512: the largest
// output magnitude at or after each sample.
std::vector<float> ImpulseEnvelope(KAudioPlugin& plugin, size_t length) {
  const size_t inputs = static_cast<size_t>(plugin.InputChannelCount()), outputs = static_cast<size_t>(plugin.OutputChannelCount());
  std::vector<std::vector<float>> in(inputs, std::vector<float>(length)), out(outputs, std::vector<float>(length));
  for (auto& channel : in) channel[0] = 1.0f;
  for (size_t at = 0; at < length; at += 512) {
    std::vector<const float*> x;
    std::vector<float*> y;
    for (auto& channel : in) x.push_back(channel.data() + at);
    for (auto& channel : out) y.push_back(channel.data() + at);
    plugin.ProcessHostBlock(x.data(), y.data(), static_cast<int32_t>(std::min<size_t>(512, length - at)));
  }
  std::vector<float> after(length + 1);
  for (size_t i = length; i-- > 0;)
    for (const auto& channel : out) after[i] = std::max({after[i], after[i + 1], std::abs(channel[i])});
  return after;
}

std::unique_ptr<KAudioPlugin> Make(KAudioPlugin* plugin, const Settings& settings) {
  plugin->SetSampleRate(kRate);
  for (auto [index, value] : settings) plugin->GetParameter(index).SetWorking(value);
  return std::unique_ptr<KAudioPlugin>(plugin);
}
}  // namespace

TEST(Tail, OutputPastTheReportedTailIsSilence) {
  using E = KEqualizerPlugin;
  using W = KSampleWarmer;
  const std::tuple<const char*, KAudioPlugin*, Settings> cases[] = {
      {"resonant equalizer", new E, {{E::Index(0, E::kGain), 18.0}, {E::Index(0, E::kFrequency), 40.0}, {E::Index(0, E::kQ), 12.0},
                                     {E::Index(3, E::kType), KFilterSection::kLowPass}, {E::Index(3, E::kQ), 8.0}}},
      {"tube with tilt", new W, {{W::kShape, W::kTube}, {W::kTone, 100.0}, {W::kDrive, 0.0}}},
      {"soft clip", new W, {{W::kShape, W::kSoftClip}}},
      {"utility", new KUtilityPlugin, {{KUtilityPlugin::kGain, 12.0}, {KUtilityPlugin::kWidth, 150.0}}},
  };
  for (const auto& [what, created, settings] : cases) {
    const auto plugin = Make(created, settings);
    const uint32_t tail = plugin->TailSamples();
    ASSERT_NE(tail, KAudioPlugin::kInfiniteTail) << what;
    const std::vector<float> after = ImpulseEnvelope(*plugin, tail + 4096);
    EXPECT_LT(after[1 + tail], 1e-5f) << what << ", tail " << tail;  // the input is silent from sample 1
    if (tail > 0) {
      EXPECT_GT(after[1 + tail / 8], 1e-5f) << what << ", tail " << tail;
    }
  }
}

// The output follows the input at once, but the detector needs its release before the next
// sound finds it at rest; the tail follows the release and the input gain.
TEST(Tail, CompressorDetectorRestsWhenItsTailHasPassed) {
  using C = KCompressorPlugin;
  for (const Settings& settings : {Settings{}, Settings{{C::kRelease, 0.8}, {C::kGain, 12.0}, {C::kKneeMode, 2.0}}}) {
    const auto made = Make(new C, settings);
    auto& plugin = static_cast<C&>(*made);
    const uint32_t tail = plugin.TailSamples();
    std::vector<float> loud(4800, 0.9f), silence(4800, 0.0f);
    const float* in[4] = {loud.data(), loud.data(), silence.data(), silence.data()};
    std::vector<float> left(4800), right(4800);
    float* out[2] = {left.data(), right.data()};
    plugin.ProcessHostBlock(in, out, 4800);
    in[0] = in[1] = silence.data();
    uint32_t rested = 0;
    for (; plugin.Engine().Level(0) > plugin.Engine().Transfer().Rest() && rested < 10 * tail; rested += 48) {
      plugin.ProcessHostBlock(in, out, 48);
      EXPECT_TRUE(std::all_of(left.begin(), left.begin() + 48, [](float v) { return v == 0.0f; }));
    }
    EXPECT_LE(rested, tail + 48);
    EXPECT_GT(rested * 3, tail);
  }
  KCompressorPlugin idle;
  idle.GetParameter(KCompressorPlugin::kRatio).SetWorking(1.0);
  EXPECT_EQ(idle.TailSamples(), 0u);
}
