#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/gate/KGatePlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using G = KGatePlugin;

std::unique_ptr<G> Gate(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto gate = std::make_unique<G>();
  gate->SetSampleRate(48000.0);
  for (auto [index, value] : settings) gate->GetParameter(index).SetWorking(value);
  return gate;
}

double Decibels(double ratio) { return 20.0 * std::log10(ratio); }
}  // namespace

// A tone 20 dB over the threshold passes bit for bit once the gate has opened; one 10 dB below
// it is turned down by the range as a gate and by the ratio as an expander.
TEST(GatePlugin, OpensAboveAndClosesBelowTheThreshold) {
  {
    auto gate = Gate({});
    const Channels in = Sine(2, 9600, 1000.0, std::pow(10.0, -20.0 / 20.0));
    const Channels out = Render(*gate, in, {500});
    for (size_t i = 4800; i < in[0].size(); ++i) ASSERT_EQ(out[0][i], in[0][i]) << i;
  }
  const double quiet = std::pow(10.0, -50.0 / 20.0);
  const std::pair<double, double> cases[] = {{20.0, -60.0}, {2.0, -10.0}, {3.0, -20.0}};  // ratio, expected gain
  for (const auto& [ratio, expected] : cases) {
    auto gate = Gate({{G::kRatio, ratio}});
    const Channels in = Sine(2, 48000, 1000.0, quiet);
    const Channels out = Render(*gate, in, {333});
    const double gain = Amplitude(out[1], 1000.0, 24000, 48000) / Amplitude(in[1], 1000.0, 24000, 48000);
    EXPECT_NEAR(Decibels(gain), expected, 1.5) << "ratio " << ratio;
  }
}

// After a loud passage the gate stays open for the hold time, then closes with the release;
// with the range at 0 dB it never closes at all.
TEST(GatePlugin, HoldsThenReleases) {
  auto gate = Gate({{G::kHold, 0.1}, {G::kRelease, 0.02}});
  Channels in = Sine(1, 48000, 1000.0, 0.003);
  for (size_t i = 0; i < 4800; ++i) in[0][i] *= 100.0f;  // loud for 100 ms
  gate->SetChannelsPerBus(1);
  const Channels out = Render(*gate, in, {256});
  auto gainAt = [&](size_t from) { return Amplitude(out[0], 1000.0, from, from + 480) / Amplitude(in[0], 1000.0, from, from + 480); };
  // The detector falls under the threshold some 35 ms after the loud end: 90 ms on, only the
  // hold keeps the gate open; 400 ms on it has long closed.
  EXPECT_NEAR(gainAt(4800 + 4320), 1.0, 1e-9);
  EXPECT_LT(Decibels(gainAt(4800 + 19200)), -55.0);
  auto open = Gate({{G::kRange, 0.0}});
  const Channels quiet = Sine(2, 4800, 1000.0, 0.001);
  EXPECT_EQ(Render(*open, quiet, {64}), quiet);
  EXPECT_EQ(open->TailSamples(), 0u);
}
