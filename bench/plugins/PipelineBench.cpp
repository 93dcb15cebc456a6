#include <benchmark/benchmark.h>
#include <xmmintrin.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/KLFOModulator.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "plugins/warmer/KSampleWarmer.h"

// The effect pipeline beside the same plug-ins called one after another (its real peer: what a
// host would do with them), and a plug-in moved by an LFO beside the same plug-in at rest: the
// ratios are what the pipeline's hand-over and forwarding, and the modulation ramps, cost.
namespace {
constexpr double kRate = 48000.0;

// Blocks of a stereo swell in place through `plugins` in turn, denormals flushed as hosts do.
void Run(benchmark::State& state, std::vector<KAudioPlugin*> plugins) {
  const auto length = static_cast<int32_t>(state.range(0));
  const unsigned saved = _mm_getcsr();
  _mm_setcsr(saved | 0x8040);
  std::vector<float> left(static_cast<size_t>(length)), right(left);
  int64_t k = 0;
  for (auto _ : state) {
    for (int32_t i = 0; i < length; ++i) {
      const double t = static_cast<double>(k * length + i);
      left[static_cast<size_t>(i)] = static_cast<float>(0.6 * std::sin(0.031 * t) * (0.5 + 0.5 * std::sin(t * 1e-4)));
      right[static_cast<size_t>(i)] = -left[static_cast<size_t>(i)];
    }
    ++k;
    const float* in[] = {left.data(), right.data()};
    float* out[] = {left.data(), right.data()};
    for (KAudioPlugin* plugin : plugins) plugin->ProcessHostBlock(in, out, length);
    benchmark::ClobberMemory();
  }
  _mm_setcsr(saved);
  state.SetItemsProcessed(state.iterations() * length);
}

void BM_PipelineCompressorWarmer(benchmark::State& state) {
  KEffectPipeline pipeline;
  pipeline.SetSampleRate(kRate);
  pipeline.AddModule(KString::Static("Compressor"));
  pipeline.AddModule(KString::Static("SampleWarmer"));
  Run(state, {&pipeline});
}
BENCHMARK(BM_PipelineCompressorWarmer)->ArgName("block")->Arg(64)->Arg(512);

void BM_PipelinePeerPluginsInSeries(benchmark::State& state) {
  KCompressorPlugin compressor;
  KSampleWarmer warmer;
  compressor.SetSampleRate(kRate);
  warmer.SetSampleRate(kRate);
  Run(state, {&compressor, &warmer});
}
BENCHMARK(BM_PipelinePeerPluginsInSeries)->ArgName("block")->Arg(64)->Arg(512);

void BM_UtilityMovedByLFO(benchmark::State& state) {
  // Named, so that a static link keeps the maker's registration.
  benchmark::DoNotOptimize(&KLFOModulator::Make);
  KUtilityPlugin utility;
  utility.SetSampleRate(kRate);
  Element lfos(KString::Static("LFOs"));
  Element& lfo = lfos.AddChild(KString::Static("LFO"));
  lfo.SetAttribute(KString::Static("Rate"), KString::Static("3"));
  lfo.AddChild(KString::Static("Target")).SetAttribute(KString::Static("Parameter"), KString::Static("width"));
  utility.SetLFOs(lfos);
  Run(state, {&utility});
}
BENCHMARK(BM_UtilityMovedByLFO)->ArgName("block")->Arg(64)->Arg(512);

void BM_UtilityAtRestReference(benchmark::State& state) {
  KUtilityPlugin utility;
  utility.SetSampleRate(kRate);
  Run(state, {&utility});
}
BENCHMARK(BM_UtilityAtRestReference)->ArgName("block")->Arg(64)->Arg(512);
}  // namespace
