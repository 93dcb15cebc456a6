#include <benchmark/benchmark.h>

#include "kernel/KString.h"

static void BM_Placeholder(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(KString("x"));
}
BENCHMARK(BM_Placeholder);
