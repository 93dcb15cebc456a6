#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

#include "core/KParameter.h"
#include "plugins/multiband/KMultibandCompressorPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using M = KMultibandCompressorPlugin;

std::unique_ptr<M> Compressor(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto compressor = std::make_unique<M>();
  compressor->SetSampleRate(48000.0);
  for (auto [index, value] : settings) compressor->GetParameter(index).SetWorking(value);
  return compressor;
}
}  // namespace

// With no band compressing, the bands add up to the input's magnitude at every frequency, for
// every band count: the splitter's all-pass survives the plug-in around it.
TEST(MultibandCompressor, UncompressedBandsSumToAFlatResponse) {
  for (const double bands : {2.0, 3.0, 4.0}) {
    auto compressor = Compressor({{M::kBands, bands}});
    for (int32_t b = 0; b < M::kMaxBands; ++b) compressor->GetParameter(M::BandRow(b, M::kRatio)).SetWorking(1.0);
    Channels in(2, std::vector<float>(16384));
    in[0][0] = in[1][0] = 1.0f;
    const Channels out = Render(*compressor, in, {1024});
    for (double hz = 30.0; hz < 20000.0; hz *= 1.3) {
      std::complex<double> sum;
      for (size_t n = 0; n < out[0].size(); ++n) sum += static_cast<double>(out[0][n]) * std::polar(1.0, -2.0 * std::numbers::pi * hz * n / 48000.0);
      EXPECT_NEAR(20.0 * std::log10(std::abs(sum)), 0.0, 0.01) << bands << " bands at " << hz << " Hz";
    }
  }
}

// A loud bass note over a quiet high tone: compressing only the low band turns the bass down and
// leaves the high tone as it was; compressing only the high band leaves the bass alone.
TEST(MultibandCompressor, CompressesEachBandOnItsOwn) {
  Channels in = Sine(2, 48000, 80.0, 0.7);
  const Channels high = Sine(2, 48000, 6000.0, 0.02);
  for (size_t c = 0; c < 2; ++c)
    for (size_t i = 0; i < in[c].size(); ++i) in[c][i] += high[c][i];
  const auto change = [&](const Channels& out, double hz) {
    return 20.0 * std::log10(Amplitude(out[0], hz, 24000, 48000) / Amplitude(in[0], hz, 24000, 48000));
  };
  auto low = Compressor({{M::kBands, 2.0}, {M::kCrossover1, 600.0}, {M::BandRow(0, M::kThreshold), -30.0},
                         {M::BandRow(0, M::kRatio), 10.0}, {M::BandRow(1, M::kRatio), 1.0}});
  const Channels lowOut = Render(*low, in, {512});
  EXPECT_LT(change(lowOut, 80.0), -12.0);
  EXPECT_NEAR(change(lowOut, 6000.0), 0.0, 0.2);
  EXPECT_LT(low->GainReductionDecibels(), -12.0f);
  auto top = Compressor({{M::kBands, 2.0}, {M::kCrossover1, 600.0}, {M::BandRow(0, M::kRatio), 1.0},
                         {M::BandRow(1, M::kThreshold), -50.0}, {M::BandRow(1, M::kRatio), 10.0}});
  const Channels topOut = Render(*top, in, {512});
  EXPECT_NEAR(change(topOut, 80.0), 0.0, 0.2);
  EXPECT_LT(change(topOut, 6000.0), -6.0);
}
