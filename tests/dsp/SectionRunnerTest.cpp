#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <utility>
#include <vector>

#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"

namespace {

using Signal = std::vector<float>;
using Channels = std::vector<Signal>;

// Up to eight different sections, as an equalizer might hold them.
std::vector<KFilterSection> Bank(int32_t count) {
  using K = KFilterSection;
  const double requests[][4] = {{K::kHighPass, 0, 40, 0.7},      {K::kLowShelf, 5, 150, 0.7},
                                {K::kPeak, -9, 900, 3},          {K::kMatchedPeak, 7, 14000, 1},
                                {K::kNotch, 0, 3000, 8},         {K::kHighShelf, -4, 9000, 0.7},
                                {K::kAllPass, 0, 1000, 2},       {K::kOnePoleLowPass, 0, 16000, 1}};
  std::vector<KFilterSection> bank(static_cast<size_t>(count));
  for (size_t j = 0; j < bank.size(); ++j) {
    const double* r = requests[j];
    bank[j].Design(static_cast<int32_t>(r[0]), r[1], r[2], 48000.0, r[3]);
  }
  return bank;
}

Signal Noise(size_t length, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<float> uniform(-1.0f, 1.0f);
  Signal signal(length);
  for (float& v : signal) v = uniform(random);
  return signal;
}

// The sections' difference equation, sample by sample in direct form I.
std::vector<double> Reference(const std::vector<KFilterSection>& sections, const Signal& input) {
  std::vector<double> signal(input.begin(), input.end());
  for (const KFilterSection& s : sections) {
    double x1 = 0.0, x2 = 0.0, y1 = 0.0, y2 = 0.0;
    for (double& v : signal) {
      const double y = s.b0 * v + s.b1 * x1 + s.b2 * x2 + s.minusA1 * y1 + s.minusA2 * y2;
      x2 = std::exchange(x1, v);
      y2 = std::exchange(y1, y);
      v = y;
    }
  }
  return signal;
}

// Runs whole signals through in blocks of the given sizes taken in turn; by default uneven
// ones, so that state crosses block edges.
void Filter(KSectionRunner& runner, const Channels& in, Channels& out, std::vector<int32_t> sizes = {1, 17, 99}) {
  const auto channels = static_cast<int32_t>(in.size()), length = static_cast<int32_t>(in[0].size());
  for (int32_t at = 0, k = 0; at < length; ++k) {
    const int32_t frames = std::min(sizes[static_cast<size_t>(k) % sizes.size()], length - at);
    std::vector<const float*> inputs;
    std::vector<float*> outputs;
    for (size_t c = 0; c < in.size(); ++c) {
      inputs.push_back(in[c].data() + at);
      outputs.push_back(out[c].data() + at);
    }
    runner.Process(inputs.data(), outputs.data(), channels, frames);
    at += frames;
  }
}

}  // namespace

// Channel 0 carries an impulse, the last of three or more is silent, the others noise: each
// must match its own reference, whatever its neighbour in the register does.
TEST(KSectionRunner, MatchesTheDifferenceEquationPerChannel) {
  for (int32_t count : {0, 1, 2, 5, 8}) {
    for (size_t channels : {1, 2, 3, 5}) {
      SCOPED_TRACE(testing::Message() << count << " sections, " << channels << " channels");
      const std::vector<KFilterSection> sections = Bank(count);
      KSectionRunner runner;
      runner.SetSections(sections.data(), count);
      Channels in, out(channels, Signal(2000, 9.0f));
      for (size_t c = 0; c < channels; ++c) in.push_back(Noise(2000, static_cast<unsigned>(c)));
      in[0].assign(2000, 0.0f);
      in[0][0] = 1.0f;
      if (channels >= 3) in.back().assign(2000, 0.0f);
      Filter(runner, in, out);
      for (size_t c = 0; c < channels; ++c) {
        const std::vector<double> expected = Reference(sections, in[c]);
        double worst = 0.0;
        for (size_t i = 0; i < expected.size(); ++i) {
          worst = std::max(worst, std::abs(out[c][i] - expected[i]) / std::max(1.0, std::abs(expected[i])));
        }
        EXPECT_LT(worst, 3e-7) << "channel " << c;
      }
    }
  }
}

TEST(KSectionRunner, InPlaceEqualsOutOfPlaceAndSurplusChannelsAreLeftAlone) {
  const std::vector<KFilterSection> sections = Bank(8);
  KSectionRunner apart, inPlace;
  apart.SetSections(sections.data(), 8);
  inPlace.SetSections(sections.data(), 8);
  Channels in, out(KSectionRunner::kMaxChannels + 1, Signal(1500, 7.0f));
  for (unsigned c = 0; c <= KSectionRunner::kMaxChannels; ++c) in.push_back(Noise(1500, 40 + c));
  Channels shared = in;
  Filter(apart, in, out);
  Filter(inPlace, shared, shared);
  EXPECT_EQ(Channels(out.begin(), out.end() - 1), Channels(shared.begin(), shared.end() - 1));
  EXPECT_EQ(out.back(), Signal(1500, 7.0f));
  EXPECT_EQ(shared.back(), in.back());
  EXPECT_NE(out[KSectionRunner::kMaxChannels - 1], in[KSectionRunner::kMaxChannels - 1]);
}

// A resonant 20 Hz low-pass rings for seconds; by itself its state would take over ten
// thousand blocks to underflow, passing through denormals on the way.
TEST(KSectionRunner, SilenceDecaysToExactZeroWithoutDenormals) {
  KFilterSection section;
  section.Design(KFilterSection::kLowPass, 0.0, 20.0, 48000.0, 10.0);
  KSectionRunner runner;
  runner.SetSections(&section, 1);
  Channels block{Noise(512, 7), Noise(512, 8)};
  Filter(runner, block, block, {512});
  const Channels silence(2, Signal(512, 0.0f));
  int32_t silentFrom = -1, subnormals = 0;
  for (int32_t k = 0; k < 2000; ++k) {
    block = silence;
    Filter(runner, block, block, {512});
    if (block != silence) {
      EXPECT_LT(silentFrom, 0) << "sound came back after block " << silentFrom;
    } else if (silentFrom < 0) {
      silentFrom = k;
    }
    for (const Signal& c : block) {
      for (float v : c) subnormals += std::fpclassify(v) == FP_SUBNORMAL;
    }
  }
  EXPECT_GT(silentFrom, 0) << "the filter should ring";
  EXPECT_LT(silentFrom, 1000);
  EXPECT_EQ(subnormals, 0);
}

// The block that carries a NaN or infinity may be spoilt from there on; the next block must
// sound as from a fresh runner, and the other channel of the pair must not notice. With a
// low-pass first, an infinity arriving last stays in its state as an infinity, not a NaN.
TEST(KSectionRunner, NanOrInfinitySpoilsOnlyItsOwnBlock) {
  std::vector<KFilterSection> sections = Bank(4);
  sections[0].Design(KFilterSection::kLowPass, 0.0, 1000.0, 48000.0, 0.7);
  for (float bad : {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
                    -std::numeric_limits<float>::infinity()}) {
    for (size_t at : {100, 511}) {
      SCOPED_TRACE(testing::Message() << bad << " at " << at);
      KSectionRunner hit, clean, fresh;
      for (KSectionRunner* r : {&hit, &clean, &fresh}) r->SetSections(sections.data(), 4);
      const Channels first{Noise(512, 1), Noise(512, 2)}, second{Noise(512, 3), Noise(512, 4)};
      Channels poisoned = first, hitOut = first, cleanOut = first, freshOut = first;
      poisoned[0][at] = bad;
      Filter(hit, poisoned, hitOut, {512});
      Filter(clean, first, cleanOut, {512});
      EXPECT_TRUE(std::isfinite(hitOut[0][at - 1]));
      EXPECT_FALSE(std::isfinite(hitOut[0][at]));
      EXPECT_EQ(hitOut[1], cleanOut[1]);

      Filter(hit, second, hitOut);
      Filter(clean, second, cleanOut);
      Filter(fresh, second, freshOut);
      EXPECT_EQ(hitOut[0], freshOut[0]);
      EXPECT_EQ(hitOut[1], cleanOut[1]);
    }
  }
}

TEST(KSectionRunner, ResetClearsAndRedesignKeepsState) {
  const std::vector<KFilterSection> both = Bank(2);
  const Channels a{Noise(700, 11)}, b{Noise(700, 12)}, c{Noise(700, 13)};
  Channels out = a, expected = a;
  KSectionRunner runner, fresh, steady;
  for (KSectionRunner* r : {&runner, &fresh, &steady}) r->SetSections(both.data(), 2);
  Filter(runner, a, out);
  runner.Reset();
  Filter(runner, b, out);
  Filter(fresh, b, expected);
  EXPECT_EQ(out, expected) << "Reset";

  // Handing the same designs over again must not disturb the running state.
  Filter(steady, b, expected);
  runner.SetSections(both.data(), 2);
  Filter(runner, c, out);
  Filter(steady, c, expected);
  EXPECT_EQ(out, expected) << "redesign";

  // Dropping the second section and taking it back: the first keeps its history, the second
  // starts from silence, like a fresh one fed with the first one's output.
  runner.SetSections(both.data(), 1);
  Filter(runner, a, out);
  runner.SetSections(both.data(), 2);
  Filter(runner, b, out);
  KSectionRunner first, second;
  first.SetSections(both.data(), 1);
  second.SetSections(both.data() + 1, 1);
  for (const Channels* block : {&b, &c, &a, &b}) Filter(first, *block, expected);
  Filter(second, expected, expected);
  for (size_t i = 0; i < out[0].size(); ++i) ASSERT_NEAR(out[0][i], expected[0][i], 1e-6) << i;
}
