#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "dsp/KConvolver.h"
#include "kernel/KException.h"
#include "tests/core/AllocationCounter.h"

namespace {
// A room-like response: noise under an exponential decay, long enough to reach three levels.
std::vector<float> DecayingNoise(int32_t length, uint32_t seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
  std::vector<float> taps(static_cast<size_t>(length));
  for (int32_t k = 0; k < length; ++k) taps[static_cast<size_t>(k)] = 0.3f * std::exp(-k / 700.0f) * noise(random);
  return taps;
}

std::vector<float> Noise(int32_t length, uint32_t seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
  std::vector<float> x(static_cast<size_t>(length));
  for (float& v : x) v = noise(random);
  return x;
}

std::vector<double> DirectConvolution(const std::vector<float>& x, const std::vector<float>& h) {
  std::vector<double> y(x.size(), 0.0);
  for (size_t i = 0; i < x.size(); ++i)
    for (size_t k = 0; k < h.size() && k <= i; ++k) y[i] += static_cast<double>(h[k]) * x[i - k];
  return y;
}

// The largest difference between `y` and `expected`, relative to the largest magnitude expected.
double RelativeError(const std::vector<float>& y, const std::vector<double>& expected) {
  double worst = 0.0, peak = 0.0;
  for (size_t i = 0; i < y.size(); ++i) {
    worst = std::max(worst, std::abs(y[i] - expected[i]));
    peak = std::max(peak, std::abs(expected[i]));
  }
  return worst / peak;
}

// Runs `x` through the convolver in host blocks cycling through `blocks`.
std::vector<float> Convolve(KConvolver& convolver, const std::vector<float>& x, const std::vector<int32_t>& blocks) {
  std::vector<float> y(x.size());
  for (size_t at = 0, b = 0; at < x.size(); ++b) {
    const auto n = std::min<size_t>(static_cast<size_t>(blocks[b % blocks.size()]), x.size() - at);
    convolver.Process(x.data() + at, y.data() + at, static_cast<int32_t>(n));
    at += n;
  }
  return y;
}
}  // namespace

// Head, the three smaller levels and the partition boundaries between them all agree with the
// plain sum, from the very first sample, whatever the partition size.
TEST(KConvolver, EqualsDirectConvolutionFromTheFirstSample) {
  const std::vector<float> h = DecayingNoise(3000, 1), x = Noise(6000, 2);
  const std::vector<double> expected = DirectConvolution(x, h);
  const double peak = std::abs(*std::max_element(expected.begin(), expected.end(), [](double a, double b) { return std::abs(a) < std::abs(b); }));
  ASSERT_GT(peak, 0.5);
  for (int32_t partition : {16, 64, 256}) {
    KConvolver convolver;
    convolver.Load(h, partition);
    EXPECT_LT(RelativeError(Convolve(convolver, x, {37, 64, 1, 500}), expected), 1e-6) << "partition " << partition;
  }
}

// A response long enough for the largest level, which spreads its work over the block before the
// one it plays in: with strong taps in its first and last partitions, the sum still agrees from
// the first sample at every partition size and however the host cuts its blocks.
TEST(KConvolver, SpreadLargestLevelEqualsDirectConvolution) {
  std::vector<float> h = DecayingNoise(12800, 8);
  h[8192] = 0.7f;   // the largest level's first tap
  h[8200] = -0.5f;
  h[12799] = 0.6f;  // its last
  const std::vector<float> x = Noise(22000, 9);
  const std::vector<double> expected = DirectConvolution(x, h);
  for (int32_t partition : {16, 64, 1024}) {
    for (const std::vector<int32_t>& blocks : std::vector<std::vector<int32_t>>{{64}, {37, 4096, 1, 500}}) {
      KConvolver convolver;
      convolver.Load(h, partition);
      EXPECT_LT(RelativeError(Convolve(convolver, x, blocks), expected), 1e-6) << "partition " << partition << ", first block " << blocks.front();
    }
  }
}

// A unit impulse passes unchanged; a delayed one, whether it falls in the head or in a level,
// delays by exactly its tap; the first input sample reaches the first output sample.
TEST(KConvolver, AddsNoLatency) {
  const std::vector<float> x = Noise(3000, 3);
  for (int32_t tap : {0, 5, 63, 64, 700, 2047}) {
    std::vector<float> h(static_cast<size_t>(tap + 1), 0.0f);
    h.back() = 1.0f;
    KConvolver convolver;
    convolver.Load(h, 64);
    const std::vector<float> y = Convolve(convolver, x, {64});
    for (int32_t i = 0; i < tap; ++i) ASSERT_NEAR(y[static_cast<size_t>(i)], 0.0f, 1e-6f) << "tap " << tap << " at " << i;
    for (size_t i = static_cast<size_t>(tap); i < x.size(); ++i) ASSERT_NEAR(y[i], x[i - static_cast<size_t>(tap)], 1e-6f) << "tap " << tap;
  }
}

// The same input cut into different host blocks gives the same output bit for bit; after the
// input falls silent the output is exactly zero by SettleSamples; Reset forgets everything.
TEST(KConvolver, BlockSizeIndependentAndSettlesToExactZero) {
  const std::vector<float> h = DecayingNoise(20000, 4);
  std::vector<float> x = Noise(9000, 5);
  KConvolver probe;
  probe.Load(h);
  x.resize(x.size() + static_cast<size_t>(probe.SettleSamples()) + 100, 0.0f);
  std::vector<float> reference;
  for (const std::vector<int32_t>& blocks : std::vector<std::vector<int32_t>>{{4096}, {1}, {64}, {17, 4000, 3, 1000}}) {
    KConvolver convolver;
    convolver.Load(h);
    std::vector<float> y = Convolve(convolver, x, blocks);
    if (reference.empty()) reference = y;
    else EXPECT_EQ(y, reference) << "first block " << blocks.front();
  }
  const auto silentFrom = 9000 + static_cast<size_t>(probe.SettleSamples());
  EXPECT_TRUE(std::all_of(reference.begin() + static_cast<ptrdiff_t>(silentFrom), reference.end(), [](float v) { return v == 0.0f; }));
  EXPECT_NE(reference[9000 + 15000], 0.0f);  // still ringing well inside the response

  KConvolver convolver;
  convolver.Load(h);
  const std::vector<float> first = Convolve(convolver, x, {333});
  convolver.Reset();
  EXPECT_EQ(Convolve(convolver, x, {333}), first);
}

TEST(KConvolver, ProcessesWithoutAllocatingAndRefusesBadPartitions) {
  KConvolver convolver;
  convolver.Load(DecayingNoise(50000, 6));
  std::vector<float> block(4096, 0.25f);
  KAllocationCounter counter;
  for (int32_t i = 0; i < 40; ++i) convolver.Process(block.data(), block.data(), 4096);
  EXPECT_EQ(counter.Count(), 0);
  EXPECT_THROW(convolver.Load(DecayingNoise(10, 7), 48), KException);
  EXPECT_THROW(convolver.Load(DecayingNoise(10, 7), 8), KException);
  EXPECT_THROW(convolver.Load(DecayingNoise(10, 7), 2048), KException);
  convolver.Load({});
  convolver.Process(block.data(), block.data(), 4096);
  EXPECT_TRUE(std::all_of(block.begin(), block.end(), [](float v) { return v == 0.0f; }));
}
