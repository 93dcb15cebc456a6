#pragma once

#include <benchmark/benchmark.h>

#include <chrono>
#include <cmath>
#include <cstdint>

// Counters that show what a sample of one channel costs. Their values are seconds, which the
// console shows with a prefix: "ns_per_sample_channel=1.52n" reads 1.52 ns.

// For a benchmark timed the usual way; `samples` counts one iteration's samples over all channels.
inline void KCountPerSampleChannel(benchmark::State& state, int64_t samples) {
  state.counters["ns_per_sample_channel"] = benchmark::Counter(
      static_cast<double>(samples), benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

// Times a hot path and its plain reference over the same blocks, one block of each in turn, so
// that both meet the same clock speed, caches and neighbours; the benchmark's own time is the hot
// path's (register with ->UseManualTime()). Each call gets the block number; `samples` counts a
// block's samples over all its channels. Reports the cost per sample of both and "ratio", how
// many times longer the reference takes.
// The counters of a timed pair: `count` samples over all channels took `hot` and `plain`
// seconds on the hot path and on the reference.
inline void KReportPair(benchmark::State& state, double count, double hot, double plain) {
  state.counters["ns_per_sample_channel"] = hot / count;
  state.counters["reference_ns_per_sample_channel"] = plain / count;
  state.counters["ratio"] = plain / hot;
}

template <class HotPath, class Reference>
void KTimePair(benchmark::State& state, int64_t samples, HotPath&& hotPath, Reference&& reference) {
  using Clock = std::chrono::steady_clock;
  Clock::duration hot{}, plain{};
  int64_t block = 0;
  for (auto _ : state) {
    const Clock::time_point start = Clock::now();
    hotPath(block);
    benchmark::ClobberMemory();
    const Clock::time_point middle = Clock::now();
    reference(block++);
    benchmark::ClobberMemory();
    const Clock::time_point end = Clock::now();
    state.SetIterationTime(std::chrono::duration<double>(middle - start).count());
    hot += middle - start;
    plain += end - middle;
  }
  const auto seconds = [](Clock::duration t) { return std::chrono::duration<double>(t).count(); };
  KReportPair(state, static_cast<double>(block * samples), seconds(hot), seconds(plain));
}

// The largest difference between two sets of channels, for a "max_difference" counter: NaN when
// either holds a NaN.
inline double KLargestDifference(const float* const* a, const float* const* b, int32_t channels, int32_t n) {
  double largest = 0.0;
  for (int32_t c = 0; c < channels; ++c) {
    for (int32_t i = 0; i < n; ++i) {
      const double difference = std::abs(static_cast<double>(a[c][i]) - b[c][i]);
      if (!(difference <= largest)) largest = difference;
    }
  }
  return largest;
}
