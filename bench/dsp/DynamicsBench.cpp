#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KDynamicsProcessor.h"

namespace {

constexpr int32_t kBlock = 512;
constexpr int32_t kChannels = 2;
constexpr double kRate = 48000.0;

// A stereo block that swells from silence and back, so that a detector of short times crosses the
// threshold and the knee both ways in every block.
struct Stereo {
  Stereo() : in(kChannels, std::vector<float>(kBlock)), out(in) {
    for (size_t c = 0; c < in.size(); ++c) {
      for (int32_t i = 0; i < kBlock; ++i) {
        const double swell = 0.5 - 0.5 * std::cos(6.283185307179586 * i / kBlock);
        in[c][static_cast<size_t>(i)] = static_cast<float>(swell * ((0.2 + 0.6 * (c == 0)) * std::sin(0.05 * i) + 0.1 * std::sin(0.31 * i)));
      }
      inputs.push_back(in[c].data());
      outputs.push_back(out[c].data());
    }
  }
  std::vector<std::vector<float>> in, out;
  std::vector<const float*> inputs;
  std::vector<float*> outputs;
};

KDynamicsSettings Settings(bool linked, int32_t knee, double ratio) {
  KDynamicsSettings s;
  s.ratio = ratio;
  s.kneeMode = knee;
  s.linkChannels = linked;
  s.gainDb = 2.0;
  s.sampleRate = kRate;
  return s;
}

void Report(benchmark::State& state) { state.SetItemsProcessed(state.iterations() * kBlock * kChannels); }

// The law worked out from the settings alone for every sample, as code that keeps nothing
// between samples would: the full-scale level with std::pow, the gains from decibels with
// std::pow, and a switch on the knee mode. Without make-up (the benchmarks' settings have none).
double PlainGain(const KDynamicsSettings& s, double d) {
  const double t = s.threshold * s.threshold, full = std::pow(t, 1.0 - 1.0 / s.ratio);
  const double m = (full - t) / (1.0 - t), b = t * (1.0 - m), g = std::pow(10.0, (s.gainDb + s.outputGainDb) / 20.0);
  // The knee runs from s0 to s1, where the line is at y1.
  const double s0 = std::max(t - 0.1767766952966369 * s.kneeSize, 1e-10);
  const double s1 = t + std::sqrt(2.0) * (t - s0) / std::sqrt(m * m + 1.0), y1 = b + m * s1;
  switch (s.kneeMode) {
    case KTransferCurve::kHardKnee:
      return d <= t ? g : g * (b + m * d) / d;
    case KTransferCurve::kLinearKnee:  // the chord from (s0, s0) to (s1, y1)
      if (d <= s0 || d >= s1) break;
      return g * (s0 + (d - s0) * (y1 - s0) / (s1 - s0)) / d;
    default: {  // the arc tangent to the identity at s0 and to the line at s1
      if (d <= s0 || d >= s1) break;
      const double q = ((s0 - y1) * m + (s0 - s1)) / (m - 1.0), x = d - (s0 + q);
      return g * (std::sqrt(2.0 * q * q - x * x) + s0 - q) / d;
    }
  }
  return d <= s0 ? g : g * (b + m * d) / d;
}

// Each knee, channels linked: the engine beside the plain way, a block of each in turn. The plain
// way is the detector and PlainGain in one loop over the samples, with the same envelope and gain
// rows stored for the meters. "max_difference" is the largest difference between their outputs.
void BM_DynamicsLinked(benchmark::State& state) {
  KDynamicsSettings settings = Settings(true, static_cast<int32_t>(state.range(0)), 4.0);
  settings.attack = 0.0005;  // times that follow the swell closely
  settings.release = 0.002;
  KDynamicsProcessor engine;
  engine.Prepare(kChannels, kBlock);
  engine.Update(settings);
  const double c = engine.MeanSquare().coefficient, att = engine.Attack(), rel = engine.Release();
  std::vector<float> envelope(kBlock), gains(kBlock);
  benchmark::DoNotOptimize(envelope.data());
  benchmark::DoNotOptimize(gains.data());
  double p = 0.0, e = 0.0;
  Stereo hot, plain;
  KTimePair(
      state, kBlock * kChannels,
      [&](int64_t) { engine.Process(kBlock, hot.inputs.data(), hot.outputs.data(), nullptr, kChannels); },
      [&](int64_t) {
        for (int32_t i = 0; i < kBlock; ++i) {
          const double gIn = std::pow(10.0, settings.gainDb / 20.0);
          double s = 0.0;
          for (int32_t ch = 0; ch < kChannels; ++ch) {
            const double v = gIn * plain.inputs[ch][i];
            s += v * v;
          }
          p = c * p + (1.0 - c) * (s / kChannels);
          const double r = std::sqrt(p);
          e = r + (e < r ? att : rel) * (e - r);
          const double g = PlainGain(settings, e);
          envelope[i] = static_cast<float>(e);
          gains[i] = static_cast<float>(g);
          for (int32_t ch = 0; ch < kChannels; ++ch) plain.outputs[ch][i] = static_cast<float>(g * plain.inputs[ch][i]);
        }
      });
  state.counters["max_difference"] = KLargestDifference(hot.outputs.data(), plain.outputs.data(), kChannels, kBlock);
}
BENCHMARK(BM_DynamicsLinked)
    ->ArgName("knee")
    ->DenseRange(KTransferCurve::kHardKnee, KTransferCurve::kSoftKnee)
    ->UseManualTime();

void BM_DynamicsIdle(benchmark::State& state) {
  KDynamicsProcessor engine;
  engine.Prepare(kChannels, kBlock);
  engine.Update(Settings(true, KTransferCurve::kHardKnee, 1.0));
  Stereo blocks;
  for (auto _ : state) {
    engine.Process(kBlock, blocks.inputs.data(), blocks.outputs.data(), nullptr, kChannels);
    benchmark::ClobberMemory();
  }
  Report(state);
}
BENCHMARK(BM_DynamicsIdle);

// The plain way of a gain: one multiply per sample.
void BM_DynamicsIdleReference(benchmark::State& state) {
  const auto factor = static_cast<float>(std::exp(0.11512925464970228 * 2.0));
  Stereo blocks;
  for (auto _ : state) {
    for (int32_t ch = 0; ch < kChannels; ++ch) {
      for (int32_t i = 0; i < kBlock; ++i) blocks.outputs[ch][i] = factor * blocks.inputs[ch][i];
    }
    benchmark::ClobberMemory();
  }
  Report(state);
}
BENCHMARK(BM_DynamicsIdleReference);

}  // namespace
