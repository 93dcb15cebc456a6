#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <random>
#include <vector>

#include "dsp/KDynamicsProcessor.h"
#include "tests/core/AllocationCounter.h"

namespace {

constexpr double kRate = 48000.0;

// Channel buffers with the pointer arrays Process takes; filled from f(channel, sample).
struct Bus {
  Bus(int32_t c, int32_t n, const std::function<double(int32_t, int32_t)>& f = nullptr)
      : channels(c), frames(n), data(static_cast<size_t>(c), std::vector<float>(static_cast<size_t>(n))) {
    for (auto& row : data) {
      for (int32_t i = 0; f && i < n; ++i) row[static_cast<size_t>(i)] = static_cast<float>(f(static_cast<int32_t>(in.size()), i));
      in.push_back(row.data());
      out.push_back(row.data());
    }
  }
  Bus(Bus&&) = default;
  Bus(const Bus&) = delete;  // the pointer arrays would point into the original
  float At(int32_t c, int32_t i) const { return data[static_cast<size_t>(c)][static_cast<size_t>(i)]; }
  int32_t channels, frames;
  std::vector<std::vector<float>> data;
  std::vector<const float*> in;
  std::vector<float*> out;
};

Bus Noise(int32_t channels, int32_t frames, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<double> any(-1.0, 1.0);
  return Bus(channels, frames, [&](int32_t, int32_t) { return any(random); });
}

KDynamicsSettings Settings(double attack = 0.01, double release = 0.05, double rms = 0.001) {
  return {.attack = attack, .release = release, .rmsLength = rms, .sampleRate = kRate};
}
// The detector follows at once: e = |g_in·x| on one channel.
const KDynamicsSettings kInstant = Settings(0.0, 0.0, 0.0);

struct Engine : KDynamicsProcessor {
  explicit Engine(const KDynamicsSettings& s, int32_t channels = 2, int32_t frames = 4800) {
    Prepare(channels, frames);
    Update(s);
  }
  Bus Run(const Bus& x, const Bus* key = nullptr) {
    Bus y(x.channels, x.frames);
    Process(x.frames, x.in.data(), y.out.data(), key ? key->in.data() : nullptr, x.channels);
    return y;
  }
};

TEST(DynamicsProcessor, UpdateDerivesGainsAndGuardedCoefficients) {
  KDynamicsSettings s = Settings(0.01, 0.0, 1e-16);
  s.gainDb = 6.0;
  s.outputGainDb = -20.0;
  Engine engine(s);
  EXPECT_NEAR(engine.InputGain(), 1.9952623149688795, 1e-15);
  EXPECT_NEAR(engine.Transfer().TotalGain(), 0.19952623149688795, 1e-15);
  EXPECT_NEAR(engine.Attack(), std::exp(-1.0 / 480.0), 1e-15);
  EXPECT_EQ(engine.Release(), 0.0);                 // no time: instant
  EXPECT_EQ(engine.MeanSquare().coefficient, 0.0);  // fs·t under 1e-10
  EXPECT_EQ(engine.MeanSquare().complement, 1.0);
  EXPECT_EQ(engine.ShortAverage().coefficient, std::exp(-10.0 / kRate));
  EXPECT_EQ(engine.LongAverage().complement, 1.0 - std::exp(-0.4 / kRate));
  s.sampleRate = 0.0;
  engine.Update(s);
  EXPECT_EQ(engine.Attack(), 0.0);
  EXPECT_EQ(engine.LongAverage().coefficient, 0.0);
}

TEST(DynamicsProcessor, RatioOneIsAPlainGainAndLeavesTheDetectorAtZero) {
  Engine engine(kInstant);
  const Bus loud = Noise(2, 256, 1);
  engine.Run(loud);
  KDynamicsSettings s = kInstant;
  s.ratio = 1.0;
  s.gainDb = 3.0;
  s.outputGainDb = -1.7;
  engine.Update(s);
  const Bus copied = engine.Run(loud);
  Bus inPlace = Noise(2, 256, 1);
  engine.Process(256, inPlace.in.data(), inPlace.out.data(), nullptr, 2);
  engine.Decay(100);
  const auto factor = static_cast<float>(engine.InputGain() * engine.OutputGain());
  for (int32_t i = 0; i < 256; ++i) {
    ASSERT_EQ(copied.At(1, i), loud.At(1, i) * factor);
    ASSERT_EQ(inPlace.At(0, i), loud.At(0, i) * factor);
  }
  EXPECT_TRUE(engine.IsIdle());
  EXPECT_EQ(engine.Power(0), 0.0);
  EXPECT_EQ(engine.Level(0), 0.0);
}

TEST(DynamicsProcessor, OutputIsTheCurveGainTimesTheRawInput) {
  KDynamicsSettings s = kInstant;
  s.gainDb = 4.0;
  s.kneeMode = KTransferCurve::kSoftKnee;
  Engine mono(s, 1);
  const Bus x = Noise(1, 512, 2), y = mono.Run(x);
  for (int32_t i = 0; i < 512; ++i) {
    const double e = std::abs(mono.InputGain() * x.At(0, i));
    ASSERT_EQ(mono.EnvelopeBuffer(0)[i], static_cast<float>(e));
    ASSERT_EQ(y.At(0, i), static_cast<float>(mono.Gain(e) * x.At(0, i)));
  }
  Engine three(kInstant, 3);  // the mean over channels divides by N in single precision
  three.Run(Bus(3, 8, [](int32_t, int32_t) { return 0.5; }));
  EXPECT_EQ(three.Level(0), std::sqrt(static_cast<double>(1.0f / 3.0f) * 0.75));
  Engine six(s, 6);  // one gain for every channel, through the four-channel unroll and its rest
  const Bus many = Noise(6, 512, 3), out = six.Run(many);
  for (int32_t c = 0; c < 6; ++c) {
    for (int32_t i = 0; i < 512; ++i) ASSERT_NEAR(out.At(c, i), six.GainBuffer(0)[i] * many.At(c, i), 1e-6) << c;
  }
}

TEST(DynamicsProcessor, EnvelopeFollowsAttackAndReleaseTimes) {
  Engine engine(Settings(0.01, 0.05, 0.0001), 1, 2400);
  engine.Run(Bus(1, 2400, [](int32_t, int32_t) { return 1.0; }));
  EXPECT_NEAR(engine.EnvelopeBuffer(0)[479], 1.0 - std::exp(-1.0), 0.01);  // 10 ms
  const double held = engine.Level(0);
  engine.Run(Bus(1, 2400));
  EXPECT_NEAR(engine.EnvelopeBuffer(0)[2399] / held, std::exp(-1.0), 0.01);  // 50 ms
}

TEST(DynamicsProcessor, LinkedDetectorHearsTheMeanOfAllChannels) {
  const Bus oneSided(2, 4800, [](int32_t c, int32_t) { return c == 0 ? 0.8 : 0.0; });
  KDynamicsSettings s = Settings(0.001);
  Engine linked(s);
  s.linkChannels = false;
  Engine unlinked(s);
  const Bus a = linked.Run(oneSided), b = unlinked.Run(oneSided);
  const double mean = 0.8 * std::sqrt(0.5);
  EXPECT_NEAR(linked.Level(0), mean, 1e-6);
  EXPECT_NEAR(unlinked.Level(0), 0.8, 1e-6);
  EXPECT_EQ(unlinked.GainBuffer(1)[4799], 1.0f);  // the silent channel keeps unity
  EXPECT_NEAR(a.At(0, 4799), linked.Gain(mean) * 0.8, 1e-6);
  EXPECT_NEAR(b.At(0, 4799), unlinked.Gain(0.8) * 0.8, 1e-6);
  EXPECT_GT(a.At(0, 4799), b.At(0, 4799) + 0.05);
}

TEST(DynamicsProcessor, SideChainDrivesTheGainOfTheMainInput) {
  KDynamicsSettings s = kInstant;
  s.sideChain = true;
  Engine engine(s, 2, 64);
  const Bus main(2, 64, [](int32_t, int32_t) { return 0.5; });
  const Bus key(2, 64, [](int32_t c, int32_t) { return c == 0 ? 1.0 : 0.0; }), silent(2, 64);
  EXPECT_EQ(engine.Run(main, &key).At(1, 63), static_cast<float>(engine.Gain(std::sqrt(0.5)) * 0.5));
  EXPECT_EQ(engine.Run(main, &silent).At(0, 63), 0.5f);
  EXPECT_EQ(engine.Run(main).At(0, 63), static_cast<float>(engine.Gain(0.5) * 0.5));  // none given
  s.sideChain = false;
  engine.Update(s);
  EXPECT_EQ(engine.Run(main, &silent).At(0, 63), static_cast<float>(engine.Gain(0.5) * 0.5));  // given, not asked for
}

TEST(DynamicsProcessor, BandLimitsSwitchOnOnlyInsideTheirRange) {
  const double top = 0.499 * 20000.0, beyond = std::nextafter(top, 1e9);
  struct Case {
    double low, high, rate;
    bool section, highPass, lowPass;
  } const cases[] = {{20.0, 20000.0, 44100.0, true, false, false},   {20.0 + 5e-11, 22000.0, 44100.0, true, false, false},
                     {20.001, 19999.9, 44100.0, true, true, true},   {100.0, 19999.9999999999, 44100.0, true, true, false},
                     {top, top, 20000.0, true, true, true},          {beyond, beyond, 20000.0, true, false, false},
                     {100.0, 1000.0, 44100.0, false, false, false}};
  for (const Case& c : cases) {
    Engine engine({.sideChainFilters = c.section, .sideChainMinFrequency = c.low, .sideChainMaxFrequency = c.high, .sampleRate = c.rate});
    EXPECT_EQ(engine.HighPassActive(), c.highPass) << c.low << " at " << c.rate;
    EXPECT_EQ(engine.LowPassActive(), c.lowPass) << c.high << " at " << c.rate;
  }
  // The designs see frequency and rate in single precision.
  Engine engine({.sideChainFilters = true, .sideChainMinFrequency = 1000.0001, .sideChainMaxFrequency = 1000.0001, .sampleRate = 44100.3});
  KFilterSection single, full;
  single.Design(KFilterSection::kHighPass, 0.0, static_cast<float>(1000.0001), static_cast<float>(44100.3), 1.0);
  full.Design(KFilterSection::kHighPass, 0.0, 1000.0001, 44100.3, 1.0);
  EXPECT_EQ(engine.HighPass().b0, single.b0);
  EXPECT_NE(engine.HighPass().b0, full.b0);
  single.Design(KFilterSection::kLowPass, 0.0, static_cast<float>(1000.0001), static_cast<float>(44100.3), 1.0);
  EXPECT_EQ(engine.LowPass().minusA1, single.minusA1);
}

TEST(DynamicsProcessor, BandLimitsFilterTheDetectorNotTheOutput) {
  const Bus hum(1, 4800, [](int32_t, int32_t i) { return std::sin(6.283185307179586 * 50.0 * i / kRate); });
  KDynamicsSettings s = Settings();
  s.sideChainMinFrequency = 5000.0;
  for (bool filtered : {false, true}) {
    s.sideChainFilters = filtered;
    Engine engine(s, 1);
    const Bus out = engine.Run(hum);
    float loudest = 0.0f;
    for (int32_t i = 2400; i < 4800; ++i) loudest = std::fmax(loudest, engine.EnvelopeBuffer(0)[i]);
    EXPECT_EQ(loudest < 0.01f, filtered);
    EXPECT_TRUE(!filtered || out.data == hum.data);  // under the threshold: unity gain
  }
}

// A block longer than the buffers runs in pieces and gives what one long piece gives.
TEST(DynamicsProcessor, LongBlocksRunInPiecesSeamlessly) {
  KDynamicsSettings s = Settings(0.001, 0.01, 0.0005);
  s.linkChannels = false;
  s.sideChainFilters = true;
  s.sideChainMaxFrequency = 3000.0;
  const Bus x = Noise(3, 1000, 4);
  Engine whole(s, 3, 1000), pieces(s, 3, 64);
  EXPECT_EQ(whole.Run(x).data, pieces.Run(x).data);
}

TEST(DynamicsProcessor, SilenceDecaysToExactZeroWithoutDenormals) {
  Engine decayed(Settings()), processed(Settings());
  const Bus loud = Noise(2, 480, 5);
  decayed.Run(loud);
  processed.Run(loud);
  decayed.Decay(777);
  processed.Run(Bus(2, 777));
  EXPECT_EQ(decayed.Power(0), processed.Power(0));  // Decay is silent input without the audio
  EXPECT_EQ(decayed.Level(0), processed.Level(0));
  for (bool useDecay : {true, false}) {
    Engine& engine = useDecay ? decayed : processed;
    int32_t blocks = 0;
    for (; engine.Level(0) > 0.0 && blocks < 2000; ++blocks) {
      const double before = engine.Level(0);
      if (useDecay) {
        engine.Decay(256);
      } else {
        engine.Run(Bus(2, 256));
      }
      ASSERT_NE(std::fpclassify(engine.Level(0)), FP_SUBNORMAL);
      ASSERT_NE(std::fpclassify(engine.Power(0)), FP_SUBNORMAL);
      ASSERT_TRUE(before >= 1e-20 || engine.Level(0) == 0.0) << before;
    }
    EXPECT_LT(blocks, 2000);
    EXPECT_EQ(engine.Power(0), 0.0);
  }
}

TEST(DynamicsProcessor, NaNOrInfinitySpoilsOnlyItsOwnBlockAndChannel) {
  for (float poison : {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity()}) {
    for (bool link : {true, false}) {
      KDynamicsSettings s = Settings();
      s.linkChannels = link;
      Engine hit(s, 2, 64), clean(s, 2, 64), fresh(s, 2, 64);
      const Bus good = Noise(2, 64, 6);
      Bus bad = Noise(2, 64, 6);
      bad.data[0][10] = poison;
      hit.Run(bad);
      clean.Run(good);
      EXPECT_EQ(hit.Level(0), 0.0);
      EXPECT_TRUE(link || hit.Level(1) == clean.Level(1));  // the other channel carries on
      const Bus next = Noise(2, 64, 7), after = hit.Run(next), expected = fresh.Run(next);
      EXPECT_EQ(after.data[0], expected.data[0]);  // restarted as if new
    }
  }
}

TEST(DynamicsProcessor, UpdateProcessDecayAndResetNeverAllocate) {
  const KTransferShape::Point points[] = {{0.0, 0.0}, {0.3, 0.4}, {1.0, 0.6}};
  KTransferShape shape;
  shape.SetPoints(points, 3);
  Engine engine(Settings(), 6, 256);
  const Bus x = Noise(6, 600, 8);
  Bus y(6, 600);
  KAllocationCounter counter;
  for (int32_t variant = 0; variant < 5; ++variant) {  // every knee, link, filters, custom, idle
    engine.Update({.ratio = variant == 4 ? 1.0 : 4.0, .kneeMode = variant % 3, .linkChannels = variant % 2 == 0,
                   .customShape = variant == 3, .shape = &shape, .sideChain = true, .sideChainFilters = variant >= 2,
                   .sideChainMinFrequency = 200.0, .sampleRate = kRate});
    engine.Process(600, x.in.data(), y.out.data(), x.in.data(), 6);
    engine.Decay(64);
    engine.Reset();
  }
  EXPECT_EQ(counter.Count(), 0);
}

}  // namespace
