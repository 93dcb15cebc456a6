#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>
#include <tuple>
#include <vector>

#include "dsp/KSectionRunner.h"

namespace {

using Channels = std::vector<std::vector<float>>;

// Up to eight sections of different types, a low-pass first, as an equalizer might hold them.
std::vector<KFilterSection> Bank(size_t count) {
  std::vector<KFilterSection> bank(count);
  for (size_t j = 0; j < count; ++j) bank[j].Design(int32_t(4 + 7 * j) % 16, j % 2 ? 6.0 : -9.0, 40.0 * std::pow(2.3, j), 48e3, 0.7 + j);
  return bank;
}

Channels Noise(size_t channels, size_t frames, unsigned seed) {
  std::mt19937 random(seed);
  Channels x(channels, std::vector<float>(frames));
  for (auto& row : x) std::generate(row.begin(), row.end(), [&] { return std::uniform_real_distribution<float>(-1.0f, 1.0f)(random); });
  return x;
}

// Whole signals, in blocks of `block` frames or else of 1, 42 and 83 in turn across uneven edges.
void Filter(KSectionRunner& runner, const Channels& in, Channels& out, size_t block = 0) {
  std::vector<const float*> x(in.size());
  std::vector<float*> y(in.size());
  for (size_t at = 0, k = 0, n; at < in[0].size(); at += n, ++k) {
    n = std::min(block ? block : k % 3 * 41 + 1, in[0].size() - at);
    for (size_t c = 0; c < in.size(); ++c) x[c] = in[c].data() + at, y[c] = out[c].data() + at;
    runner.Process(x.data(), y.data(), int32_t(in.size()), int32_t(n));
  }
}

// The sections' difference equation, sample by sample in direct form I.
std::vector<double> Reference(const std::vector<KFilterSection>& sections, std::vector<double> v) {
  for (const KFilterSection& s : sections) {
    for (double x1 = 0.0, x2 = 0.0, y1 = 0.0, y2 = 0.0; double& x : v) {
      const double y = s.b0 * x + s.b1 * x1 + s.b2 * x2 + s.minusA1 * y1 + s.minusA2 * y2;
      x2 = x1, x1 = x, y2 = y1, y1 = y, x = y;
    }
  }
  return v;
}

}  // namespace

// An impulse, noise and (from three channels) silence, each matching its reference in place or not; channel 17 is left alone.
TEST(KSectionRunner, MatchesTheDifferenceEquationPerChannel) {
  for (size_t count : {0, 1, 2, 5, 8}) {
    for (size_t channels : {1, 2, 3, 5, 17}) {
      const std::vector<KFilterSection> sections = Bank(count);
      Channels in = Noise(channels, 2000, unsigned(count)), out(channels, std::vector<float>(2000, 9.0f));
      in[0].assign(2000, 0.0f);
      in[0][0] = 1.0f;
      if (channels >= 3) in.back().assign(2000, 0.0f);
      Channels shared = in;
      KSectionRunner apart, inPlace;
      for (KSectionRunner* runner : {&apart, &inPlace}) runner->SetSections(sections.data(), int32_t(count));
      Filter(apart, in, out);
      Filter(inPlace, shared, shared, 1000);
      for (size_t c = 0; c < std::min(channels, size_t{16}); ++c) {
        const std::vector<double> expected = Reference(sections, {in[c].begin(), in[c].end()});
        for (size_t i = 0; i < 2000; ++i) ASSERT_NEAR(out[c][i], expected[i], 3e-7 * std::max(1.0, std::abs(expected[i]))) << c << " " << i;
        EXPECT_EQ(shared[c], out[c]) << count << " sections, channel " << c;
      }
      EXPECT_TRUE(channels <= 16 || (out.back() == std::vector<float>(2000, 9.0f) && shared.back() == in.back()));
    }
  }
}

// A resonant 20 Hz low-pass whose state would otherwise linger in denormals for over ten thousand blocks.
TEST(KSectionRunner, SilenceDecaysToExactZeroWithoutDenormals) {
  KFilterSection ringing;
  ringing.Design(KFilterSection::kLowPass, 0.0, 20.0, 48000.0, 10.0);
  KSectionRunner runner;
  runner.SetSections(&ringing, 1);
  Channels block = Noise(2, 512, 7);
  const Channels silence(2, std::vector<float>(512));
  int32_t blocks = 1;
  for (Filter(runner, block, block); block != silence && blocks < 1000; ++blocks) {
    Filter(runner, block = silence, block);
    for (const auto& c : block) ASSERT_TRUE(std::none_of(c.begin(), c.end(), [](float v) { return std::fpclassify(v) == FP_SUBNORMAL; }));
  }
  EXPECT_TRUE(blocks > 2 && blocks < 1000) << blocks;
}

// The next block sounds as after Reset; the pair's other channel, redesigned alike meanwhile, never notices.
TEST(KSectionRunner, NanOrInfinitySpoilsOnlyItsOwnBlock) {
  const std::vector<KFilterSection> sections = Bank(4);
  const Channels first = Noise(2, 512, 1), second = Noise(2, 512, 3);
  for (float bad : {NAN, INFINITY, -INFINITY}) {
    for (size_t at : {100, 511}) {
      SCOPED_TRACE(testing::Message() << bad << " at " << at);
      KSectionRunner hit, clean;
      for (KSectionRunner* r : {&hit, &clean}) r->SetSections(sections.data(), 4);
      Channels poisoned = first, out = first, expected = first;
      poisoned[0][at] = bad;
      Filter(hit, poisoned, out, 512);
      Filter(clean, first, expected, 512);
      EXPECT_TRUE(std::isfinite(out[0][at - 1]) && !std::isfinite(out[0][at]) && out[1] == expected[1]);
      clean.SetSections(sections.data(), 4);
      Filter(hit, second, out);
      Filter(clean, second, expected);
      EXPECT_EQ(out[1], expected[1]);
      clean.Reset();
      Filter(clean, second, expected);
      EXPECT_EQ(out[0], expected[0]);
    }
  }
}

// Every coefficient and the gain step in a straight line, the step before the sample, reaching
// the target at the glide's last sample; a second aim at the same targets changes nothing; across uneven blocks.
TEST(KSectionRunner, GlidesEveryCoefficientAndTheGainInAStraightLine) {
  const std::vector<KFilterSection> from = Bank(3), to = Bank(4);
  KSectionRunner::Row start[3], target[3];
  for (size_t j = 0; j < 3; ++j) {
    const KFilterSection& a = from[j];
    const KFilterSection& b = to[j + 1];
    const double rowA[5] = {a.b0, a.minusA1, a.b1, a.minusA2, a.b2}, rowB[5] = {b.b0, b.minusA1, b.b1, b.minusA2, b.b2};
    std::copy_n(rowA, 5, start[j]);
    std::copy_n(rowB, 5, target[j]);
  }
  constexpr int32_t kGlide = 300;
  KSectionRunner runner;
  runner.Aim(start, 3, 0.5, kGlide, true);
  runner.Aim(target, 3, 2.0, kGlide, false);
  runner.Aim(target, 3, 2.0, 7, false);  // the same targets: the glide goes on over kGlide
  const Channels in = Noise(2, 1000, 5);
  Channels out(2, std::vector<float>(1000));
  Filter(runner, in, out);
  EXPECT_EQ(runner.GlideLeft(), 0);
  for (size_t c = 0; c < 2; ++c) {
    double k[3][5], step[3][5], s1[3] = {}, s2[3] = {}, gain = 0.5;
    for (size_t j = 0; j < 3; ++j)
      for (size_t m = 0; m < 5; ++m) k[j][m] = start[j][m], step[j][m] = (target[j][m] - start[j][m]) / kGlide;
    for (size_t i = 0; i < 1000; ++i) {
      const bool gliding = i + 1 < size_t{kGlide}, last = i + 1 == size_t{kGlide};
      double x = in[c][i];
      for (size_t j = 0; j < 3; ++j) {
        for (size_t m = 0; m < 5; ++m) k[j][m] = gliding || last ? k[j][m] + step[j][m] : target[j][m];
        const double y = k[j][0] * x + s1[j];
        s1[j] = k[j][2] * x + s2[j] + k[j][1] * y;
        s2[j] = k[j][4] * x + k[j][3] * y;
        x = y;
      }
      gain = gliding || last ? gain + 1.5 / kGlide : 2.0;
      ASSERT_NEAR(out[c][i], gain * x, 1e-5 * std::max(1.0, std::abs(gain * x))) << c << " " << i;
    }
  }
}

// A flat section (a peak at 0 dB) stays out of the cascade; one glided to flat leaves it once its
// ringing has died away, and the output is then the input exactly.
TEST(KSectionRunner, FlatSectionsLeaveTheCascadeOnceTheirRingingDies) {
  KFilterSection peak, flat;
  peak.Design(KFilterSection::kPeak, 12.0, 100.0, 48000.0, 4.0);
  flat.Design(KFilterSection::kPeak, 0.0, 300.0, 48000.0, 1.0);
  const KFilterSection both[2] = {flat, peak};
  KSectionRunner runner;
  runner.SetSections(both, 2);
  EXPECT_EQ(runner.EngagedCount(), 1);
  Channels ringing = Noise(2, 4800, 9);
  Filter(runner, ringing, ringing, 64);
  const KSectionRunner::Row rows[2] = {{flat.b0, flat.minusA1, flat.b1, flat.minusA2, flat.b2}, {1.0, 0.0, 0.0, 0.0, 0.0}};
  runner.Aim(rows, 2, 1.0, 480, false);  // the peak glides to a pass-through
  EXPECT_EQ(runner.EngagedCount(), 1);
  const Channels quiet = Noise(2, 64, 11);
  Channels out = quiet;
  int32_t blocks = 0;
  for (; runner.EngagedCount() > 0 && blocks < 2000; ++blocks) Filter(runner, quiet, out, 64);
  EXPECT_GT(blocks, 7);  // not before the glide and some ringing
  EXPECT_LT(blocks, 2000);
  Filter(runner, quiet, out, 64);
  EXPECT_EQ(out, quiet);
}

// After the reported ring an impulse response is below the asked fall; well before it, it is not.
TEST(KSectionRunner, RingSamplesBoundTheImpulseResponse) {
  for (const auto& [type, gain, hz, q] : {std::tuple{KFilterSection::kPeak, 18.0, 40.0, 12.0}, {KFilterSection::kLowPass, 0.0, 200.0, 0.7},
                                          {KFilterSection::kBilinearHighPass, 0.0, 5.0, 1.0}, {KFilterSection::kOnePoleLowPass, 0.0, 10.0, 1.0}}) {
    KFilterSection s;
    s.Design(type, gain, hz, 48000.0, q);
    const KSectionRunner::Row row = {s.b0, s.minusA1, s.b1, s.minusA2, s.b2};
    const uint32_t ring = KSectionRunner::RingSamples(&row, 1, 1e-6);
    std::vector<double> impulse{1.0};
    impulse.resize(size_t{ring} + 1000, 0.0);
    const std::vector<double> response = Reference({s}, impulse);
    double late = 0.0, half = 0.0;
    for (size_t i = ring; i < response.size(); ++i) late = std::max(late, std::abs(response[i]));
    for (size_t i = ring / 3; i < ring / 2; ++i) half = std::max(half, std::abs(response[i]));
    EXPECT_LT(late, 1e-6) << type << " " << ring;
    EXPECT_GT(half, 1e-6) << type << " " << ring;  // not far too long
  }
  const KSectionRunner::Row flat = {1.0, 0.5, -0.5, -0.25, 0.25}, unstable = {1.0, 2.0, 0.0, -1.0, 0.0};
  EXPECT_EQ(KSectionRunner::RingSamples(&flat, 1, 1e-6), 0u);
  EXPECT_EQ(KSectionRunner::RingSamples(&unstable, 1, 1e-6), UINT32_MAX);
}
