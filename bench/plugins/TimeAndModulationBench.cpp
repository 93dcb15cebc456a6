#include <benchmark/benchmark.h>
#include <xmmintrin.h>

#include <cmath>
#include <cstdint>
#include <memory>
#include <vector>

#include "bench/SampleCounters.h"
#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"

// The delay, reverb and LFO-driven plug-ins at their defaults through ProcessHostBlock, each
// beside the Utility plug-in at −6 dB (a gain matrix: what the processing cycle and touching
// every sample cost) on the same stereo blocks in the same run. "ratio" below 1 reads as how many times the cycle's own
// cost the plug-in takes: 0.1 is ten times.
namespace {
constexpr int32_t kBlock = 512;
constexpr const char* kPlugins[] = {"KDelayPlugin",   "KReverbPlugin",  "KChorusPlugin",  "KFlangerPlugin",
                                    "KPhaserPlugin",  "KTremoloPlugin", "KAutoPanPlugin", "KAutoFilterPlugin"};

std::unique_ptr<KAudioPlugin> Make(const char* name) {
  std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::Static(name)));
  if (plugin) plugin->SetSampleRate(48000.0);
  return plugin;
}

void BM_TimeAndModulation(benchmark::State& state) {
  const char* name = kPlugins[state.range(0)];
  const std::unique_ptr<KAudioPlugin> plugin = Make(name), cycle = Make("KUtilityPlugin");
  KAudioPluginBase::Parameter* gain = cycle ? cycle->FindParameter(KString("gain")) : nullptr;
  if (!plugin || !gain) {
    state.SkipWithError("plug-in missing");
    return;
  }
  gain->SetWorking(-6.0);
  const unsigned saved = _mm_getcsr();
  _mm_setcsr(saved | 0x8040);  // as on a host's audio thread
  std::vector<float> left(kBlock), right(kBlock), outL(kBlock), outR(kBlock);
  for (int32_t i = 0; i < kBlock; ++i) {
    left[static_cast<size_t>(i)] = static_cast<float>(0.5 * std::sin(0.031 * i));
    right[static_cast<size_t>(i)] = static_cast<float>(0.4 * std::sin(0.047 * i + 1.0));
  }
  const float* in[] = {left.data(), right.data()};
  float* out[] = {outL.data(), outR.data()};
  KTimePair(
      state, 2 * kBlock, [&](int64_t) { plugin->ProcessHostBlock(in, out, kBlock); },
      [&](int64_t) { cycle->ProcessHostBlock(in, out, kBlock); });
  _mm_setcsr(saved);
  state.SetLabel(name);
}
BENCHMARK(BM_TimeAndModulation)->ArgName("plugin")->DenseRange(0, 7)->UseManualTime();
}  // namespace
