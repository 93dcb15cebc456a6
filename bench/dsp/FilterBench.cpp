#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"

namespace {

constexpr int32_t kBlock = 512;
constexpr double kRate = 48000.0;

// An equalizer's worth of sections: bells spread over the band.
std::vector<KFilterSection> Equalizer(int32_t count) {
  std::vector<KFilterSection> sections(static_cast<size_t>(count));
  for (int32_t j = 0; j < count; ++j) {
    const double hz = 60.0 * std::pow(2.0, j);
    sections[static_cast<size_t>(j)].Design(KFilterSection::kPeak, j % 2 ? 4.0 : -4.0, hz, kRate, 1.2);
  }
  return sections;
}

// Input and output blocks for `channels` channels; the input is a sum of two sines.
struct Blocks {
  explicit Blocks(int32_t channels) : in(static_cast<size_t>(channels), std::vector<float>(kBlock)), out(in) {
    for (size_t c = 0; c < in.size(); ++c) {
      for (size_t i = 0; i < in[c].size(); ++i) {
        const double t = static_cast<double>(i);
        in[c][i] = static_cast<float>(0.5 * std::sin(0.01 * t + static_cast<double>(c)) + 0.3 * std::sin(0.37 * t));
      }
      inputs.push_back(in[c].data());
      outputs.push_back(out[c].data());
    }
  }
  std::vector<std::vector<float>> in, out;
  std::vector<const float*> inputs;
  std::vector<float*> outputs;
};

void Report(benchmark::State& state, int32_t channels) {
  state.SetItemsProcessed(state.iterations() * kBlock * channels);  // samples of one channel
  KCountPerSampleChannel(state, static_cast<int64_t>(kBlock) * channels);
}

void BM_SectionRunner(benchmark::State& state) {
  const auto channels = static_cast<int32_t>(state.range(0)), count = static_cast<int32_t>(state.range(1));
  const std::vector<KFilterSection> sections = Equalizer(count);
  KSectionRunner runner;
  runner.SetSections(sections.data(), count);
  Blocks blocks(channels);
  for (auto _ : state) {
    runner.Process(blocks.inputs.data(), blocks.outputs.data(), channels, kBlock);
    benchmark::ClobberMemory();
  }
  Report(state, channels);
}

// The plain way: one direct-form section object per channel and band, run sample by sample.
struct PlainBiquad {
  double b0, b1, b2, a1, a2;
  double x1 = 0.0, x2 = 0.0, y1 = 0.0, y2 = 0.0;

  double Run(double x) {
    const double y = b0 * x + b1 * x1 + b2 * x2 - a1 * y1 - a2 * y2;
    x2 = x1;
    x1 = x;
    y2 = y1;
    y1 = y;
    return y;
  }
};

void BM_SectionReference(benchmark::State& state) {
  const auto channels = static_cast<int32_t>(state.range(0)), count = static_cast<int32_t>(state.range(1));
  std::vector<std::vector<PlainBiquad>> filters(static_cast<size_t>(channels));
  for (auto& bands : filters) {
    for (const KFilterSection& s : Equalizer(count)) bands.push_back({s.b0, s.b1, s.b2, -s.minusA1, -s.minusA2});
  }
  Blocks blocks(channels);
  for (auto _ : state) {
    for (int32_t c = 0; c < channels; ++c) {
      std::vector<PlainBiquad>& bands = filters[static_cast<size_t>(c)];
      for (int32_t i = 0; i < kBlock; ++i) {
        double x = blocks.inputs[static_cast<size_t>(c)][i];
        for (PlainBiquad& band : bands) x = band.Run(x);
        blocks.outputs[static_cast<size_t>(c)][i] = static_cast<float>(x);
      }
    }
    benchmark::ClobberMemory();
  }
  Report(state, channels);
}

void Shapes(benchmark::internal::Benchmark* b) {
  for (int64_t channels : {1, 2, 8}) {
    for (int64_t sections : {1, 8}) b->Args({channels, sections});
  }
  b->ArgNames({"channels", "sections"});
}
BENCHMARK(BM_SectionRunner)->Apply(Shapes);
BENCHMARK(BM_SectionReference)->Apply(Shapes);

// One design per iteration at a frequency that moves, so that nothing is folded away.
void BM_Design(benchmark::State& state) {
  const auto type = static_cast<int32_t>(state.range(0));
  KFilterSection section;
  double hz = 100.0;
  for (auto _ : state) {
    hz = hz < 20000.0 ? hz * 1.01 : 100.0;
    section.Design(type, 6.0, hz, kRate, 0.9);
    benchmark::DoNotOptimize(section);
  }
}
BENCHMARK(BM_Design)
    ->ArgName("type")
    ->Arg(KFilterSection::kPeak)
    ->Arg(KFilterSection::kMatchedPeak)
    ->Arg(KFilterSection::kLowShelf)
    ->Arg(KFilterSection::kOnePoleLowPass)
    ->Arg(KFilterSection::kBilinearLowPass);

// The least a second-order design must do: one sin and cos pair and one exp.
void BM_DesignFloor(benchmark::State& state) {
  double hz = 100.0;
  for (auto _ : state) {
    hz = hz < 20000.0 ? hz * 1.01 : 100.0;
    const double w = 6.283185307179586 * hz / kRate;
    benchmark::DoNotOptimize(std::sin(w) + std::cos(w) + std::exp(0.01 * hz));
  }
}
BENCHMARK(BM_DesignFloor);

}  // namespace
