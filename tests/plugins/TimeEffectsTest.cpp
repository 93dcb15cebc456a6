// The delay and the reverb: their times, their routing and their decay, measured.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "plugins/delay/KDelayPlugin.h"
#include "plugins/reverb/KReverbPlugin.h"
#include "tests/plugins/StereoRender.h"

namespace {
using D = KDelayPlugin;
using R = KReverbPlugin;
constexpr double kRate = 48000.0;

// Schroeder's backward integration of the energy, in dB below the total, per sample.
std::vector<double> DecayCurve(const KStereo& out) {
  std::vector<double> curve(out.first.size());
  double sum = 0.0;
  for (size_t i = curve.size(); i-- > 0;) curve[i] = sum += static_cast<double>(out.first[i]) * out.first[i] + static_cast<double>(out.second[i]) * out.second[i];
  for (double& v : curve) v = 10.0 * std::log10(std::max(v, 1e-300) / sum);
  return curve;
}
}  // namespace

// 250 ms at 48 kHz: the first repeat begins exactly 12000 samples after the sound and the next
// 12000 later at the feedback's level; synced to a quarter note at 100 BPM, 28800 samples.
TEST(KDelayPlugin, RepeatsExactlyAfterTheTimeOrTheNoteValue) {
  D free;
  const KStereo out = KRenderStereo(free, KImpulse(40000), {{D::kTime, 0.25}, {D::kFeedback, 50.0}, {D::kMix, 100.0},
                                                           {D::kLowCut, 20.0}, {D::kHighCut, 20000.0}});
  EXPECT_EQ(KFirstSound(out.first), 12000u);
  EXPECT_EQ(KFirstSound(out.second), 12000u);
  // With the cuts at the band's edges the filters are out: a plain echo.
  EXPECT_EQ(out.first[12000], 1.0f);
  EXPECT_EQ(out.first[24000], 0.5f);
  EXPECT_NEAR(KEnergy(out.first, 0, 40000), 1.0 + 0.25 + 0.0625, 1e-9);  // and nothing between the repeats

  D synced;
  synced.Transport().tempo = 100.0;
  const KStereo quarter = KRenderStereo(synced, KImpulse(30000), {{D::kSync, kNoteValueQuarter + 1.0}, {D::kMix, 100.0}});
  EXPECT_EQ(KFirstSound(quarter.first), 28800u);
}

// Ping-pong: a sound on the left comes back from the left at half level (the lines take the mono
// sum), then from the right, then the left again; the right stays silent until its turn.
TEST(KDelayPlugin, PingPongAlternatesTheSides) {
  D plugin;
  const KStereo out = KRenderStereo(plugin, KImpulse(4000, true), {{D::kTime, 0.01}, {D::kFeedback, 80.0}, {D::kMix, 100.0},
                                                                   {D::kPingPong, 1.0}, {D::kLowCut, 20.0}, {D::kHighCut, 20000.0}});
  EXPECT_EQ(KFirstSound(out.first), 480u);
  EXPECT_EQ(KFirstSound(out.second), 960u);
  EXPECT_EQ(out.first[480], 0.5f);
  EXPECT_EQ(out.second[960], 0.4f);
  EXPECT_EQ(out.first[1440], 0.32f);
  EXPECT_NEAR(KEnergy(out.first, 0, 4000), 0.5 * 0.5 + 0.32 * 0.32 + 0.2048 * 0.2048 + 0.131072 * 0.131072, 1e-6);
  EXPECT_EQ(KEnergy(out.second, 1000, 1900), 0.0);  // the third repeat is the left's
}

// The tail follows feedback and time: past it an impulse is 100 dB down, and it is not much
// longer than it needs to be.
TEST(KDelayPlugin, TailFollowsTheSettings) {
  D plugin;
  const KStereo out = KRenderStereo(plugin, KImpulse(200000), {{D::kTime, 0.05}, {D::kFeedback, 85.0}, {D::kMix, 100.0}});
  const size_t tail = plugin.TailSamples();
  ASSERT_LT(tail, out.first.size());
  EXPECT_GT(tail, 2400u * 71u);  // 0.85 falls by 100 dB in 71 repeats
  float late = 0.0f, before = 0.0f;
  for (size_t i = 0; i < out.first.size(); ++i) (i > tail ? late : before) = std::max(i > tail ? late : before, std::abs(out.first[i]));
  EXPECT_LT(late, 1e-5f);
  float lastStretch = 0.0f;
  for (size_t i = tail * 3 / 4; i < tail; ++i) lastStretch = std::max(lastStretch, std::abs(out.first[i]));
  EXPECT_GT(lastStretch, 1e-7f);
  D shorter;
  shorter.SetSampleRate(kRate);
  shorter.GetParameter(D::kTime).SetWorking(0.05);
  shorter.GetParameter(D::kFeedback).SetWorking(20.0);
  EXPECT_LT(shorter.TailSamples(), plugin.TailSamples() / 4);
}

// The measured reverberation time (from the energy decay between −5 and −35 dB, doubled) is
// within 10 % of the setting, undamped, for a short and a long decay and two sizes.
TEST(KReverbPlugin, MeasuredDecayTimeMatchesTheSetting) {
  for (auto [decay, size] : {std::pair{1.0, 100.0}, std::pair{3.0, 150.0}}) {
    R plugin;
    const auto length = static_cast<size_t>(kRate * decay * 1.5);
    const KStereo out = KRenderStereo(plugin, KImpulse(length), {{R::kDecay, decay}, {R::kSize, size}, {R::kDamping, 0.0},
                                                                {R::kMix, 100.0}, {R::kPreDelay, 0.0}});
    const std::vector<double> curve = DecayCurve(out);
    const auto at = [&curve](double db) {
      return static_cast<double>(std::find_if(curve.begin(), curve.end(), [db](double v) { return v <= db; }) - curve.begin());
    };
    const double measured = 2.0 * (at(-35.0) - at(-5.0)) / kRate;
    EXPECT_NEAR(measured, decay, 0.1 * decay) << "decay " << decay;
    // The fall by 100 dB and the diffusers' smear, and not much more.
    EXPECT_LT(plugin.TailSamples(), (2.0 * decay + 0.7) * kRate);
  }
}

// Nothing of the reverberation before the pre-delay and the shortest line have passed; the two
// sides are nearly uncorrelated at full width and identical at none.
TEST(KReverbPlugin, PreDelayAndWidth) {
  R plugin;
  const KStereo out = KRenderStereo(plugin, KImpulse(48000), {{R::kPreDelay, 0.05}, {R::kMix, 100.0}});
  EXPECT_EQ(KFirstSound(out.first), 2400u + 1426u);  // 29.7 ms, the shortest line
  double lr = 0.0;
  for (size_t i = 0; i < out.first.size(); ++i) lr += static_cast<double>(out.first[i]) * out.second[i];
  EXPECT_LT(std::abs(lr) / std::sqrt(KEnergy(out.first, 0, 48000) * KEnergy(out.second, 0, 48000)), 0.3);

  R mono;
  const KStereo narrow = KRenderStereo(mono, KImpulse(9600), {{R::kWidth, 0.0}, {R::kMix, 100.0}});
  EXPECT_EQ(narrow.first, narrow.second);
  EXPECT_GT(KEnergy(narrow.first, 0, 9600), 1e-3);
}
