#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"
#include "plugins/limiter/KLimiterPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using L = KLimiterPlugin;

std::unique_ptr<L> Limiter(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto limiter = std::make_unique<L>();
  limiter->SetSampleRate(48000.0);
  for (auto [index, value] : settings) limiter->GetParameter(index).SetWorking(value);
  return limiter;
}

// A tone 9 dB over full scale with sudden steps and single-sample spikes above it, different in
// each channel.
Channels Overshooting() {
  Channels in = Sine(2, 24000, 220.0, 2.8);
  for (size_t i = 0; i < in[0].size(); ++i) {
    if (i % 4000 < 300) in[0][i] *= 1.5f;
    if (i % 1777 == 0) in[1][i] = (i % 2 ? -4.0f : 4.0f);
  }
  return in;
}
}  // namespace

// Whatever the block size, link setting, lookahead and input gain, no output sample exceeds
// the ceiling, and the limiter holds the level close under it instead of crushing it.
TEST(LimiterPlugin, NeverExceedsItsCeiling) {
  const Channels in = Overshooting();
  for (const double ceiling : {-0.3, -6.0}) {
    for (const double link : {1.0, 0.0}) {
      for (const double lookahead : {0.0005, 0.005, 0.01}) {
        auto limiter = Limiter({{L::kCeiling, ceiling}, {L::kLinkChannels, link}, {L::kLookahead, lookahead}, {L::kInputGain, 6.0}});
        const Channels out = Render(*limiter, in, {512, 17, 4096, 1});
        const auto limit = static_cast<float>(KDecibelsToLinear(ceiling));
        EXPECT_LE(PeakOf(out, 0, SIZE_MAX), limit * (1.0f + 1e-6f)) << ceiling << " dB, link " << link << ", lookahead " << lookahead;
        EXPECT_GT(PeakOf(out, 12000, SIZE_MAX), limit * 0.9f);
        EXPECT_LT(limiter->GainReductionDecibels(), -6.0f);
      }
    }
  }
}

// What stays under the ceiling comes out unchanged, exactly the reported latency later, also
// once the gain has recovered from a loud passage; the latency follows the lookahead.
TEST(LimiterPlugin, PassesQuietSignalUnchangedAfterItsLatency) {
  for (const double lookahead : {0.001, 0.005}) {
    auto limiter = Limiter({{L::kLookahead, lookahead}, {L::kRelease, 0.01}});
    Channels in = Sine(2, 48000, 330.0, 0.5);
    for (size_t i = 0; i < 4800; ++i) in[0][i] *= 4.0f;  // a loud start to recover from
    const Channels out = Render(*limiter, in, {256});
    const auto latency = static_cast<size_t>(limiter->TotalLatency());
    EXPECT_EQ(latency, static_cast<size_t>(std::lround(lookahead * 48000.0)));
    const size_t recovered = 4800 + limiter->TailSamples();
    ASSERT_LT(recovered, in[0].size());
    for (size_t c = 0; c < 2; ++c)
      for (size_t i = recovered; i < in[c].size(); ++i) ASSERT_EQ(out[c][i], in[c][i - latency]) << "channel " << c << " at " << i;
  }
}

// Linked, a peak in one channel lowers both; unlinked, the other channel passes untouched.
TEST(LimiterPlugin, LinkingSharesTheGainReduction) {
  Channels in = Sine(2, 9600, 440.0, 0.25);
  for (size_t i = 4800; i < 4900; ++i) in[0][i] = 3.0f;
  for (const double link : {1.0, 0.0}) {
    auto limiter = Limiter({{L::kLinkChannels, link}});
    const Channels out = Render(*limiter, in, {512});
    const auto latency = static_cast<size_t>(limiter->TotalLatency());
    const double right = Amplitude(out[1], 440.0, 4800 + latency - 240, 4900 + latency + 240) /
                         Amplitude(in[1], 440.0, 4800 - 240, 4900 + 240);
    if (link > 0.5) {
      EXPECT_LT(right, 0.6) << "linked";
    } else {
      EXPECT_NEAR(right, 1.0, 1e-6) << "unlinked";
    }
  }
}
