#include <gtest/gtest.h>

#include <cmath>
#include <set>
#include <vector>

#include "core/KParameter.h"
#include "plugins/bitcrusher/KBitCrusherPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using B = KBitCrusherPlugin;

std::unique_ptr<B> Crusher(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto crusher = std::make_unique<B>();
  crusher->SetSampleRate(48000.0);
  crusher->SetChannelsPerBus(1);
  for (auto [index, value] : settings) crusher->GetParameter(index).SetWorking(value);
  return crusher;
}

// A ramp over the whole range and a little beyond it.
Channels Ramp(size_t length) {
  Channels in(1, std::vector<float>(length));
  for (size_t i = 0; i < length; ++i) in[0][i] = static_cast<float>(-1.2 + 2.4 * static_cast<double>(i) / static_cast<double>(length - 1));
  return in;
}
}  // namespace

// At N bits a ramp across full scale comes out as exactly 2^N distinct levels, evenly spaced by
// 2^(1−N), none beyond full scale.
TEST(BitCrusher, NBitsYieldAtMostTwoToTheNLevels) {
  const Channels ramp = Ramp(100000);
  for (const int32_t bits : {1, 2, 3, 8, 12}) {
    auto crusher = Crusher({{B::kBits, bits}});
    const Channels out = Render(*crusher, ramp, {4096, 7});
    const std::set<float> levels(out[0].begin(), out[0].end());
    EXPECT_EQ(levels.size(), size_t{1} << bits) << bits << " bits";
    const double step = std::ldexp(1.0, 1 - bits);
    for (const float level : levels) {
      EXPECT_LE(std::abs(level), 1.0f);
      EXPECT_EQ(std::fmod(static_cast<double>(level) + 1.0, step), 0.0) << level;
    }
  }
}

// Downsampling holds each taken sample for the whole factor, counted from the start whatever
// the blocks; a dry mix returns the input untouched.
TEST(BitCrusher, DownsampleHoldsAndDryMixPasses) {
  const Channels in = Sine(1, 9000, 997.0, 0.8);
  auto crusher = Crusher({{B::kBits, 24.0}, {B::kDownsample, 5.0}});
  const Channels out = Render(*crusher, in, {3, 64, 1000});
  for (size_t i = 0; i < out[0].size(); ++i) ASSERT_EQ(out[0][i], out[0][i - i % 5]) << i;
  EXPECT_NE(out[0][5], out[0][4]);
  EXPECT_NEAR(out[0][5], in[0][5], 1e-6);
  auto dry = Crusher({{B::kBits, 1.0}, {B::kMix, 0.0}});
  EXPECT_EQ(Render(*dry, in, {512}), in);
}
