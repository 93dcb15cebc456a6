#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

// The state of a plug-in with 50 parameters: storing it and writing the text, reading the text
// and loading it, each beside a reference that moves the same 50 numbers without a settings
// tree (printing them as key="value" pairs with snprintf; parsing them back with strtod).
namespace {
constexpr int32_t kParameterCount = 50;

const KDecibelKind kGainKind(-60.0, 24.0);
const KFrequencyKind kFrequencyKind(20.0, 20000.0);
const KTimeKind kTimeKind(0.0001, 2.0);
const KRatioKind kRatioKind(1.0, 20.0);
const KValueKind* const kKinds[] = {&kGainKind, &kFrequencyKind, &kTimeKind, &kRatioKind};

// Keys "p00" to "p49", in static storage as a parameter table needs them.
struct KTable {
  KTable() {
    for (int32_t i = 0; i < kParameterCount; ++i) {
      std::snprintf(keys[i], sizeof keys[i], "p%02d", i);
      const KValueKind* kind = kKinds[i % 4];
      rows[i] = {keys[i], keys[i], kind, kind->ToWorking(0.5), KParameterInfo::kAutomatable};
    }
  }
  char keys[kParameterCount][4];
  KParameterInfo rows[kParameterCount];
};
const KTable& Table() {
  static const KTable table;
  return table;
}

class KFiftyParameters final : public KAudioPlugin {
public:
  KFiftyParameters() : KAudioPlugin(Table().rows, Shape{1, 1, false, false, false}) {
    // Every value off its default, as in a session that was worked on.
    for (int32_t i = 0; i < ParameterCount(); ++i) GetParameter(i).SetNormalized(0.013 + 0.0191 * i);
    SetChannelMode(3);
  }

protected:
  void Process(const float* const*, float* const*, int32_t) override {}
};

void Report(benchmark::State& state, size_t bytes) {
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes));
  state.counters["bytes"] = static_cast<double>(bytes);
}

std::string ReferenceText(const double (&values)[kParameterCount]) {
  std::string text;
  char item[40];
  for (int32_t i = 0; i < kParameterCount; ++i) {
    const int length = std::snprintf(item, sizeof item, " p%02d=\"%.17g\"", i, values[i]);
    text.append(item, static_cast<size_t>(length));
  }
  return text;
}

void BM_StateStoreWrite(benchmark::State& state) {
  KFiftyParameters plugin;
  size_t bytes = 0;
  for (auto _ : state) {
    std::string text = plugin.WriteState();
    bytes = text.size();
    benchmark::DoNotOptimize(text);
  }
  Report(state, bytes);
}

void BM_Reference_SnprintfWrite(benchmark::State& state) {
  KFiftyParameters plugin;
  size_t bytes = 0;
  for (auto _ : state) {
    double values[kParameterCount];
    for (int32_t i = 0; i < kParameterCount; ++i) values[i] = plugin.GetParameter(i).Working();
    std::string text = ReferenceText(values);
    bytes = text.size();
    benchmark::DoNotOptimize(text);
  }
  Report(state, bytes);
}

void BM_StateReadLoad(benchmark::State& state) {
  const std::string text = KFiftyParameters().WriteState();
  KFiftyParameters plugin;
  for (auto _ : state) {
    plugin.ReadState(text);
    benchmark::ClobberMemory();
  }
  Report(state, text.size());
}

void BM_Reference_StrtodRead(benchmark::State& state) {
  KFiftyParameters plugin;
  double values[kParameterCount];
  for (int32_t i = 0; i < kParameterCount; ++i) values[i] = plugin.GetParameter(i).Working();
  const std::string text = ReferenceText(values);
  for (auto _ : state) {
    const char* at = text.c_str();
    for (int32_t i = 0; i < kParameterCount; ++i) {
      at += 6;  // ' pNN="'
      char* end;
      plugin.GetParameter(i).SetWorking(std::strtod(at, &end));
      at = end + 1;
    }
    benchmark::ClobberMemory();
  }
  Report(state, text.size());
}
}  // namespace

BENCHMARK(BM_StateStoreWrite)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Reference_SnprintfWrite)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_StateReadLoad)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Reference_StrtodRead)->Unit(benchmark::kMicrosecond);
