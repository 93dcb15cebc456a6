#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KDelayLine.h"
#include "dsp/KLFO.h"

namespace {

constexpr int32_t kBlock = 512;
constexpr double kRate = 48000.0;

// Each shape of the LFO beside the plain way to make a wave: a phase in cycles that steps and
// wraps, and the shape worked out with a switch for every sample.
void BM_LFO(benchmark::State& state) {
  const int32_t shape = static_cast<int32_t>(state.range(0));
  KLFOSettings settings;
  settings.shape = shape;
  settings.rate = 3.7;
  settings.smoothing = 0.0005;
  settings.sampleRate = kRate;
  KLFO lfo;
  lfo.Update(settings);
  lfo.Reset();
  std::vector<double> hot(kBlock), plain(kBlock);
  double phase = 0.0, held = 0.3, next = -0.2, y = 0.0;
  const double step = settings.rate / kRate, keep = std::exp(-1.0 / (kRate * settings.smoothing));
  KTimePair(
      state, kBlock, [&](int64_t) { lfo.Fill(hot.data(), kBlock); },
      [&](int64_t) {
        for (int32_t i = 0; i < kBlock; ++i) {
          double v = 0.0;
          switch (shape) {
            case KLFO::kSine: v = std::sin(6.283185307179586 * phase); break;
            case KLFO::kTriangle: v = phase < 0.25 ? 4.0 * phase : (phase < 0.75 ? 2.0 - 4.0 * phase : 4.0 * phase - 4.0); break;
            case KLFO::kSawUp: v = 2.0 * phase - 1.0; break;
            case KLFO::kSawDown: v = 1.0 - 2.0 * phase; break;
            case KLFO::kSquare: v = phase < 0.5 ? 1.0 : -1.0; break;
            case KLFO::kRandomSmooth: v = held + (next - held) * (0.5 - 0.5 * std::cos(3.141592653589793 * phase)); break;
            default: v = held;
          }
          y = keep * y + (1.0 - keep) * v;
          plain[static_cast<size_t>(i)] = y;
          phase += step;
          if (phase >= 1.0) {
            phase -= 1.0;
            held = next;
            next = -0.9 * next;
          }
        }
      });
  benchmark::DoNotOptimize(plain.data());
  state.SetLabel(KLFO::kShapeNames[shape]);
}
BENCHMARK(BM_LFO)->ArgName("shape")->DenseRange(0, KLFO::kShapeCount - 1)->UseManualTime();

// The delay line read at a moving delay (a chorus's sweep) beside the plain way: a vector
// indexed modulo its length, std::floor for the whole part and the same cubic interpolation.
// "max_difference" compares the two outputs.
void BM_DelayLineModulated(benchmark::State& state) {
  const int32_t longest = 4800;
  KDelayLine line;
  line.Prepare(longest);
  std::vector<double> ring(static_cast<size_t>(longest + 4), 0.0);
  size_t write = 0;
  std::vector<double> in(kBlock), delays(kBlock), hot(kBlock), plain(kBlock);
  for (int32_t i = 0; i < kBlock; ++i) {
    in[static_cast<size_t>(i)] = std::sin(0.05 * i) + 0.3 * std::sin(0.71 * i);
    delays[static_cast<size_t>(i)] = 700.0 + 300.0 * std::sin(6.283185307179586 * i / kBlock);
  }
  KTimePair(
      state, kBlock, [&](int64_t) { line.Run(in.data(), delays.data(), hot.data(), kBlock); },
      [&](int64_t) {
        const size_t size = ring.size();
        for (int32_t i = 0; i < kBlock; ++i) {
          const double d = delays[static_cast<size_t>(i)], whole = std::floor(d), t = 1.0 - (d - whole);
          const size_t at = (write + 2 * size - static_cast<size_t>(whole) - 1) % size;
          const double y0 = ring[(at + size - 1) % size], y1 = ring[at], y2 = ring[(at + 1) % size], y3 = ring[(at + 2) % size];
          const double c1 = 0.5 * (y2 - y0), c2 = y0 - 2.5 * y1 + 2.0 * y2 - 0.5 * y3, c3 = 0.5 * (y3 - y0) + 1.5 * (y1 - y2);
          plain[static_cast<size_t>(i)] = t == 1.0 ? y2 : ((c3 * t + c2) * t + c1) * t + y1;
          ring[write] = in[static_cast<size_t>(i)];
          write = (write + 1) % size;
        }
      });
  double largest = 0.0;
  for (int32_t i = 0; i < kBlock; ++i) largest = std::max(largest, std::abs(hot[static_cast<size_t>(i)] - plain[static_cast<size_t>(i)]));
  state.counters["max_difference"] = largest;
}
BENCHMARK(BM_DelayLineModulated)->UseManualTime();

}  // namespace
