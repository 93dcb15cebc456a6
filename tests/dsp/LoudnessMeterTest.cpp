#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "dsp/KLoudnessMeter.h"

namespace {
constexpr double kTwoPi = 6.283185307179586;

// `seconds` of a 1 kHz sine whose peaks stand at `dbfs` into `channels` channels (the others
// silent), in blocks of 1000.
void PlaySine(KLoudnessMeter& meter, double rate, double dbfs, double seconds, int32_t channels, double& phase) {
  const double amplitude = std::pow(10.0, dbfs / 20.0), step = kTwoPi * 1000.0 / rate;
  std::vector<float> left(1000), right(1000);
  const float* both[2] = {left.data(), right.data()};
  for (auto n = static_cast<int64_t>(seconds * rate); n > 0; n -= 1000) {
    for (size_t i = 0; i < left.size(); ++i, phase += step) {
      left[i] = static_cast<float>(amplitude * std::sin(phase));
      right[i] = channels == 2 ? left[i] : 0.0f;
    }
    meter.Process(both, 2, static_cast<int32_t>(std::min<int64_t>(n, 1000)));
  }
}
}  // namespace

// The weighting's two stages at 48 kHz, as the loudness standard tabulates them.
TEST(KLoudnessMeter, KWeightingAt48kHzMatchesTheStandardsTable) {
  const KFilterSection shelf = KLoudnessMeter::Shelf(48000.0), highPass = KLoudnessMeter::HighPass(48000.0);
  EXPECT_NEAR(shelf.b0, 1.53512485958697, 1e-9);
  EXPECT_NEAR(shelf.b1, -2.69169618940638, 1e-9);
  EXPECT_NEAR(shelf.b2, 1.19839281085285, 1e-9);
  EXPECT_NEAR(-shelf.minusA1, -1.69065929318241, 1e-9);
  EXPECT_NEAR(-shelf.minusA2, 0.73248077421585, 1e-9);
  EXPECT_EQ(highPass.b0, 1.0);
  EXPECT_EQ(highPass.b1, -2.0);
  EXPECT_EQ(highPass.b2, 1.0);
  EXPECT_NEAR(-highPass.minusA1, -1.99004745483398, 1e-9);
  EXPECT_NEAR(-highPass.minusA2, 0.99007225036621, 1e-9);
}

// A 1 kHz sine's mean square is half its peak squared (−3.01 dB), and the weighting lifts 1 kHz
// by the 0.691 dB that the formula's constant takes away again: one channel with peaks at
// −20 dBFS reads −23.0 LUFS, the same in both channels +3.01 dB more, −20.0 LUFS (the standard's
// reference: a stereo sine at −23 dBFS reads −23 LUFS). All three readings agree on a steady
// tone, at every rate.
TEST(KLoudnessMeter, SineAtMinus20dBFSReadsAsTheStandardSays) {
  for (double rate : {44100.0, 48000.0, 96000.0}) {
    for (int32_t channels : {1, 2}) {
      KLoudnessMeter meter;
      meter.Prepare(rate);
      double phase = 0.0;
      PlaySine(meter, rate, -20.0, 4.0, channels, phase);
      const double expected = channels == 2 ? -20.0 : -23.0;
      EXPECT_NEAR(meter.Momentary(), expected, 0.05) << rate << " Hz, " << channels << " channels";
      EXPECT_NEAR(meter.ShortTerm(), expected, 0.05) << rate;
      EXPECT_NEAR(meter.Integrated(), expected, 0.05) << rate;
    }
  }
}

// Ten seconds at −20 and ten at −40: the quieter blocks sit 20 LU under the programme, below
// the relative gate, and do not lower the integrated loudness (ungated it would read −22.97; the
// three blocks straddling the change count, 0.06 LU); silence (under the absolute gate) does
// not either. The momentary and short-term readings follow the level down; Reset
// forgets the programme.
TEST(KLoudnessMeter, GatesQuietPassagesOutOfTheIntegratedLoudness) {
  KLoudnessMeter meter;
  meter.Prepare(48000.0);
  EXPECT_EQ(meter.Integrated(), KLoudnessMeter::kSilence);
  double phase = 0.0;
  PlaySine(meter, 48000.0, -20.0, 10.0, 2, phase);
  PlaySine(meter, 48000.0, -40.0, 10.0, 2, phase);
  EXPECT_NEAR(meter.Integrated(), -20.06, 0.02);
  EXPECT_NEAR(meter.ShortTerm(), -40.0, 0.05);
  EXPECT_NEAR(meter.Momentary(), -40.0, 0.05);
  PlaySine(meter, 48000.0, -200.0, 5.0, 2, phase);
  EXPECT_NEAR(meter.Integrated(), -20.06, 0.02);
  EXPECT_LT(meter.Momentary(), -150.0);

  // Equal time at −20 and −26 (6 LU apart, inside the gate): both count, as a mean of powers.
  meter.Reset();
  PlaySine(meter, 48000.0, -20.0, 10.0, 2, phase);
  PlaySine(meter, 48000.0, -26.0, 10.0, 2, phase);
  EXPECT_NEAR(meter.Integrated(), -20.0 + 10.0 * std::log10((1.0 + std::pow(10.0, -0.6)) / 2.0), 0.1);
}
