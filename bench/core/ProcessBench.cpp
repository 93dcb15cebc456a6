#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/common/KHostRamp.h"
#include "plugins/utility/KUtilityPlugin.h"

// The cost of the processing cycle. The utility plug-in (a 2x2 matrix gain) runs through
// ProcessHostBlock beside the same matrix loop called directly, at several host block sizes and
// with 0, 1 or 8 moving parameters. Automation is re-added every block as a host would send it:
// each moving parameter gets a corner of its own inside the block, so n ramps cut the block into
// n + 1 sub-blocks, and every sub-block recomputes the matrix.
//
// The fixed costs come from a plug-in whose Process does nothing: its time over the block size
// gives the cost per host block (intercept) and per sample (the framework's metering), its time
// over the number of sub-blocks in a block of constant size the cost per sub-block.
namespace {
using Point = KAudioPluginBase::RampPoint;

constexpr int32_t kBlockSizes[] = {32, 64, 256, 1024};
constexpr int32_t kRampCounts[] = {0, 1, 8};

struct KStereoBlock {
  explicit KStereoBlock(int32_t length)
      : left(static_cast<size_t>(length)), right(static_cast<size_t>(length)), outLeft(left.size()), outRight(left.size()) {
    for (int32_t i = 0; i < length; ++i) {
      left[static_cast<size_t>(i)] = static_cast<float>(i % 37) / 37.0f - 0.5f;
      right[static_cast<size_t>(i)] = static_cast<float>(i % 23) / 23.0f - 0.5f;
    }
  }
  std::vector<float> left, right, outLeft, outRight;
  const float* inputs[2] = {left.data(), right.data()};
  float* outputs[2] = {outLeft.data(), outRight.data()};
};

// Re-adds `ramps` ramps, parameter r with its corner at (r + 1) / (ramps + 1) of the block; the
// values swing between two settings from block to block (switches stay off).
void AddHostAutomation(KAudioPlugin& plugin, int32_t ramps, int32_t length, int64_t block) {
  const double from = block % 2 == 0 ? 0.30 : 0.45;
  const double to = 0.75 - from;
  for (int32_t r = 0; r < ramps; ++r) {
    const Point points[] = {{0, from}, {(r + 1) * length / (ramps + 1), 0.5 * (from + to)}, {ParameterRamp::kBlockEnd, to}};
    plugin.AddRamp(r, points, false);
  }
}

void BM_ProcessUtility(benchmark::State& state, int32_t length, int32_t ramps) {
  KUtilityPlugin plugin;
  KStereoBlock block(length);
  int64_t count = 0;
  for (auto _ : state) {
    AddHostAutomation(plugin, ramps, length, count++);
    plugin.ProcessHostBlock(block.inputs, block.outputs, length);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * length);
}

// One parameter automated as hosts send it (KHostRamp: a point at the block's first and last
// sample), which moves on the fine grid: the block runs in grid cells, and every cell
// recomputes the matrix.
void BM_ProcessUtilityHostRamp(benchmark::State& state, int32_t length) {
  KUtilityPlugin plugin;
  KStereoBlock block(length);
  int64_t start = 0;
  for (auto _ : state) {
    KHostRamp ramp(plugin, 0);
    ramp.Add(0, 0.3 + 0.4 * static_cast<double>(start % 48000) / 48000.0);
    ramp.Add(length - 1, 0.3 + 0.4 * static_cast<double>((start + length - 1) % 48000) / 48000.0);
    ramp.Commit();
    plugin.ProcessHostBlock(block.inputs, block.outputs, length);
    start += length;
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * length);
}

// The utility's matrix loop without the framework: output = matrix x input, in double.
void BM_Reference_MatrixGain(benchmark::State& state, int32_t length) {
  KStereoBlock block(length);
  double m[4] = {0.9, 0.1, 0.2, 0.8};
  benchmark::DoNotOptimize(m);
  for (auto _ : state) {
    for (int32_t i = 0; i < length; ++i) {
      const double l = block.left[static_cast<size_t>(i)], r = block.right[static_cast<size_t>(i)];
      block.outLeft[static_cast<size_t>(i)] = static_cast<float>(m[0] * l + m[1] * r);
      block.outRight[static_cast<size_t>(i)] = static_cast<float>(m[2] * l + m[3] * r);
    }
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * length);
}

// A stereo effect that does nothing at all: what remains is the framework's own work.
class KIdlePlugin final : public KAudioPlugin {
public:
  KIdlePlugin() : KAudioPlugin(kTable, {1, 1, false, false, false}) {}

protected:
  void Process(const float* const*, float* const*, int32_t) override {}

private:
  static inline const KNumberKind kKind{0.0, 1.0, "", "{0.00}"};
  static constexpr KParameterInfo kTable[] = {{"p", "Parameter", &kKind, 0.0, KParameterInfo::kAutomatable}};
};

void BM_OverheadPerBlock(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KIdlePlugin plugin;
  KStereoBlock block(length);
  for (auto _ : state) {
    plugin.ProcessHostBlock(block.inputs, block.outputs, length);
    benchmark::ClobberMemory();
  }
}

// One ramp with corners evenly spread over a 1024-sample block: range(0) sub-blocks.
void BM_OverheadPerSubBlock(benchmark::State& state) {
  constexpr int32_t kLength = 1024;
  const auto subBlocks = static_cast<int32_t>(state.range(0));
  KIdlePlugin plugin;
  KStereoBlock block(kLength);
  std::vector<Point> points;
  for (int32_t k = 0; k <= subBlocks; ++k) points.push_back({k * kLength / subBlocks, (k % 2) * 0.5});
  for (auto _ : state) {
    plugin.AddRamp(0, points, false);
    plugin.ProcessHostBlock(block.inputs, block.outputs, kLength);
    benchmark::ClobberMemory();
  }
}

const bool kRegistered = [] {
  for (int32_t length : kBlockSizes) {
    const std::string size = std::to_string(length);
    benchmark::RegisterBenchmark(("BM_Reference_MatrixGain/" + size).c_str(), BM_Reference_MatrixGain, length);
    for (int32_t ramps : kRampCounts)
      benchmark::RegisterBenchmark(("BM_ProcessUtility/" + size + "/ramps:" + std::to_string(ramps)).c_str(),
                                   BM_ProcessUtility, length, ramps);
    benchmark::RegisterBenchmark(("BM_ProcessUtilityHostRamp/" + size).c_str(), BM_ProcessUtilityHostRamp, length);
  }
  return true;
}();
}  // namespace

BENCHMARK(BM_OverheadPerBlock)->ArgName("block")->Arg(1)->Arg(8)->Arg(32)->Arg(64)->Arg(256)->Arg(1024)->Arg(4096);
BENCHMARK(BM_OverheadPerSubBlock)->ArgName("subblocks")->Arg(1)->Arg(2)->Arg(4)->Arg(8)->Arg(16)->Arg(32)->Arg(63);
