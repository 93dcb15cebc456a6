// The compressor through the processing cycle at 48 kHz, main and side-chain bus in host blocks.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include "core/Element.h"
#include "core/KChannelMode.h"
#include "core/KParameter.h"
#include "plugins/compressor/KCompressorPlugin.h"

namespace {
using Channels = std::vector<std::vector<float>>;
using C = KCompressorPlugin;
constexpr double kRate = 48000.0;
constexpr size_t kBlock = 256, kHalfSecond = 24000;

// Sine left, cosine right: the linked detector's mean square is a²/2 at every sample, no ripple.
Channels Quadrature(double a, double hz, size_t n = kHalfSecond) {
  Channels c(2, std::vector<float>(n));
  for (size_t i = 0; i < n; ++i) {
    c[0][i] = static_cast<float>(a * std::sin(6.283185307179586 * hz * i / kRate));
    c[1][i] = static_cast<float>(a * std::cos(6.283185307179586 * hz * i / kRate));
  }
  return c;
}

// The documented law at a settled level d: unity up to T = threshold², then the line through (T, T), (1, T^(1 − 1/r)).
double LawGain(double threshold, double ratio, double d, bool maximize = false) {
  const double t = threshold * threshold, y0 = std::pow(t, 1.0 - 1.0 / ratio), m = (y0 - t) / (1.0 - t);
  return (maximize ? 1.0 / y0 : 1.0) * (d <= t ? 1.0 : (t * (1.0 - m) + m * d) / d);
}

Channels Play(C& plugin, const Channels& main, const Channels& key) {
  Channels out(2, std::vector<float>(main[0].size(), 99.0f));
  for (size_t at = 0; at < main[0].size(); at += kBlock) {
    const float* in[] = {&main[0][at], &main[1][at], &key[0][at], &key[1][at]};
    float* o[] = {&out[0][at], &out[1][at]};
    plugin.ProcessHostBlock(in, o, static_cast<int32_t>(std::min(kBlock, main[0].size() - at)));
  }
  return out;
}

// Largest |out − gain·in| over the second half, where the detector has settled.
double SettledError(const Channels& out, const Channels& in, double gain, double worst = 0.0) {
  for (size_t c = 0; c < 2; ++c)
    for (size_t i = in[c].size() / 2; i < in[c].size(); ++i) worst = std::max(worst, std::abs(out[c][i] - gain * in[c][i]));
  return worst;
}

struct CompressorTest : ::testing::Test {
  CompressorTest() { EXPECT_TRUE(plugin.SetSampleRate(kRate)); }
  void Set(const char* key, double v, C* on = nullptr) {  // by key, as presets and hosts name them
    if (auto* p = (on ? on : &plugin)->FindParameter(KString::Static(key))) p->SetWorking(v); else ADD_FAILURE() << key;
  }
  C plugin;
  const Channels silence = Quadrature(0.0, 1.0), loud = Quadrature(0.9, 441.0);
};
}  // namespace

TEST_F(CompressorTest, SettledGainFollowsTheTransferLaw) {
  // The input gain acts before the detector, both gains on the output; the last row, 1:1, is a pure gain.
  struct Row { double amplitude, threshold, ratio; bool maximize; double inDb, outDb; };
  for (const Row& r : {Row{0.9, 0.5, 1.8, false, 0, 0}, Row{0.2, 0.5, 1.8, false, 0, 0}, Row{0.9, 0.3, 4.0, true, 0, 0},
                       Row{0.35, 0.6, 20.0, false, 6, -2}, Row{0.9, 0.5, 1.0, false, 6, -3}}) {
    C fresh;
    Set("threshold", r.threshold, &fresh), Set("ratio", r.ratio, &fresh), Set("maximize", r.maximize, &fresh);
    Set("gain", r.inDb, &fresh), Set("outputgain", r.outDb, &fresh);
    const double in = std::pow(10.0, r.inDb / 20.0), out = std::pow(10.0, r.outDb / 20.0);
    const double law = LawGain(r.threshold, r.ratio, in * r.amplitude / std::sqrt(2.0), r.maximize);
    const Channels tone = Quadrature(r.amplitude, 441.0);
    EXPECT_LT(SettledError(Play(fresh, tone, silence), tone, law * in * out), 2e-6) << r.amplitude << " " << r.ratio;
    const double reduction = law / LawGain(r.threshold, r.ratio, 0.0, r.maximize);  // the meter leaves out the make-up
    EXPECT_NEAR(fresh.GainReductionDecibels(), 20.0 * std::log10(reduction), 1e-4);
  }
}

TEST_F(CompressorTest, SideChainDrivesTheDetectorAndCanBeHeard) {
  const Channels quiet = Quadrature(0.1, 300.0), key = Quadrature(0.9, 2000.0);
  EXPECT_EQ(Play(plugin, quiet, key), quiet);  // the main bus alone stays below the threshold
  Set("SideChainInput", 1.0);
  EXPECT_LT(SettledError(Play(plugin, quiet, key), quiet, LawGain(0.5, 1.8, 0.9 / std::sqrt(2.0))), 1e-6);
  Set("SideChainPlay", 1.0);  // the audition plays what the detector hears
  EXPECT_EQ(Play(plugin, quiet, key), key);
  Set("SideChainInput", 0.0);
  EXPECT_EQ(Play(plugin, quiet, key), quiet);
  Set("SideChainInput", 1.0), Set("SideChainMaxFrequency", 500.0);  // the band limit reaches the audition: 2 kHz is 24 dB down
  EXPECT_LT(SettledError(Play(plugin, quiet, key), key, 0.0), 0.9 * 0.07);
}

TEST_F(CompressorTest, CustomShapeDrivesTheGainAndPersists) {
  Element section("PluginSettings");
  plugin.StorePluginSettings(section, C::kStore);
  EXPECT_FALSE(section.HasAttribute("CustomShape"));  // the default graph is not written
  const std::vector<C::Point> halfLine = {{0.0, 0.0}, {0.3, 0.15}, {1.0, 0.5}};
  plugin.SetCustomShape(halfLine);
  plugin.StorePluginSettings(section, C::kStore);
  C loaded;
  loaded.StorePluginSettings(section, 0);
  Set("customshape", 1.0, &loaded);  // output amplitude half the input's: gain 0.25 at every level
  for (double amplitude : {0.9, 0.05}) {
    const Channels in = Quadrature(amplitude, 441.0);
    EXPECT_LT(SettledError(Play(loaded, in, silence), in, 0.25), 1e-6) << amplitude;
  }
  plugin.SetCustomShape({});  // back to the default, the attribute goes
  plugin.StorePluginSettings(section, C::kStore | C::kRemoveDefaults);
  EXPECT_FALSE(section.HasAttribute("CustomShape"));
}

TEST_F(CompressorTest, BadSamplesSpoilOneBlockAndSilenceEndsInZeros) {
  for (const float bad : {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity()}) {
    C spoiled, fresh;
    for (C* p : {&spoiled, &fresh}) Set("linkchannels", 0.0, p), Set("SideChainInput", 1.0, p);
    Channels key = loud;
    key[0][kHalfSecond - 100] = key[1][kHalfSecond - 100] = bad;  // into both detectors, in the last block
    Play(spoiled, loud, key);
    EXPECT_EQ(Play(spoiled, loud, loud), Play(fresh, loud, loud)) << bad;
  }
  Play(plugin, loud, loud);
  for (int k = 0; k < 6; ++k) EXPECT_EQ(Play(plugin, silence, silence), silence);
  EXPECT_EQ(plugin.Engine().Level(0), 0.0);  // 3 s of silence: the 50 ms release fell below 1e-20 and stopped
}

// The level meters show the largest magnitudes of the main bus read and of the output written,
// whoever measures them: the engine's last pass while compressing (host buffers apart or in
// place, mono too), the cycle in audition and in a mode that converts the channels, where the
// input meters read the converted pair the compressor sees.
TEST_F(CompressorTest, LevelMetersShowWhatWasReadAndWritten) {
  const auto peak = [](const std::vector<float>& row) {
    float top = 0.0f;
    for (float v : row) top = std::fabs(v) > top ? std::fabs(v) : top;
    return top;
  };
  Channels main = Quadrature(0.9, 441.0, 2000), key = Quadrature(0.5, 97.0, 2000);
  for (float& v : main[1]) v *= 0.4f;
  main[0][1999] = -0.95f;  // the loudest left sample in the scalar end of the last block
  for (int32_t scene = 0; scene < 5; ++scene) {
    C fresh;
    Set("threshold", 0.2, &fresh), Set("ratio", 8.0, &fresh);
    if (scene == 1) Set("SideChainInput", 1.0, &fresh), Set("SideChainPlay", 1.0, &fresh);
    if (scene == 2) fresh.SetChannelMode(KChannelMode::kMonoStereo);
    Channels seen = main, out = Quadrature(0.0, 1.0, 2000);
    if (scene == 3) {  // in place: the host hands its input buffers for the output
      out = main;
      for (size_t at = 0; at < 2000; at += 333) {
        float* io[] = {&out[0][at], &out[1][at]};
        const float* in[] = {io[0], io[1], &key[0][at], &key[1][at]};
        fresh.ProcessHostBlock(in, io, static_cast<int32_t>(std::min<size_t>(333, 2000 - at)));
      }
    } else if (scene == 4) {  // mono: one main channel and one side-chain channel
      ASSERT_TRUE(fresh.SetChannelsPerBus(1));
      for (size_t at = 0; at < 2000; at += 256) {
        const float* in[] = {&main[0][at], &key[0][at]};
        float* o[] = {&out[0][at]};
        fresh.ProcessHostBlock(in, o, static_cast<int32_t>(std::min<size_t>(256, 2000 - at)));
      }
      seen[1].assign(2000, 0.0f), out[1].assign(2000, 0.0f);
    } else {
      out = Play(fresh, main, key);
    }
    if (scene == 2) {  // mid and side, as the cycle converts them
      const float *left = main[0].data(), *right = main[1].data();
      KChannelMode::RouteInputs(KChannelMode::kMonoStereo, left, right, seen[0].data(), seen[1].data(), 2000);
      ASSERT_TRUE(left == seen[0].data() && right == seen[1].data());
    }
    for (int32_t c = 0; c < 2; ++c) {
      EXPECT_EQ(fresh.GetMeter(KAudioPlugin::Meter(KAudioPlugin::kInputLeft + c)).Level(), peak(seen[size_t(c)])) << scene << c;
      EXPECT_EQ(fresh.GetMeter(KAudioPlugin::Meter(KAudioPlugin::kOutputLeft + c)).Level(), peak(out[size_t(c)])) << scene << c;
    }
  }
}
