#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "dsp/KDynamicsProcessor.h"

namespace {

constexpr int32_t kBlock = 512;
constexpr int32_t kChannels = 2;
constexpr double kRate = 48000.0;

// A stereo block that crosses the threshold both ways, so that both sides of the curve run.
struct Stereo {
  Stereo() : in(kChannels, std::vector<float>(kBlock)), out(in) {
    for (size_t c = 0; c < in.size(); ++c) {
      for (int32_t i = 0; i < kBlock; ++i) {
        in[c][static_cast<size_t>(i)] = static_cast<float>((0.2 + 0.6 * (c == 0)) * std::sin(0.05 * i) + 0.1 * std::sin(0.31 * i));
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

void BM_Dynamics(benchmark::State& state) {
  KDynamicsProcessor engine;
  engine.Prepare(kChannels, kBlock);
  engine.Update(Settings(state.range(0) != 0, static_cast<int32_t>(state.range(1)), 4.0));
  Stereo blocks;
  for (auto _ : state) {
    engine.Process(kBlock, blocks.inputs.data(), blocks.outputs.data(), nullptr, kChannels);
    benchmark::ClobberMemory();
  }
  Report(state);
}
BENCHMARK(BM_Dynamics)
    ->ArgNames({"linked", "knee"})
    ->Args({1, KTransferCurve::kHardKnee})
    ->Args({1, KTransferCurve::kSoftKnee})
    ->Args({0, KTransferCurve::kHardKnee})
    ->Args({0, KTransferCurve::kSoftKnee});

// The plain way: the detector and the hard-knee gain written out in one loop, with the same
// envelope and gain rows stored for the meters.
void BM_DynamicsReference(benchmark::State& state) {
  const bool linked = state.range(0) != 0;
  KDynamicsProcessor coefficients;
  coefficients.Update(Settings(linked, KTransferCurve::kHardKnee, 4.0));
  const KTransferCurve& k = coefficients.Transfer();
  const double gIn = coefficients.InputGain(), c = coefficients.MeanSquare().coefficient;
  const double att = coefficients.Attack(), rel = coefficients.Release();
  const double t = k.Threshold(), b = k.Intercept(), m = k.Slope(), g0 = k.TotalGain();
  std::vector<float> envelope(kBlock * kChannels), gains(kBlock * kChannels);
  double p[kChannels] = {}, e[kChannels] = {};
  Stereo blocks;
  auto step = [&](double& pp, double& ee, double s) {
    pp = c * pp + (1.0 - c) * s;
    const double r = std::sqrt(pp);
    ee = r + (ee < r ? att : rel) * (ee - r);
    return ee <= t ? g0 : g0 * (b + m * ee) / ee;
  };
  for (auto _ : state) {
    if (linked) {
      for (int32_t i = 0; i < kBlock; ++i) {
        double s = 0.0;
        for (int32_t ch = 0; ch < kChannels; ++ch) {
          const double v = gIn * blocks.inputs[ch][i];
          s += v * v;
        }
        const double g = step(p[0], e[0], s / kChannels);
        envelope[i] = static_cast<float>(e[0]);
        gains[i] = static_cast<float>(g);
        for (int32_t ch = 0; ch < kChannels; ++ch) blocks.outputs[ch][i] = static_cast<float>(g * blocks.inputs[ch][i]);
      }
    } else {
      for (int32_t ch = 0; ch < kChannels; ++ch) {
        for (int32_t i = 0; i < kBlock; ++i) {
          const double v = gIn * blocks.inputs[ch][i];
          const double g = step(p[ch], e[ch], v * v);
          envelope[ch * kBlock + i] = static_cast<float>(e[ch]);
          gains[ch * kBlock + i] = static_cast<float>(g);
          blocks.outputs[ch][i] = static_cast<float>(g * blocks.inputs[ch][i]);
        }
      }
    }
    benchmark::ClobberMemory();
  }
  benchmark::DoNotOptimize(envelope.data());
  benchmark::DoNotOptimize(gains.data());
  Report(state);
}
BENCHMARK(BM_DynamicsReference)->ArgName("linked")->Arg(1)->Arg(0);

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
