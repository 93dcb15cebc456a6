#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KLoudnessMeter.h"

namespace {
constexpr int32_t kBlock = 512;

// The meter on a stereo block beside a plain loop of the same two weighting stages and the sum
// of squares, without the meter's parts, gating and publishing.
void BM_LoudnessMeter(benchmark::State& state) {
  std::vector<float> left(kBlock), right(kBlock);
  for (int32_t i = 0; i < kBlock; ++i) {
    left[static_cast<size_t>(i)] = static_cast<float>(0.3 * std::sin(0.05 * i));
    right[static_cast<size_t>(i)] = static_cast<float>(0.2 * std::sin(0.11 * i));
  }
  const float* channels[2] = {left.data(), right.data()};
  KLoudnessMeter meter;
  meter.Prepare(48000.0);
  const KFilterSection stages[2] = {KLoudnessMeter::Shelf(48000.0), KLoudnessMeter::HighPass(48000.0)};
  double memory[2][2][2] = {};  // channel, stage, x and y delays of direct form I
  double history[2][2][2] = {};
  double energy = 0.0;
  KTimePair(
      state, 2 * kBlock, [&](int64_t) { meter.Process(channels, 2, kBlock); },
      [&](int64_t) {
        for (int32_t c = 0; c < 2; ++c)
          for (int32_t i = 0; i < kBlock; ++i) {
            double x = channels[c][i];
            for (int32_t s = 0; s < 2; ++s) {
              const KFilterSection& f = stages[s];
              double* xs = memory[c][s];
              double* ys = history[c][s];
              const double y = f.b0 * x + f.b1 * xs[0] + f.b2 * xs[1] + f.minusA1 * ys[0] + f.minusA2 * ys[1];
              xs[1] = xs[0], xs[0] = x, ys[1] = ys[0], ys[0] = y;
              x = y;
            }
            energy += x * x;
          }
        benchmark::DoNotOptimize(energy);
      });
}
BENCHMARK(BM_LoudnessMeter)->UseManualTime();
}  // namespace
