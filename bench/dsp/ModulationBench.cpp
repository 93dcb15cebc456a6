#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
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

}  // namespace
