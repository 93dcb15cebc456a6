#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/transient/KTransientShaperPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using T = KTransientShaperPlugin;

std::unique_ptr<T> Shaper(double attack, double sustain) {
  auto shaper = std::make_unique<T>();
  shaper->SetSampleRate(48000.0);
  shaper->GetParameter(T::kAttack).SetWorking(attack);
  shaper->GetParameter(T::kSustain).SetWorking(sustain);
  return shaper;
}

// Silence, then a 1 kHz note that starts at once and dies away over 50 ms.
Channels Note() {
  Channels in = Sine(2, 24000, 1000.0, 0.5, 4800);
  for (auto& row : in)
    for (size_t i = 4800; i < row.size(); ++i) row[i] *= static_cast<float>(std::exp(-static_cast<double>(i - 4800) / 2400.0));
  return in;
}

// The gain the shaper gave the note over [from, to) samples after its start.
double Gain(const Channels& out, const Channels& in, size_t from, size_t to) {
  return Amplitude(out[0], 1000.0, 4800 + from, 4800 + to) / Amplitude(in[0], 1000.0, 4800 + from, 4800 + to);
}
}  // namespace

// At 0 % both ways the signal passes bit for bit; attack changes the first milliseconds of the
// note and leaves its later decay nearly alone, sustain the other way round.
TEST(TransientShaper, AttackShapesTheOnsetAndSustainTheDecay) {
  const Channels in = Note();
  EXPECT_EQ(Render(*Shaper(0.0, 0.0), in, {100}), in);
  const Channels punch = Render(*Shaper(100.0, 0.0), in, {100});
  const Channels soft = Render(*Shaper(-100.0, 0.0), in, {100});
  EXPECT_GT(Gain(punch, in, 0, 96), 2.0);
  EXPECT_LT(Gain(soft, in, 0, 96), 0.5);
  const Channels dry = Render(*Shaper(0.0, -100.0), in, {100});
  const Channels long_ = Render(*Shaper(0.0, 100.0), in, {100});
  EXPECT_LT(Gain(dry, in, 4800, 9600), 0.5);
  EXPECT_GT(Gain(long_, in, 4800, 9600), 2.0);
  EXPECT_NEAR(Gain(dry, in, 0, 48), 1.0, 0.25);  // the onset is not the sustain
}

// The shaping follows the shape, not the level: the same note 30 dB quieter gets the same gains.
TEST(TransientShaper, ShapingDoesNotDependOnLevel) {
  const Channels loud = Note();
  Channels quiet = loud;
  for (auto& row : quiet)
    for (float& v : row) v *= 0.0316f;
  const Channels a = Render(*Shaper(70.0, -40.0), loud, {256});
  const Channels b = Render(*Shaper(70.0, -40.0), quiet, {256});
  for (const auto& [from, to] : {std::pair<size_t, size_t>{0, 96}, {2400, 4800}, {9600, 14400}})
    EXPECT_NEAR(Gain(a, loud, from, to), Gain(b, quiet, from, to), 0.01) << from;
}
