#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/dynamiceq/KDynamicEqualizerPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using D = KDynamicEqualizerPlugin;

std::unique_ptr<D> Equalizer(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto equalizer = std::make_unique<D>();
  equalizer->SetSampleRate(48000.0);
  for (auto [index, value] : settings) equalizer->GetParameter(index).SetWorking(value);
  return equalizer;
}

double ChangeDb(const Channels& out, const Channels& in, double hz) {
  return 20.0 * std::log10(Amplitude(out[0], hz, 24000, 48000) / Amplitude(in[0], hz, 24000, 48000));
}
}  // namespace

// Band 3 at its defaults (3 kHz, threshold −30 dB, range −6 dB): a quiet 3 kHz tone passes bit
// for bit, a loud one is cut by the whole range, a loud tone far from the band is left alone;
// a positive range lifts instead, and by no more than the tone's excess over the threshold.
TEST(DynamicEqualizer, MovesABandOnlyWhileItsFrequenciesAreLoud) {
  {
    auto equalizer = Equalizer({});
    const Channels quiet = Sine(2, 48000, 3000.0, 0.003);
    EXPECT_EQ(Render(*equalizer, quiet, {512}), quiet);
    EXPECT_EQ(equalizer->DynamicGain(2), 0.0);
  }
  {
    auto equalizer = Equalizer({});
    const Channels loud = Sine(2, 48000, 3000.0, 0.5);
    EXPECT_NEAR(ChangeDb(Render(*equalizer, loud, {512}), loud, 3000.0), -6.0, 0.3);
    EXPECT_EQ(equalizer->DynamicGain(2), -6.0);
  }
  {
    auto equalizer = Equalizer({});
    const Channels elsewhere = Sine(2, 48000, 150.0, 0.5);
    EXPECT_NEAR(ChangeDb(Render(*equalizer, elsewhere, {512}), elsewhere, 150.0), 0.0, 0.3);
  }
  {
    // −30 dB threshold, a tone whose band level is about −26 dB: a lift of about 4 dB, not 12.
    auto equalizer = Equalizer({{D::Index(2, D::kRange), 12.0}});
    const Channels medium = Sine(2, 48000, 3000.0, 0.05);
    const double lift = ChangeDb(Render(*equalizer, medium, {512}), medium, 3000.0);
    EXPECT_GT(lift, 2.0);
    EXPECT_LT(lift, 7.0);
  }
}

// The static gain works like a plain equalizer band, and a switched-off band does nothing at
// all, whatever its settings.
TEST(DynamicEqualizer, StaticGainAndSwitchedOffBands) {
  const Channels tone = Sine(2, 48000, 500.0, 0.001);
  auto boosted = Equalizer({{D::Index(1, D::kGain), 6.0}});
  EXPECT_NEAR(ChangeDb(Render(*boosted, tone, {480}), tone, 500.0), 6.0, 0.05);
  auto off = Equalizer({{D::Index(1, D::kGain), 6.0}, {D::Index(1, D::kEnable), 0.0}, {D::Index(2, D::kEnable), 0.0}});
  const Channels loud = Sine(2, 48000, 3000.0, 0.5);
  EXPECT_EQ(Render(*off, loud, {480}), loud);
}
