#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <numbers>
#include <cstdint>
#include <limits>
#include <vector>

#include "dsp/KDecibels.h"
#include "dsp/KMultibandSplitter.h"
#include "tests/core/AllocationCounter.h"

namespace {

constexpr double kRate = 48000.0;
constexpr double kCrossovers[] = {120.0, 600.0, 2500.0, 7000.0, 14000.0};
constexpr int32_t kLength = 16384;
using Bands = std::vector<std::vector<float>>;

// Every band's response to a unit impulse, in blocks of 1000.
Bands ImpulseResponses(KMultibandSplitter& splitter, int32_t channel = 0) {
  Bands bands(static_cast<size_t>(splitter.BandCount()), std::vector<float>(kLength));
  std::vector<float> in(kLength);
  in[0] = 1.0f;
  std::vector<float*> out(bands.size());
  for (int32_t at = 0; at < kLength; at += 1000) {
    const int32_t n = std::min(1000, kLength - at);
    for (size_t b = 0; b < bands.size(); ++b) out[b] = bands[b].data() + at;
    splitter.Process(channel, in.data() + at, out.data(), n);
  }
  return bands;
}

// The level in dB of a response at `hz`, from its transform at that one frequency.
double LevelDb(const std::vector<double>& response, double hz) {
  const std::complex<double> turn = std::polar(1.0, -2.0 * std::numbers::pi * hz / kRate);
  std::complex<double> sum, z = 1.0;
  for (size_t n = 0; n < response.size(); ++n, z *= turn) sum += response[n] * z;
  return KLinearToDecibels(std::abs(sum));
}

std::vector<double> Sum(const Bands& bands) {
  std::vector<double> sum(kLength);
  for (const auto& band : bands)
    for (size_t n = 0; n < sum.size(); ++n) sum[n] += band[n];
  return sum;
}

KMultibandSplitter Made(int32_t bands) {
  KMultibandSplitter splitter;
  splitter.Prepare(1000);
  splitter.SetCrossovers(kCrossovers, bands, kRate);
  return splitter;
}

}  // namespace

// For every band count, the bands add up to the input's magnitude within 0.01 dB from 20 Hz to
// 20 kHz, while each band alone is far from flat: each is −6 dB at its crossovers (every
// Linkwitz-Riley half is; the next crossover's skirt adds a little) and far down two octaves on.
TEST(MultibandSplitter, BandsSumToTheInputsMagnitude) {
  for (int32_t count = KMultibandSplitter::kMinBands; count <= KMultibandSplitter::kMaxBands; ++count) {
    KMultibandSplitter splitter = Made(count);
    ASSERT_EQ(splitter.BandCount(), count);
    const Bands bands = ImpulseResponses(splitter);
    const std::vector<double> sum = Sum(bands);
    for (double hz = 20.0; hz <= 20000.0; hz *= 1.12)
      EXPECT_NEAR(LevelDb(sum, hz), 0.0, 0.01) << count << " bands at " << hz << " Hz";
    for (int32_t k = 0; k + 1 < count; ++k) {
      const std::vector<double> below(bands[k].begin(), bands[k].end()), above(bands[k + 1].begin(), bands[k + 1].end());
      EXPECT_NEAR(LevelDb(below, kCrossovers[k]), -6.02, 0.3) << "band " << k << " of " << count;
      EXPECT_NEAR(LevelDb(above, kCrossovers[k]), -6.02, 0.3) << "band " << k + 1 << " of " << count;
      if (4.0 * kCrossovers[k] < 20000.0) {
        EXPECT_LT(LevelDb(below, 4.0 * kCrossovers[k]), -40.0) << "band " << k << " of " << count;
      }
    }
    const std::vector<double> top(bands.back().begin(), bands.back().end());
    EXPECT_LT(LevelDb(top, kCrossovers[count - 2] / 4.0), -40.0) << "top band of " << count;
  }
}

// A band well inside its range passes at unity; the bands are not merely all low-passes of one
// another, nor all copies of the input.
TEST(MultibandSplitter, EachBandPassesItsOwnRange) {
  KMultibandSplitter splitter = Made(4);
  const Bands bands = ImpulseResponses(splitter);
  const double centres[] = {30.0, 270.0, 1200.0, 15000.0};
  for (size_t b = 0; b < bands.size(); ++b) {
    const std::vector<double> band(bands[b].begin(), bands[b].end());
    EXPECT_NEAR(LevelDb(band, centres[b]), 0.0, 1.0) << "band " << b;  // the neighbours' skirts
    for (size_t other = 0; other < bands.size(); ++other) {
      if (other + 1 < b || other > b + 1) {
        EXPECT_LT(LevelDb(band, centres[other]), -30.0) << b << " at " << other;
      }
    }
  }
}

// Crossovers out of order or out of range are kept ascending and inside the limits; a design
// with the same band count keeps the state, another count starts from silence.
TEST(MultibandSplitter, KeepsCrossoversOrderedAndInRange) {
  KMultibandSplitter splitter;
  splitter.Prepare(64);
  const double wild[] = {3000.0, 200.0, 1.0, 40000.0};
  splitter.SetCrossovers(wild, 5, kRate);
  EXPECT_EQ(splitter.Crossover(0), 3000.0);
  EXPECT_EQ(splitter.Crossover(1), 3000.0);
  EXPECT_EQ(splitter.Crossover(2), 3000.0);
  EXPECT_EQ(splitter.Crossover(3), KMultibandSplitter::kHighestShare * kRate);
  splitter.SetCrossovers(kCrossovers, 9, kRate);  // as many bands as there are crossovers for
  EXPECT_EQ(splitter.BandCount(), KMultibandSplitter::kMaxBands);
  splitter.SetCrossovers(kCrossovers, 0, kRate);
  EXPECT_EQ(splitter.BandCount(), KMultibandSplitter::kMinBands);
}

// Each channel keeps its own state; a NaN spoils its own block only; silence afterwards decays
// to exact zeros; and nothing allocates while processing.
TEST(MultibandSplitter, ChannelsAreSeparateAndRecoverFromNonFiniteInput) {
  KMultibandSplitter splitter = Made(3);
  const Bands clean = ImpulseResponses(splitter, 1);
  splitter.Reset();
  std::vector<float> in(1000, 0.25f), b0(1000), b1(1000), b2(1000);
  float* out[] = {b0.data(), b1.data(), b2.data()};
  in[500] = std::numeric_limits<float>::quiet_NaN();
  KAllocationCounter counter;
  splitter.Process(0, in.data(), out, 1000);
  EXPECT_TRUE(std::isnan(b0[999]));
  std::fill(in.begin(), in.end(), 0.0f);
  splitter.Process(0, in.data(), out, 1000);
  EXPECT_TRUE(std::all_of(b0.begin(), b0.end(), [](float v) { return v == 0.0f; }));
  EXPECT_EQ(counter.Count(), 0);
  // Channel 1 never saw the NaN: its impulse response is the one a fresh splitter gives.
  EXPECT_EQ(ImpulseResponses(splitter, 1), clean);
  for (int32_t block = 0; block < 400; ++block) splitter.Process(1, in.data(), out, 1000);
  for (const float* band : out) EXPECT_TRUE(std::all_of(band, band + 1000, [](float v) { return v == 0.0f; }));
}
