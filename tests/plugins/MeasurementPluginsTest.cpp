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
  const std::vector<float> sine = Sine(1, 4 * 48000, 1000.0, 0.1)[0];
  const Channels in{sine, sine};
  EXPECT_EQ(Render(plugin, in, {480}), in);
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
  const std::vector<float> sine = Sine(1, 8192, 1000.0, 0.5)[0];
  EXPECT_EQ(Render(plugin, Channels{sine, sine}, {512}), (Channels{sine, sine}));
  plugin.RefreshDisplay(0.0);
  EXPECT_NEAR(plugin.Display(1000.0), -6.02, 1.5);
  EXPECT_EQ(plugin.Display(10000.0), -100.0);
  plugin.GetParameter(KSpectrumAnalyserPlugin::kSlope).SetWorking(3.0);
  EXPECT_NEAR(plugin.Display(1000.0), -6.02, 1.5);  // the pivot does not move
  Render(plugin, Channels(2, std::vector<float>(8192, 0.0f)), {512});
  plugin.RefreshDisplay(0.25);  // half the default release: 30 dB down
  plugin.GetParameter(KSpectrumAnalyserPlugin::kSlope).SetWorking(0.0);
  EXPECT_NEAR(plugin.Display(1000.0), -36.02, 1.5);
}

// Off, the input passes; playing, a sine of the set frequency and level (counted by its upward
// zero crossings over one second) is added to or replaces the input; the other waveforms stay
// within their level with their fundamental where the series puts it, and white noise has no
// pitch.
TEST(ToneGeneratorPlugin, PlaysTheSetToneAndOnlyWhenAsked) {
  using T = KToneGeneratorPlugin;
  T plugin;
  ASSERT_TRUE(plugin.SetSampleRate(48000.0));
  const std::vector<float> music = Sine(1, 48000, 110.0, 0.3)[0];
  EXPECT_EQ(Render(plugin, Channels{music, music}, {512}), (Channels{music, music}));

  plugin.GetParameter(T::kPlay).SetWorking(1.0);
  plugin.GetParameter(T::kFrequency).SetWorking(440.0);
  plugin.GetParameter(T::kLevel).SetWorking(-6.0);
  plugin.GetParameter(T::kOutput).SetWorking(1.0);
  plugin.Reset();
  const Channels tone = Render(plugin, Channels{music, music}, {512});
  int32_t crossings = 0;
  for (size_t i = 1; i < tone[0].size(); ++i) crossings += tone[0][i - 1] < 0.0f && tone[0][i] >= 0.0f;
  EXPECT_NEAR(crossings, 440, 1);
  EXPECT_NEAR(Amplitude(tone[0], 440.0, 0, 48000), 0.5012, 3e-3);  // 440 whole periods
  EXPECT_LT(Amplitude(tone[0], 110.0, 0, 48000), 1e-4);  // the input is replaced
  EXPECT_EQ(tone[0], tone[1]);

  plugin.GetParameter(T::kOutput).SetWorking(0.0);  // added: the tone over the music
  const Channels sum = Render(plugin, Channels{music, music}, {512});
  EXPECT_NEAR(Amplitude(sum[0], 440.0, 0, 48000), 0.5012, 3e-3);
  EXPECT_NEAR(Amplitude(sum[0], 110.0, 0, 48000), 0.3, 1e-3);

  // Fundamentals of the series: triangle 8/π², square 4/π, sawtooth 2/π of the peak.
  const struct { int32_t wave; double fundamental; } kWaves[] = {
      {T::kTriangle, 0.8106}, {T::kSquare, 1.2732}, {T::kSawtooth, 0.6366}, {T::kNoise, 0.0}};
  for (const auto& w : kWaves) {
    plugin.GetParameter(T::kWaveform).SetWorking(w.wave);
    const Channels out = Render(plugin, Channels(2, std::vector<float>(48000, 0.0f)), {512});
    EXPECT_LT(PeakOf(out, 0, 48000), 0.5012f * 1.1f) << w.wave;
    EXPECT_GT(PeakOf(out, 0, 48000), 0.5012f * 0.9f) << w.wave;
    EXPECT_NEAR(Amplitude(out[0], 440.0, 0, 48000), 0.5012 * w.fundamental, 0.01) << w.wave;
  }
  plugin.GetParameter(T::kPlay).SetWorking(0.0);
  const Channels stopped = Render(plugin, Channels(2, std::vector<float>(4800, 0.0f)), {512});
  EXPECT_EQ(stopped[0][4799], 0.0f);  // off after a short fade
}
