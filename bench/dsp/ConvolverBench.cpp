#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <ctime>
#include <random>
#include <thread>
#include <vector>

#include "bench/SampleCounters.h"
#include "dsp/KConvolver.h"

#ifdef TORVANE_BENCH_ZITA
#include <zita-convolver.h>

#include <filesystem>
#include <fstream>
#include <string>
#endif
#ifdef TORVANE_BENCH_FFTW
#include <fftw3.h>
#include <kiss_fftr.h>
#endif

namespace {

constexpr int32_t kBlock = 64;
constexpr int32_t kRate = 48000;

// A room of `seconds`: noise under an exponential decay of 60 dB over its length, one per channel.
std::vector<float> Room(double seconds, uint32_t seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
  std::vector<float> taps(static_cast<size_t>(seconds * kRate));
  const double decay = std::log(1000.0) / static_cast<double>(taps.size());
  for (size_t k = 0; k < taps.size(); ++k) taps[k] = static_cast<float>(0.1 * std::exp(-decay * static_cast<double>(k))) * noise(random);
  return taps;
}

// Input that never repeats within a response's length: a fresh block of noise each time.
struct Signal {
  explicit Signal(int32_t channels) : blocks(static_cast<size_t>(channels), std::vector<float>(kBlock * 64)), out(blocks) {
    std::mt19937 random(7);
    std::uniform_real_distribution<float> noise(-0.5f, 0.5f);
    for (auto& channel : blocks)
      for (float& v : channel) v = noise(random);
  }
  const float* In(int32_t c, int64_t block) const { return blocks[static_cast<size_t>(c)].data() + (block % 64) * kBlock; }
  std::vector<std::vector<float>> blocks, out;
};

// The engine beside a plain direct-form loop (in double, as the head runs) on a short response,
// where the direct form is at its best.
void BM_ConvolverVersusDirect(benchmark::State& state) {
  const auto taps = static_cast<int32_t>(state.range(0));
  const std::vector<float> h = Room(taps / double(kRate), 1);
  KConvolver convolver;
  convolver.Load(h);
  Signal signal(1);
  std::vector<float> history(static_cast<size_t>(taps + kBlock), 0.0f);
  KTimePair(
      state, kBlock, [&](int64_t block) { convolver.Process(signal.In(0, block), signal.out[0].data(), kBlock); },
      [&](int64_t block) {
        std::copy(history.begin() + kBlock, history.end(), history.begin());
        std::copy_n(signal.In(0, block), kBlock, history.end() - kBlock);
        for (int32_t i = 0; i < kBlock; ++i) {
          const float* x = history.data() + taps + i;  // the newest sample this output sees
          double acc = 0.0;
          for (int32_t k = 0; k < taps; ++k) acc += static_cast<double>(h[static_cast<size_t>(k)]) * x[-k];
          signal.out[0][static_cast<size_t>(i)] = static_cast<float>(acc);
        }
      });
}
BENCHMARK(BM_ConvolverVersusDirect)->Arg(64)->Arg(256)->UseManualTime();

// A two-second stereo response at 64-sample blocks, two channels each with its own response.
struct StereoRoom {
  StereoRoom() {
    convolvers[0].Load(left);
    convolvers[1].Load(right);
  }
  void Process(int64_t block) {
    for (int32_t c = 0; c < 2; ++c) convolvers[c].Process(signal.In(c, block), signal.out[static_cast<size_t>(c)].data(), kBlock);
  }
  std::vector<float> left = Room(2.0, 2), right = Room(2.0, 3);
  KConvolver convolvers[2];
  Signal signal{2};
};

void BM_ConvolverStereoTwoSeconds(benchmark::State& state) {
  StereoRoom room;
  int64_t block = 0;
  for (auto _ : state) {
    room.Process(block++);
    benchmark::ClobberMemory();
  }
  KCountPerSampleChannel(state, 2 * kBlock);
}
BENCHMARK(BM_ConvolverStereoTwoSeconds);

// Processor time of the calling thread, in seconds: what a block costs, without the time other
// work on a shared machine takes from it.
double ThreadSeconds() {
  timespec now{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
  return static_cast<double>(now.tv_sec) + 1e-9 * static_cast<double>(now.tv_nsec);
}

// What each 64-sample block of the two-second stereo convolution costs, by its place in the
// period of the largest level's block: for each place the median over all periods run, then the
// dearest place ("block_max") against the mean of the places ("block_mean"). A level that does
// all its work in one block makes that place dear; spread work evens the places out.
void BM_ConvolverBlockCost(benchmark::State& state) {
  StereoRoom room;
  constexpr int32_t kPlaces = KConvolver::kLargestBlock / 2 / kBlock;
  std::vector<std::vector<double>> costs(kPlaces);
  for (auto& place : costs) place.reserve(static_cast<size_t>(state.max_iterations / kPlaces + 1));
  int64_t block = 0;
  for (auto _ : state) {
    const double start = ThreadSeconds();
    room.Process(block);
    benchmark::ClobberMemory();
    costs[static_cast<size_t>(block++ % kPlaces)].push_back(ThreadSeconds() - start);
  }
  double dearest = 0.0, sum = 0.0;
  for (auto& place : costs) {
    if (place.empty()) continue;
    std::nth_element(place.begin(), place.begin() + static_cast<ptrdiff_t>(place.size() / 2), place.end());
    const double median = place[place.size() / 2];
    dearest = std::max(dearest, median);
    sum += median;
  }
  state.counters["block_max"] = dearest;
  state.counters["block_mean"] = sum / kPlaces;
  state.counters["max_per_mean"] = dearest * kPlaces / sum;
}
BENCHMARK(BM_ConvolverBlockCost)->Iterations(64 * 300);

#ifdef TORVANE_BENCH_ZITA
// This process's threads, by id.
std::vector<int> Threads() {
  std::vector<int> ids;
  for (const auto& entry : std::filesystem::directory_iterator("/proc/self/task")) ids.push_back(std::stoi(entry.path().filename().string()));
  return ids;
}

// The threads among `ids` that are not asleep (or, with `gone`, that still exist).
size_t Busy(const std::vector<int>& ids, bool gone = false) {
  const std::vector<int> now = Threads();
  return static_cast<size_t>(std::count_if(ids.begin(), ids.end(), [&](int id) {
    if (std::find(now.begin(), now.end(), id) == now.end()) return false;
    if (gone) return true;
    std::ifstream stat("/proc/self/task/" + std::to_string(id) + "/stat");
    std::string text;
    std::getline(stat, text);
    const size_t name = text.rfind(')');  // the state follows the parenthesised name
    return name == std::string::npos || name + 2 >= text.size() || text[name + 2] != 'S';
  }));
}

// The same two-second stereo convolution by zita-convolver (GPL; only this benchmark links it),
// set up as its hosts do: 64-sample quantum and partitions from 64 to 8192. Its larger levels run
// in threads of their own; process(true) waits for them, so the wall time of a block counts all
// of its work. It delays its output by one quantum, where ours adds none.
//
// Each level's thread marks its level running only once it is first scheduled, and marks it
// stopped a moment before it last writes to it. A stop before a thread has started passes its
// level over, check_stop finds it stopped and cleanup frees it under the thread that is about to
// run on it: a heap corruption (or a thread waiting forever) whenever a run is short, as the
// benchmark's first, one-iteration run is, or the machine is busy. So nothing is processed before
// every thread it started is asleep on its semaphore, and nothing is freed before they are gone.
void BM_ConvolverVersusZita(benchmark::State& state) {
  StereoRoom room;
  std::vector<float>& left = room.left;
  std::vector<float>& right = room.right;
  Convproc zita;
  const std::vector<int> before = Threads();
  if (zita.configure(2, 2, static_cast<uint32_t>(left.size()), kBlock, Convproc::MINPART, Convproc::MAXPART, 0.0f) != 0 ||
      zita.impdata_create(0, 0, 1, left.data(), 0, static_cast<int32_t>(left.size())) != 0 ||
      zita.impdata_create(1, 1, 1, right.data(), 0, static_cast<int32_t>(right.size())) != 0 || zita.start_process(0, 0) != 0) {
    state.SkipWithError("zita-convolver refused the set-up");
    return;
  }
  std::vector<int> started;
  for (int id : Threads())
    if (std::find(before.begin(), before.end(), id) == before.end()) started.push_back(id);
  while (Busy(started) > 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  Signal& signal = room.signal;
  KTimePair(
      state, 2 * kBlock, [&](int64_t block) { room.Process(block); },
      [&](int64_t block) {
        for (uint32_t c = 0; c < 2; ++c) std::copy_n(signal.In(static_cast<int32_t>(c), block), kBlock, zita.inpdata(c));
        zita.process(true);
        for (uint32_t c = 0; c < 2; ++c) std::copy_n(zita.outdata(c), kBlock, signal.out[c].data());
      });
  zita.stop_process();
  while (Busy(started, true) > 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  if (!zita.check_stop()) state.SkipWithError("zita-convolver did not stop");
  zita.cleanup();
}
BENCHMARK(BM_ConvolverVersusZita)->UseManualTime();
#endif

#ifdef TORVANE_BENCH_FFTW
// The FFT behind the engine (kissfft, BSD licence) against FFTW (GPL, which rules it out of the
// kernel) on the real transforms the engine's levels run: twice 64 and twice 4096 samples.
void BM_KissFFTVersusFFTW(benchmark::State& state) {
  const auto size = static_cast<int32_t>(state.range(0));
  std::vector<float> time(static_cast<size_t>(size));
  std::mt19937 random(9);
  std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
  for (float& v : time) v = noise(random);
  std::vector<kiss_fft_cpx> kissOut(static_cast<size_t>(size / 2 + 1));
  kiss_fftr_cfg kiss = kiss_fftr_alloc(size, 0, nullptr, nullptr);
  fftwf_complex* fftwOut = fftwf_alloc_complex(static_cast<size_t>(size / 2 + 1));
  fftwf_plan plan = fftwf_plan_dft_r2c_1d(size, time.data(), fftwOut, FFTW_MEASURE);
  for (float& v : time) v = noise(random);  // planning may overwrite the input
  KTimePair(
      state, size, [&](int64_t) { kiss_fftr(kiss, time.data(), kissOut.data()); }, [&](int64_t) { fftwf_execute(plan); });
  fftwf_destroy_plan(plan);
  fftwf_free(fftwOut);
  kiss_fftr_free(kiss);
}
BENCHMARK(BM_KissFFTVersusFFTW)->Arg(128)->Arg(8192)->UseManualTime();
#endif

}  // namespace
