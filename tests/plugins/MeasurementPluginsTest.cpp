// The loudness meter, the spectrum analyser and the tone generator at 48 kHz, as a host drives
// them: the meters pass the sound untouched and read it right; the generator plays what it is
// set to and nothing when it is off.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/loudnessmeter/KLoudnessMeterPlugin.h"
#include "plugins/spectrumanalyser/KSpectrumAnalyserPlugin.h"
#include "plugins/tonegenerator/KToneGeneratorPlugin.h"
#include "tests/plugins/PluginRender.h"

// A 1 kHz sine with peaks at −20 dBFS in both channels reads −20.0 LUFS on every reading, the
// sound comes out bit for bit, and the graph's history holds the chosen reading.
TEST(LoudnessMeterPlugin, ReadsASineAsTheStandardSaysAndPassesItUntouched) {
  KLoudnessMeterPlugin plugin;
  ASSERT_TRUE(plugin.SetSampleRate(48000.0));
  const std::vector<float> sine = KSine(4 * 48000, 1000.0, 0.1);
  const KChannels in{sine, sine};
  EXPECT_EQ(KRender(plugin, in, 480), in);
  EXPECT_NEAR(plugin.Meter().Momentary(), -20.0, 0.05);
  EXPECT_NEAR(plugin.Meter().ShortTerm(), -20.0, 0.05);
  EXPECT_NEAR(plugin.Meter().Integrated(), -20.0, 0.05);
  EXPECT_NEAR(plugin.History(0.0), -20.0, 0.05);
  EXPECT_LT(plugin.History(29.0), -150.0);  // nothing measured that long ago
  plugin.Reset();
  EXPECT_LT(plugin.Meter().Integrated(), -150.0);
  EXPECT_LT(plugin.History(0.0), -150.0);
}

// The display shows a sine's level at its frequency with the slope pivoting at 1 kHz, rests on
// the floor far from it, and falls from a peak at the release speed once the sine has gone.
TEST(SpectrumAnalyserPlugin, ShowsASineWhereItIsAndReleasesIt) {
  KSpectrumAnalyserPlugin plugin;
  ASSERT_TRUE(plugin.SetSampleRate(48000.0));
  plugin.GetParameter(KSpectrumAnalyserPlugin::kSlope).SetWorking(0.0);
  // 1 kHz is not centred on a bin of 4096: the Hann window reads it within 1.5 dB.
  const std::vector<float> sine = KSine(8192, 1000.0, 0.5);
  EXPECT_EQ(KRender(plugin, KChannels{sine, sine}), (KChannels{sine, sine}));
  plugin.RefreshDisplay(0.0);
  EXPECT_NEAR(plugin.Display(1000.0), -6.02, 1.5);
  EXPECT_EQ(plugin.Display(10000.0), -100.0);
  plugin.GetParameter(KSpectrumAnalyserPlugin::kSlope).SetWorking(3.0);
  EXPECT_NEAR(plugin.Display(1000.0), -6.02, 1.5);  // the pivot does not move
  KRender(plugin, KChannels(2, std::vector<float>(8192, 0.0f)));
  plugin.RefreshDisplay(0.25);  // half the default release: 30 dB down
  plugin.GetParameter(KSpectrumAnalyserPlugin::kSlope).SetWorking(0.0);
  EXPECT_NEAR(plugin.Display(1000.0), -36.02, 1.5);
}

// Off, the input passes; playing, a sine of the set frequency and level (counted by its upward
// zero crossings over one second) is added to or replaces the input; the stepped waveforms stay
// within their level, and white noise has no pitch.
TEST(ToneGeneratorPlugin, PlaysTheSetToneAndOnlyWhenAsked) {
  using T = KToneGeneratorPlugin;
  T plugin;
  ASSERT_TRUE(plugin.SetSampleRate(48000.0));
  const std::vector<float> music = KSine(48000, 110.0, 0.3);
  EXPECT_EQ(KRender(plugin, KChannels{music, music}), (KChannels{music, music}));

  plugin.GetParameter(T::kPlay).SetWorking(1.0);
  plugin.GetParameter(T::kFrequency).SetWorking(440.0);
  plugin.GetParameter(T::kLevel).SetWorking(-6.0);
  plugin.GetParameter(T::kOutput).SetWorking(1.0);
  plugin.Reset();
  const KChannels tone = KRender(plugin, KChannels{music, music});
  int32_t crossings = 0;
  for (size_t i = 1; i < tone[0].size(); ++i) crossings += tone[0][i - 1] < 0.0f && tone[0][i] >= 0.0f;
  EXPECT_NEAR(crossings, 440, 1);
  EXPECT_NEAR(KRms(tone[0], 480), 0.5012 / std::sqrt(2.0), 1e-3);
  EXPECT_EQ(tone[0], tone[1]);

  plugin.GetParameter(T::kOutput).SetWorking(0.0);  // added: the tone over the music
  const KChannels sum = KRender(plugin, KChannels{music, music});
  const KChannels alone = KRender(plugin, KChannels(2, std::vector<float>(48000, 0.0f)));
  EXPECT_NEAR(KRms(sum[0], 480), std::hypot(KRms(alone[0], 480), KRms(music, 480)), 0.01);

  for (int32_t wave : {T::kTriangle, T::kSquare, T::kSawtooth, T::kNoise}) {
    plugin.GetParameter(T::kWaveform).SetWorking(wave);
    const KChannels out = KRender(plugin, KChannels(2, std::vector<float>(48000, 0.0f)));
    float peak = 0.0f;
    for (float v : out[0]) peak = std::max(peak, std::abs(v));
    EXPECT_LT(peak, 0.5012f * 1.1f) << wave;
    EXPECT_GT(KRms(out[0], 480), 0.2) << wave;
  }
  plugin.GetParameter(T::kPlay).SetWorking(0.0);
  const KChannels stopped = KRender(plugin, KChannels(2, std::vector<float>(4800, 0.0f)));
  EXPECT_EQ(stopped[0][4799], 0.0f);  // off after a short fade
}
