#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KFilterSection.h"
#include "dsp/KMultibandSplitter.h"

namespace {

constexpr int32_t kBlock = 512;
constexpr double kRate = 48000.0;
constexpr double kCrossovers[] = {120.0, 600.0, 2500.0, 7000.0, 14000.0};

// The plain way: every section an object in direct form I, the crossovers and the phase
// compensation worked out sample by sample for each band.
struct PlainBiquad {
  double b0, b1, b2, a1, a2;
  double x1 = 0.0, x2 = 0.0, y1 = 0.0, y2 = 0.0;

  static PlainBiquad Of(int32_t type, double hz) {
    KFilterSection s;
    s.Design(type, 0.0, hz, kRate, 0.7071067811865476);
    return {s.b0, s.b1, s.b2, -s.minusA1, -s.minusA2};
  }
  double Run(double x) {
    const double y = b0 * x + b1 * x1 + b2 * x2 - a1 * y1 - a2 * y2;
    x2 = x1, x1 = x, y2 = y1, y1 = y;
    return y;
  }
};

struct PlainSplitter {
  explicit PlainSplitter(int32_t count) : bands(count) {
    for (int32_t k = 0; k + 1 < count; ++k) {
      const double hz = kCrossovers[k];
      crossovers.push_back({PlainBiquad::Of(KFilterSection::kLowPass, hz), PlainBiquad::Of(KFilterSection::kLowPass, hz),
                            PlainBiquad::Of(KFilterSection::kHighPass, hz), PlainBiquad::Of(KFilterSection::kHighPass, hz)});
      for (int32_t m = k + 1; m + 1 < count; ++m) turns.push_back(PlainBiquad::Of(KFilterSection::kAllPass, kCrossovers[m]));
    }
  }
  void Process(const float* in, float* const* out, int32_t n) {
    for (int32_t i = 0; i < n; ++i) {
      double rest = in[i];
      size_t turn = 0;
      for (int32_t k = 0; k + 1 < bands; ++k) {
        std::vector<PlainBiquad>& c = crossovers[static_cast<size_t>(k)];
        double low = c[1].Run(c[0].Run(rest));
        rest = c[3].Run(c[2].Run(rest));
        for (int32_t m = k + 1; m + 1 < bands; ++m) low = turns[turn++].Run(low);
        out[k][i] = static_cast<float>(low);
      }
      out[bands - 1][i] = static_cast<float>(rest);
    }
  }
  int32_t bands;
  std::vector<std::vector<PlainBiquad>> crossovers;
  std::vector<PlainBiquad> turns;
};

// Both splitters over the same stereo blocks of two sines, one block of each in turn.
void BM_MultibandSplitter(benchmark::State& state) {
  const auto bands = static_cast<int32_t>(state.range(0));
  constexpr int32_t kChannels = 2;
  std::vector<float> in(kBlock);
  for (int32_t i = 0; i < kBlock; ++i) in[static_cast<size_t>(i)] = static_cast<float>(0.5 * std::sin(0.01 * i) + 0.3 * std::sin(0.37 * i));
  std::vector<std::vector<float>> hot(static_cast<size_t>(bands), std::vector<float>(kBlock)), plain(hot);
  std::vector<float*> hotOut, plainOut;
  for (auto& band : hot) hotOut.push_back(band.data());
  for (auto& band : plain) plainOut.push_back(band.data());
  KMultibandSplitter splitter;
  splitter.Prepare(kBlock);
  splitter.SetCrossovers(kCrossovers, bands, kRate);
  std::vector<PlainSplitter> reference(kChannels, PlainSplitter(bands));
  KTimePair(
      state, int64_t{kBlock} * kChannels,
      [&](int64_t) {
        for (int32_t c = 0; c < kChannels; ++c) splitter.Process(c, in.data(), hotOut.data(), kBlock);
      },
      [&](int64_t) {
        for (auto& channel : reference) channel.Process(in.data(), plainOut.data(), kBlock);
      });
  state.counters["max_difference"] = KLargestDifference(hotOut.data(), plainOut.data(), bands, kBlock);
}
BENCHMARK(BM_MultibandSplitter)->ArgName("bands")->Arg(2)->Arg(4)->Arg(6)->UseManualTime();

}  // namespace
