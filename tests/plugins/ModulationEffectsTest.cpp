// The LFO-driven plug-ins: what their modulation does to a signal, measured.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "dsp/KSectionState.h"
#include "plugins/autofilter/KAutoFilterPlugin.h"
#include "plugins/autopan/KAutoPanPlugin.h"
#include "plugins/chorus/KChorusPlugin.h"
#include "plugins/flanger/KFlangerPlugin.h"
#include "plugins/phaser/KPhaserPlugin.h"
#include "plugins/tremolo/KTremoloPlugin.h"
#include "tests/plugins/StereoRender.h"

namespace {
constexpr double kTwoPi = 6.283185307179586;

KStereo Sine(size_t length, double hz, double amplitude = 0.5) {
  KStereo s{std::vector<float>(length), std::vector<float>(length)};
  for (size_t i = 0; i < length; ++i) s.first[i] = s.second[i] = static_cast<float>(amplitude * std::sin(kTwoPi * hz * static_cast<double>(i) / 48000.0));
  return s;
}

KStereo Noise(size_t length) {
  KStereo s{std::vector<float>(length), std::vector<float>(length)};
  uint32_t r = 12345;
  for (size_t i = 0; i < length; ++i) {
    r = r * 1664525u + 1013904223u;
    s.first[i] = s.second[i] = static_cast<float>(static_cast<double>(r) / 4294967296.0 - 0.5);
  }
  return s;
}

double Rms(const std::vector<float>& s, size_t from, size_t to) { return std::sqrt(KEnergy(s, from, to) / static_cast<double>(to - from)); }
}  // namespace

// A 10 Hz square at full depth: the first half cycle passes exactly, the second is silent; synced
// to a quarter note at 100 BPM the switch falls at 14400 samples. At half depth with a sine the
// gain stays between 1/2 and 1.
TEST(KTremoloPlugin, DepthShapeAndSync) {
  using T = KTremoloPlugin;
  const KStereo in = Noise(30000);
  T square;
  const KStereo out = KRenderStereo(square, in, {{T::kDepth, 100.0}, {T::kLFO.shape, KLFO::kSquare}, {T::kLFO.rate, 10.0}, {T::kLFO.smoothing, 0.0}});
  for (size_t i = 0; i < 4800; ++i) ASSERT_EQ(out.first[i], i < 2400 ? in.first[i] : 0.0f) << i;
  T synced;
  synced.Transport().tempo = 100.0;
  const KStereo beat = KRenderStereo(synced, in, {{T::kDepth, 100.0}, {T::kLFO.sync, kNoteValueQuarter + 1.0}, {T::kLFO.shape, KLFO::kSquare}, {T::kLFO.smoothing, 0.0}}, 333);
  EXPECT_EQ(beat.second[14399], in.second[14399]);
  EXPECT_EQ(beat.second[14400], 0.0f);
  T sine;
  const KStereo half = KRenderStereo(sine, in, {{T::kDepth, 50.0}});
  for (size_t i = 0; i < half.first.size(); ++i) {
    const float x = std::abs(in.first[i]), y = std::abs(half.first[i]);
    ASSERT_TRUE(y <= x && y >= 0.5f * x - 1e-7f) << i;
  }
}

// Synced to a quarter note while the host plays at 120 BPM (24000 samples a beat), a full square
// passes the first half of every beat: from a start a quarter of a beat before a beat (song
// position 2.75), the sound comes at 6000 samples, goes at 18000 and comes again at 30000. When
// the host loops back to 1.1 at sample 36000, the cycle goes on from there, a tenth into a beat:
// silent 9600 samples later, sounding again 12000 after that. A stopped transport moves nothing:
// the LFO runs on from its start.
TEST(KTremoloPlugin, SyncedCycleFollowsTheSongPosition) {
  using T = KTremoloPlugin;
  const KStereo in = Noise(66000);
  for (const bool playing : {true, false}) {
    T plugin;
    KRenderStereo(plugin, KStereo{}, {{T::kDepth, 100.0}, {T::kLFO.sync, kNoteValueQuarter + 1.0}, {T::kLFO.shape, KLFO::kSquare}, {T::kLFO.smoothing, 0.0}});
    KTransport& transport = plugin.Transport();
    transport.tempo = 120.0;
    transport.flags = playing ? KTransport::kPlaying : 0;
    KStereo out{std::vector<float>(in.first.size()), std::vector<float>(in.first.size())};
    for (size_t at = 0; at < in.first.size(); at += 500) {
      transport.songPosition = at < 36000 ? 2.75 + at / 24000.0 : 1.1 + (at - 36000) / 24000.0;
      const float* i[] = {in.first.data() + at, in.second.data() + at};
      float* o[] = {out.first.data() + at, out.second.data() + at};
      plugin.ProcessHostBlock(i, o, 500);
    }
    // Where each stretch of sound begins, as the song position has it (or, stopped, as cycles
    // from the start have it); silence until the next.
    const std::vector<std::pair<size_t, bool>> stretches =
        playing ? std::vector<std::pair<size_t, bool>>{{0, false}, {6000, true}, {18000, false}, {30000, true}, {45600, false}, {57600, true}}
                : std::vector<std::pair<size_t, bool>>{{0, true}, {12000, false}, {24000, true}, {36000, false}, {48000, true}, {60000, false}};
    for (size_t k = 0; k < stretches.size(); ++k) {
      const size_t end = k + 1 < stretches.size() ? stretches[k + 1].first : in.first.size();
      for (size_t i = stretches[k].first; i < end; ++i)
        ASSERT_EQ(out.first[i], stretches[k].second ? in.first[i] : 0.0f) << (playing ? "playing, " : "stopped, ") << i;
    }
  }
}

// A 10 Hz square at full width: the balance sits right for half a cycle (the left silent), then
// left; a single channel passes unchanged.
TEST(KAutoPanPlugin, MovesTheBalanceBetweenTheSides) {
  using A = KAutoPanPlugin;
  const KStereo in = Noise(4800);
  A plugin;
  const KStereo out = KRenderStereo(plugin, in, {{A::kLFO.shape, KLFO::kSquare}, {A::kLFO.rate, 10.0}, {A::kLFO.smoothing, 0.0}});
  EXPECT_EQ(KEnergy(out.first, 0, 2400), 0.0);
  EXPECT_EQ(KEnergy(out.second, 2400, 4800), 0.0);
  EXPECT_TRUE(std::equal(out.second.begin(), out.second.begin() + 2400, in.second.begin()));
  EXPECT_TRUE(std::equal(out.first.begin() + 2400, out.first.end(), in.first.begin() + 2400));

  A mono;
  ASSERT_TRUE(mono.SetChannelsPerBus(1));
  mono.SetSampleRate(48000.0);
  std::vector<float> y(4800);
  const float* i[] = {in.first.data()};
  float* o[] = {y.data()};
  mono.ProcessHostBlock(i, o, 4800);
  EXPECT_EQ(y, in.first);
}

// Without depth the chorus is a plain delay of its base time; with depth the voices waver, and
// the two channels of a mono source part when the spread is set, not otherwise.
TEST(KChorusPlugin, DelaysWaversAndSpreads) {
  using C = KChorusPlugin;
  const KStereo in = Noise(9600);
  C still;
  const KStereo plain = KRenderStereo(still, in, {{C::kDepth, 0.0}, {C::kDelay, 0.015}, {C::kVoices, 1.0}, {C::kMix, 100.0}});
  for (size_t i = 720; i < 9600; ++i) ASSERT_EQ(plain.first[i], in.first[i - 720]) << i;
  C spread, together;
  const KStereo wide = KRenderStereo(spread, in, {});
  const KStereo narrow = KRenderStereo(together, in, {{C::kLFO.stereoPhase, 0.0}});
  EXPECT_EQ(narrow.first, narrow.second);
  double apart = 0.0;
  for (size_t i = 4800; i < 9600; ++i) apart += std::abs(wide.first[i] - wide.second[i]);
  EXPECT_GT(apart / 4800.0, 0.01);
}

// With the sweep held still, the flanger is a comb: the delayed copy returns every millisecond at
// the feedback's power; negative feedback alternates its sign.
TEST(KFlangerPlugin, FeedbackBuildsTheComb) {
  using F = KFlangerPlugin;
  for (double feedback : {50.0, -50.0}) {
    F plugin;
    const KStereo out = KRenderStereo(plugin, KImpulse(400), {{F::kDepth, 0.0}, {F::kDelay, 0.001}, {F::kFeedback, feedback}, {F::kMix, 100.0}});
    EXPECT_EQ(KFirstSound(out.first), 48u);
    for (int k = 1; k <= 4; ++k) EXPECT_FLOAT_EQ(out.first[48u * k], static_cast<float>(std::pow(feedback / 100.0, k - 1))) << k;
  }
}

// Two stages held at 1 kHz turn a 1 kHz tone by 180°, so at half mix it cancels, while 250 Hz
// passes; without the dry signal the chain is an allpass and keeps the energy of an impulse.
TEST(KPhaserPlugin, StagesCancelAtTheirCornerAndPassEverythingAlone) {
  using P = KPhaserPlugin;
  const std::vector<std::pair<int32_t, double>> held = {{P::kStages, 0.0}, {P::kLow, 1000.0}, {P::kHigh, 1000.0}, {P::kFeedback, 0.0}};
  P notch, pass;
  const KStereo at = KRenderStereo(notch, Sine(9600, 1000.0), held);
  const KStereo below = KRenderStereo(pass, Sine(9600, 250.0), held);
  EXPECT_LT(Rms(at.first, 4800, 9600), 1e-4);
  EXPECT_GT(Rms(below.first, 4800, 9600), 0.5 * 0.5 / std::sqrt(2.0) * 0.8);
  auto alone = held;
  alone.push_back({P::kMix, 100.0});
  alone.push_back({P::kStages, 5.0});
  P allpass;
  const KStereo impulse = KRenderStereo(allpass, KImpulse(48000), alone);
  EXPECT_NEAR(KEnergy(impulse.first, 0, 48000), 1.0, 1e-5);
}

// Held still, the filter is the designed section, sample for sample; swept by a slow square
// over ±2 octaves, a 2 kHz tone passes the low pass at its top (3.2 kHz) and not at its bottom
// (200 Hz).
TEST(KAutoFilterPlugin, FollowsItsDesignAndTheSweep) {
  using F = KAutoFilterPlugin;
  const KStereo in = Noise(4096);
  F still;
  const KStereo out = KRenderStereo(still, in, {{F::kDepth, 0.0}, {F::kCutoff, 1000.0}, {F::kResonance, 0.7071}}, 100);
  KFilterSection section;
  section.Design(KFilterSection::kLowPass, 0.0, 1000.0, 48000.0, 0.7071);
  KSectionState state;
  for (size_t i = 0; i < in.first.size(); ++i) ASSERT_NEAR(out.first[i], state.Step(&section.b0, in.first[i]), 1e-6) << i;

  F swept;
  const KStereo tone = KRenderStereo(swept, Sine(48000, 2000.0), {{F::kCutoff, 800.0}, {F::kDepth, 2.0}, {F::kLFO.shape, KLFO::kSquare}, {F::kLFO.rate, 1.0}});
  EXPECT_GT(Rms(tone.first, 4800, 24000), 0.3);
  EXPECT_LT(Rms(tone.first, 28800, 48000), 0.03);
}
