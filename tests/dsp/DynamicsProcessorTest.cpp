#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>
#include <tuple>
#include <vector>

#include "dsp/KDynamicsProcessor.h"
#include "tests/core/AllocationCounter.h"

namespace {

using Channels = std::vector<std::vector<float>>;
constexpr double kRate = 48000.0;

Channels Constant(size_t channels, size_t frames, float v) { return Channels(channels, std::vector<float>(frames, v)); }
Channels Noise(size_t channels, size_t frames, unsigned seed) {
  std::mt19937 random(seed);
  Channels x = Constant(channels, frames, 0.0f);
  for (auto& row : x) std::generate(row.begin(), row.end(), [&] { return std::uniform_real_distribution<float>(-1.0f, 1.0f)(random); });
  return x;
}

struct Engine : KDynamicsProcessor {
  explicit Engine(const KDynamicsSettings& s, int32_t channels = 2, int32_t frames = 4800) { Prepare(channels, frames); Update(s); }
  // Processes x into new buffers, offering the detector `key` when given; Process must not allocate.
  Channels Run(const Channels& x, const Channels* key = nullptr) {
    Channels y = Constant(x.size(), x[0].size(), 0.0f);
    std::vector<const float*> in, keys;
    std::vector<float*> out;
    for (size_t c = 0; c < x.size(); ++c) in.push_back(x[c].data()), out.push_back(y[c].data()), keys.push_back((key ? *key : x)[c].data());
    KAllocationCounter counter;
    Process(int32_t(x[0].size()), in.data(), out.data(), key ? keys.data() : nullptr, int32_t(x.size()));
    EXPECT_EQ(counter.Count(), 0) << "Process allocated";
    return y;
  }
};

}  // namespace

// Ratio 1 is a plain gain float(g_in·g_out) with the detector cleared, unless a custom shape (even empty) is on.
TEST(DynamicsProcessor, RatioOneIsAPlainGainAndLeavesTheDetectorAtZero) {
  Engine engine({.attack = 0.0, .release = 0.0, .rmsLength = 0.0, .sampleRate = kRate});
  const Channels loud = Noise(2, 256, 1);
  for (bool custom : {true, false}) {
    engine.Run(loud);
    engine.Update({.gainDb = 3.0, .outputGainDb = -1.7, .ratio = 1.0, .customShape = custom, .sampleRate = kRate});
    const Channels y = engine.Run(loud);
    const auto factor = float(engine.InputGain() * engine.OutputGain());
    EXPECT_NEAR(factor, std::pow(10.0, 1.3 / 20.0), 1e-6);
    for (size_t i = 0; !custom && i < 256; ++i) ASSERT_TRUE(y[0][i] == loud[0][i] * factor && y[1][i] == loud[1][i] * factor) << i;
    EXPECT_EQ(engine.IsIdle() && engine.Power(0) == 0.0 && engine.Level(0) == 0.0, !custom);
  }
}

// Instantly e = √(float(1/N)·Σ(g_in·k)²) linked, |g_in·k| unlinked, k the key if asked for and given; y = Gain(e)·x.
TEST(DynamicsProcessor, OutputIsTheCurveGainOfTheDetectedLevel) {
  const Channels x = Noise(6, 256, 2), key = Noise(6, 256, 3);
  for (int32_t variant = 0; variant < 3; ++variant) {  // linked with a key; none given; given, not asked for
    const bool link = variant == 0;
    Engine engine({.gainDb = 4.0, .attack = 0.0, .release = 0.0, .rmsLength = 0.0, .kneeMode = KTransferCurve::kSoftKnee,
                   .linkChannels = link, .sideChain = variant < 2, .sampleRate = kRate}, 6);
    const double g = engine.InputGain();
    const Channels y = engine.Run(x, variant == 1 ? nullptr : &key), &heard = link ? key : x;
    for (size_t j = 0; j < 6 * 256; ++j) {
      const size_t c = j / 256, i = j % 256;
      double e = 0.0;
      for (size_t k = link ? 0 : c; k < (link ? 6 : c + 1); ++k) e += (g * heard[k][i]) * (g * heard[k][i]);
      e = std::sqrt((link ? double(1.0f / 6.0f) : 1.0) * e);
      ASSERT_EQ(engine.EnvelopeBuffer(link ? 0 : int32_t(c))[i], float(e)) << variant << " " << c << " " << i;
      ASSERT_EQ(y[c][i], float(engine.Gain(e) * x[c][i])) << variant << " " << c << " " << i;
    }
  }
}

// Limits at 20 Hz, 20000 Hz or above 0.499·fs stay off; a 5 kHz high-pass hides a hum from the detector only.
TEST(DynamicsProcessor, BandLimitsSwitchOnInsideTheirRangeAndFilterOnlyTheDetector) {
  const double top = 0.499 * 20000.0, beyond = std::nextafter(top, 1e9);
  const struct { double low, high, rate; bool section, highPass, lowPass; } cases[] = {
      {20.0, 20000.0, 44100.0, true, false, false}, {20.0 + 5e-11, 22000.0, 44100.0, true, false, false},
      {20.001, 19999.9, 44100.0, true, true, true}, {100.0, 19999.9999999999, 44100.0, true, true, false},
      {top, top, 20000.0, true, true, true},        {beyond, beyond, 20000.0, true, false, false},
      {100.0, 1000.0, 44100.0, false, false, false}};
  for (const auto& c : cases) {
    Engine engine({.sideChainFilters = c.section, .sideChainMinFrequency = c.low, .sideChainMaxFrequency = c.high, .sampleRate = c.rate});
    EXPECT_TRUE(engine.HighPassActive() == c.highPass && engine.LowPassActive() == c.lowPass) << c.low << " " << c.high;
  }
  Channels hum = Constant(2, 4800, 0.0f);
  for (size_t i = 0; i < 4800; ++i) hum[0][i] = hum[1][i] = float(std::sin(6.283185307179586 * 50.0 * double(i) / kRate));
  for (bool filtered : {false, true}) {
    Engine engine({.sideChainFilters = filtered, .sideChainMinFrequency = 5000.0, .sampleRate = kRate}, 2, 64);
    EXPECT_EQ(engine.Run(hum) == hum, filtered);
    EXPECT_EQ(engine.Level(0) < 0.01, filtered);
  }
}

// 1 − 1/e up in the attack time, 1/e down in the release time; then, processed or decayed alike, exactly zero.
TEST(DynamicsProcessor, EnvelopeAttacksReleasesAndDecaysToExactZero) {
  const KDynamicsSettings s{.attack = 0.01, .release = 0.05, .rmsLength = 0.0001, .sampleRate = kRate};
  Engine processed(s, 1, 2400), decayed(s, 1, 2400);
  for (Engine* engine : {&processed, &decayed}) engine->Run(Constant(1, 2400, 1.0f));
  EXPECT_NEAR(processed.EnvelopeBuffer(0)[479], 1.0 - std::exp(-1.0), 0.01);  // 10 ms
  const double held = processed.Level(0);
  processed.Run(Constant(1, 2400, 0.0f));
  decayed.Decay(2400);
  EXPECT_NEAR(processed.EnvelopeBuffer(0)[2399] / held, std::exp(-1.0), 0.01);  // 50 ms
  for (int32_t blocks = 0; decayed.Level(0) > 0.0; ++blocks) {
    ASSERT_TRUE(decayed.Power(0) == processed.Power(0) && decayed.Level(0) == processed.Level(0) && blocks < 2000) << blocks;
    const double before = decayed.Level(0);
    decayed.Decay(256);
    processed.Run(Constant(1, 256, 0.0f));
    ASSERT_TRUE(std::fpclassify(decayed.Level(0)) != FP_SUBNORMAL && (before >= 1e-20 || decayed.Level(0) == 0.0)) << before;
  }
  EXPECT_TRUE(decayed.Power(0) == 0.0 && processed.Power(0) == 0.0 && processed.Level(0) == 0.0);
}

// A detector that a NaN or infinity reached restarts as if new; unlinked, the other channel carries on.
TEST(DynamicsProcessor, NaNOrInfinitySpoilsOnlyItsOwnBlockAndChannel) {
  for (int32_t variant = 0; variant < 4; ++variant) {
    const bool link = variant < 2;
    const KDynamicsSettings s{.linkChannels = link, .sampleRate = kRate};
    Engine hit(s, 2, 64), clean(s, 2, 64), fresh(s, 2, 64);
    Channels bad = Noise(2, 64, 6);
    bad[0][10] = variant % 2 ? INFINITY : NAN;
    hit.Run(bad);
    clean.Run(Noise(2, 64, 6));
    EXPECT_TRUE(hit.Level(0) == 0.0 && (link || hit.Level(1) == clean.Level(1))) << variant;
    EXPECT_EQ(hit.Run(Noise(2, 64, 7))[0], fresh.Run(Noise(2, 64, 7))[0]) << variant;
  }
}

// The lowest gain is the least of every gain row (as float), linked or not; idle it is G.
TEST(DynamicsProcessor, LowestGainIsTheLeastOfTheGainRows) {
  for (bool link : {true, false}) {
    KDynamicsSettings s;
    s.linkChannels = link, s.threshold = 0.3, s.ratio = 5.0, s.gainDb = 6.0, s.sampleRate = kRate;
    Engine engine(s);
    Channels x = Noise(2, 999, 4);  // odd: every pass has a scalar end
    for (size_t i = 0; i < 999; ++i) x[1][i] *= i < 500 ? 0.1f : 1.0f;
    engine.Run(x);
    float lowest = float(engine.Transfer().TotalGain());
    for (int32_t row = 0; row < (link ? 1 : 2); ++row)
      for (int32_t i = 0; i < 999; ++i) lowest = std::min(lowest, engine.GainBuffer(row)[i]);
    EXPECT_EQ(engine.LowestGain(), lowest) << link;
    EXPECT_LT(engine.LowestGain(), 0.9f * float(engine.Transfer().TotalGain()));
  }
  KDynamicsSettings idle;
  idle.ratio = 1.0, idle.outputGainDb = -6.0;
  Engine plain(idle);
  plain.Run(Noise(2, 100, 1));
  EXPECT_EQ(plain.LowestGain(), float(plain.Transfer().TotalGain()));
}

// Measuring, every path meters channels 0 and 1 as it writes them: the largest magnitude of the
// input and of the output over the whole call (all pieces, a NaN left out), in place or not; the
// output is the same as without measuring. A linked stereo pair takes a path of its own.
TEST(DynamicsProcessor, MeasuredPeaksAreTheLargestMagnitudesOfEachChannelsInputAndOutput) {
  const auto peak = [](const std::vector<float>& row) {
    float top = 0.0f;
    for (float v : row) top = std::fabs(v) > top ? std::fabs(v) : top;
    return top;
  };
  for (const int32_t channels : {2, 3}) {
    const auto rowCount = static_cast<size_t>(channels);
    for (int32_t variant = 0; variant < 6; ++variant) {
      KDynamicsSettings s;
      s.linkChannels = variant % 2 == 0, s.threshold = 0.2, s.ratio = variant < 4 ? 6.0 : 1.0, s.sampleRate = kRate;
      s.attack = 1.0;  // slow, so that the loud samples below come out loudest too
      Engine measuring(s, channels, 256), plain(s, channels, 256);  // 999 frames: three whole pieces and an odd end
      measuring.MeasurePeaks(true);
      Channels x = Noise(channels, 999, 8 + variant);
      x[0][993] = -8.0f;                         // the loudest sample in the last four-sample step
      x[1][998] = variant < 2 ? 1.5f : -1.25f;  // and at the scalar end
      if (variant == 2) x[0][17] = NAN;
      const Channels y = measuring.Run(x), expected = plain.Run(x);
      for (size_t c = 0; c < rowCount; ++c)
        for (size_t i = 0; i < 999; ++i)
          ASSERT_TRUE(y[c][i] == expected[c][i] || (std::isnan(y[c][i]) && std::isnan(expected[c][i]))) << variant;
      for (int32_t c = 0; c < KDynamicsProcessor::kMeasuredChannels; ++c) {
        EXPECT_EQ(measuring.InputPeak(c), peak(x[size_t(c)])) << channels << " " << variant << " " << c;
        EXPECT_EQ(measuring.OutputPeak(c), peak(y[size_t(c)])) << channels << " " << variant << " " << c;
      }
      EXPECT_EQ(measuring.InputPeak(1), variant < 2 ? 1.5f : 1.25f);
      EXPECT_EQ(measuring.OutputPeak(0), std::fabs(y[0][993]));
      if (variant % 2 == 0) {  // in place: each input is read before its sample is overwritten
        Channels z = Noise(channels, 999, 20);
        const float inputPeaks[2] = {peak(z[0]), peak(z[1])};
        std::vector<float*> rows;
        for (std::vector<float>& row : z) rows.push_back(row.data());
        measuring.Process(999, rows.data(), rows.data(), nullptr, channels);
        for (int32_t c = 0; c < KDynamicsProcessor::kMeasuredChannels; ++c) {
          EXPECT_EQ(measuring.InputPeak(c), inputPeaks[c]) << channels << " " << variant << " " << c;
          EXPECT_EQ(measuring.OutputPeak(c), peak(z[size_t(c)])) << channels << " " << variant << " " << c;
        }
      }
    }
  }
}

// After full scale, ReleaseSamples of silence bring the envelope to the law's rest, not much
// sooner than that; idle needs none.
TEST(DynamicsProcessor, ReleaseSamplesBringTheDetectorToRest) {
  for (auto [release, rms, gainDb] : {std::tuple{0.05, 0.001, 0.0}, {0.5, 0.02, 12.0}, {0.001, 0.3, -6.0}}) {
    KDynamicsSettings s;
    s.release = release, s.rmsLength = rms, s.gainDb = gainDb, s.threshold = 0.4, s.ratio = 3.0;
    s.kneeMode = KTransferCurve::kSoftKnee, s.sampleRate = kRate;
    Engine engine(s, 2, 4800);
    const uint32_t tail = engine.ReleaseSamples();
    engine.Run(Constant(2, 48000, 1.0f));
    double level = engine.Level(0);
    uint32_t rested = 0;
    for (; level > engine.Transfer().Rest() && rested < 10 * tail + 48000; rested += 48) {
      engine.Run(Constant(2, 48, 0.0f));
      level = engine.Level(0);
    }
    EXPECT_LE(rested, tail + 48) << release;
    EXPECT_GT(rested * 3, tail) << release;
  }
  KDynamicsSettings idle;
  idle.ratio = 1.0;
  EXPECT_EQ(Engine(idle).ReleaseSamples(), 0u);
}
