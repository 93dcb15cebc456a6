// Any Linux VST 2 plug-ins' processReplacing over stereo noise in blocks of 64 frames, each
// beside the first one given, in turn within the same run:
//   torvane_vst2_bench OURS.so PEER.so [PEER.so ...] [benchmark flags]
// For each peer: "ns_per_stereo_frame" (the first plug-in), "peer_ns_per_stereo_frame", and
// "ratio", how many times longer the peer takes. Repeated 3 times and reported as medians
// unless the flags say otherwise. Times are the processor time of the benchmark's thread, so
// that other work on a busy machine does not count.
#include <time.h>

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "bench/SampleCounters.h"
#include "hosts/vst2/KVST2Interface.h"
#include "kernel/platform/KPlatformLibrary.h"

using namespace KVST2;

namespace {
constexpr int32_t kBlock = 64;
constexpr int32_t kBlocks = 750;  // one second of noise at 48 kHz, played round and round
constexpr float kRate = 48000.0f;

// Processor time of the calling thread, in seconds.
double ThreadSeconds() {
  timespec now{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
  return static_cast<double>(now.tv_sec) + 1e-9 * static_cast<double>(now.tv_nsec);
}

// Runs of kBatch blocks of each plug-in in turn, so that both meet the same caches and clock
// speed; reading the thread's clock is a system call, so it is read around runs, not blocks.
template <class HotPath, class Reference>
void TimeOnThread(benchmark::State& state, HotPath&& hotPath, Reference&& reference) {
  constexpr int32_t kBatch = 50;
  double hot = 0.0, plain = 0.0;
  int64_t block = 0;
  for (auto _ : state) {
    const double start = ThreadSeconds();
    for (int32_t i = 0; i < kBatch; ++i) hotPath(block + i);
    const double middle = ThreadSeconds();
    for (int32_t i = 0; i < kBatch; ++i) reference(block + i);
    const double end = ThreadSeconds();
    block += kBatch;
    state.SetIterationTime(middle - start);
    hot += middle - start;
    plain += end - middle;
  }
  state.SetItemsProcessed(block * kBlock);
  KReportPair(state, static_cast<double>(block * 2 * kBlock), hot, plain);
}

// The least a host answers: its version, and nothing else.
intptr_t Callback(AEffect*, int32_t opcode, int32_t, intptr_t, void*, float) { return opcode == audioMasterVersion ? kVstVersion : 0; }

// One plug-in loaded, started, and fed stereo noise (its other inputs silent).
class KPlugin {
public:
  explicit KPlugin(const std::string& path) : name_(path.substr(path.rfind('/') + 1)) {
    library_ = KPlatform::OpenLibrary(path);
    // Older modules export only "main".
    void* entry = library_ ? KPlatform::FindSymbol(library_, "VSTPluginMain") : nullptr;
    if (library_ && !entry) entry = KPlatform::FindSymbol(library_, "main");
    auto main = reinterpret_cast<MainFunction>(entry);
    effect_ = main ? main(&Callback) : nullptr;
    if (!effect_ || effect_->magic != kEffectMagic) {
      std::fprintf(stderr, "%s: not a VST 2 plug-in (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
      effect_ = nullptr;
      return;
    }
    Call(effOpen);
    Call(effSetSampleRate, 0, nullptr, kRate);
    Call(effSetBlockSize, kBlock);
    Call(effMainsChanged, 1);
    Call(effStartProcess);
    noise_.resize(2 * kBlock * kBlocks);
    for (uint32_t i = 0, state = 12345u; i < noise_.size(); ++i, state = state * 1664525u + 1013904223u)
      noise_[i] = 0.5f * (static_cast<float>(state >> 8) / 8388608.0f - 1.0f);
    silence_.assign(kBlock, 0.0f);
    outputs_.assign(static_cast<size_t>(std::max(effect_->numOutputs, 2)), std::vector<float>(kBlock));
    for (auto& output : outputs_) outputPointers_.push_back(output.data());
    inputPointers_.assign(static_cast<size_t>(std::max(effect_->numInputs, 2)), silence_.data());
  }
  ~KPlugin() {
    if (effect_) {
      Call(effStopProcess);
      Call(effMainsChanged, 0);
      Call(effClose);
    }
    // The library stays loaded: some plug-ins leave threads or handlers behind.
  }
  bool Loaded() const noexcept { return effect_ != nullptr; }
  const std::string& Name() const noexcept { return name_; }
  void Process(int64_t block) {
    float* left = noise_.data() + 2 * kBlock * (block % kBlocks);
    inputPointers_[0] = left, inputPointers_[1] = left + kBlock;
    effect_->processReplacing(effect_, inputPointers_.data(), outputPointers_.data(), kBlock);
    benchmark::DoNotOptimize(outputPointers_[0][kBlock - 1]);
  }

private:
  intptr_t Call(int32_t opcode, intptr_t value = 0, void* ptr = nullptr, float opt = 0.0f) { return effect_->dispatcher(effect_, opcode, 0, value, ptr, opt); }

  std::string name_;
  void* library_ = nullptr;
  AEffect* effect_ = nullptr;
  std::vector<float> noise_, silence_;
  std::vector<std::vector<float>> outputs_;
  std::vector<float*> inputPointers_, outputPointers_;
};
}  // namespace

int main(int argc, char** argv) {
  // Flags given later win over these defaults.
  std::string repetitions = "--benchmark_repetitions=3", aggregates = "--benchmark_report_aggregates_only=true";
  std::vector<std::string> paths;
  std::vector<char*> flags;
  flags.push_back(argv[0]), flags.push_back(repetitions.data()), flags.push_back(aggregates.data());
  for (int i = 1; i < argc; ++i) (std::string(argv[i]).starts_with("--") ? flags.push_back(argv[i]) : paths.push_back(argv[i]));
  if (paths.size() < 2) {
    std::fprintf(stderr, "usage: %s OURS.so PEER.so [PEER.so ...] [benchmark flags]\n", argv[0]);
    return 2;
  }
  int count = static_cast<int>(flags.size());
  benchmark::Initialize(&count, flags.data());

  std::vector<std::unique_ptr<KPlugin>> plugins;
  for (const std::string& path : paths) {
    plugins.push_back(std::make_unique<KPlugin>(path));
    if (!plugins.back()->Loaded()) return 1;
  }
  KPlugin& ours = *plugins[0];
  for (size_t p = 1; p < plugins.size(); ++p) {
    KPlugin& peer = *plugins[p];
    benchmark::RegisterBenchmark(("VST2/" + ours.Name() + "_vs_" + peer.Name()).c_str(), [&ours, &peer](benchmark::State& state) {
      TimeOnThread(state, [&](int64_t block) { ours.Process(block); }, [&](int64_t block) { peer.Process(block); });
      // Two channels a frame (seconds, shown with their prefix: "1.5n" reads 1.5 ns).
      state.counters["ns_per_stereo_frame"] = 2.0 * state.counters["ns_per_sample_channel"].value;
      state.counters["peer_ns_per_stereo_frame"] = 2.0 * state.counters["reference_ns_per_sample_channel"].value;
      state.counters.erase("ns_per_sample_channel");
      state.counters.erase("reference_ns_per_sample_channel");
    })->UseManualTime();
  }
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
