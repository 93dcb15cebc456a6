#include <benchmark/benchmark.h>
#include <xmmintrin.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

#include "bench/SampleCounters.h"
#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "dsp/KDynamicsProcessor.h"
#include "dsp/KFilterSection.h"
#include "dsp/KHalfBandOversampler.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/equalizer/KEqualizerPlugin.h"
#include "plugins/warmer/KSampleWarmer.h"

// The product's plug-ins through ProcessHostBlock, each beside a plain reference of the same
// arithmetic in the same run, so that the report reads as a ratio: what the processing cycle and
// the plug-in's own bookkeeping cost on top of the signal processing itself. One benchmark
// function per measurement; the counter "realtime" is seconds of 48 kHz audio per second of
// processing.
namespace {
constexpr double kRate = 48000.0;

// One second of stereo that swells across the compressor's threshold and back, with the same
// again on the side-chain bus; host blocks are taken from it in turn.
struct KSignal {
  static constexpr int32_t kLength = 48000;
  KSignal() : channels(4, std::vector<float>(kLength)) {
    for (int32_t i = 0; i < kLength; ++i) {
      const double swell = 0.5 + 0.5 * std::sin(6.283185307179586 * 3.0 * i / kLength);
      for (size_t c = 0; c < channels.size(); ++c)
        channels[c][static_cast<size_t>(i)] =
            static_cast<float>(swell * (0.7 * std::sin(0.057 * i + c) + 0.2 * std::sin(0.31 * i)));
    }
  }
  // Pointers to block `k` of `length` samples.
  void Block(int64_t k, int32_t length, const float* (&in)[4]) const {
    const auto at = static_cast<size_t>(k * length % (kLength - length));
    for (size_t c = 0; c < 4; ++c) in[c] = channels[c].data() + at;
  }
  std::vector<std::vector<float>> channels;
};

struct KStereoOut {
  explicit KStereoOut(int32_t length) : left(static_cast<size_t>(length)), right(left) {}
  std::vector<float> left, right;
  float* outputs[2] = {left.data(), right.data()};
};

void Report(benchmark::State& state, int32_t length) {
  state.SetItemsProcessed(state.iterations() * length);
  const double seconds = static_cast<double>(state.iterations()) * length / kRate;
  state.counters["realtime"] = benchmark::Counter(seconds, benchmark::Counter::kIsRate);
}

// Hosts run their audio threads with denormals flushed to zero; so do these benchmarks, both
// sides of every pair alike.
class KAudioThread {
public:
  KAudioThread() noexcept : saved_(_mm_getcsr()) { _mm_setcsr(saved_ | 0x8040); }
  ~KAudioThread() { _mm_setcsr(saved_); }

private:
  unsigned saved_;
};

// Host blocks of `length` samples of the shared signal through a plug-in, as a host would call it.
void RunHostBlocks(benchmark::State& state, KAudioPlugin& plugin, int32_t length) {
  const KAudioThread thread;
  const KSignal signal;
  KStereoOut out(length);
  const float* in[4];
  int64_t k = 0;
  for (auto _ : state) {
    signal.Block(k++, length, in);
    plugin.ProcessHostBlock(in, out.outputs, length);
    benchmark::ClobberMemory();
  }
  Report(state, length);
}

// A working setting: 4:1 from −10 dB with a soft knee, channels linked.
void SetUpCompressor(KCompressorPlugin& plugin) {
  plugin.SetSampleRate(kRate);
  plugin.GetParameter(KCompressorPlugin::kThreshold).SetWorking(0.3);
  plugin.GetParameter(KCompressorPlugin::kRatio).SetWorking(4.0);
  plugin.GetParameter(KCompressorPlugin::kKneeMode).SetWorking(KTransferCurve::kSoftKnee);
}

void BM_CompressorHostBlock(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KCompressorPlugin plugin;
  SetUpCompressor(plugin);
  RunHostBlocks(state, plugin, length);
}
BENCHMARK(BM_CompressorHostBlock)->ArgName("block")->Arg(64)->Arg(512);

// The compressor's engine with the plug-in's working setting, prepared for `length`-sample calls.
void SetUpEngine(KDynamicsProcessor& engine, int32_t length) {
  engine.Prepare(2, length);
  KDynamicsSettings settings;
  settings.threshold = 0.3;
  settings.ratio = 4.0;
  settings.kneeMode = KTransferCurve::kSoftKnee;
  settings.sampleRate = kRate;
  engine.Update(settings);
}

// The same engine with the same settings, called directly.
void BM_CompressorReference(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KDynamicsProcessor engine;
  SetUpEngine(engine, length);
  const KSignal signal;
  KStereoOut out(length);
  const float* in[4];
  int64_t k = 0;
  const KAudioThread thread;
  for (auto _ : state) {
    signal.Block(k++, length, in);
    engine.Process(length, in, out.outputs, nullptr, 2);
    benchmark::ClobberMemory();
  }
  Report(state, length);
}
BENCHMARK(BM_CompressorReference)->ArgName("block")->Arg(64)->Arg(512);

// The two above in one loop: sixteen host blocks through the plug-in, then the same sixteen
// through the engine alone, in turn, so that both meet the same clock speed and neighbours and
// the clock's own cost is spread thin. "cycle_over_engine" is the plug-in's time over the
// engine's: what the processing cycle, the meters and the gain staging add. Both write the same
// samples ("max_difference" 0 over the last block), so they do the same work.
void BM_CompressorCycleOverEngine(benchmark::State& state) {
  constexpr int32_t kBatch = 16;
  const auto length = static_cast<int32_t>(state.range(0));
  KCompressorPlugin plugin;
  SetUpCompressor(plugin);
  KDynamicsProcessor engine;
  SetUpEngine(engine, length);
  const KSignal signal;
  KStereoOut cycle(length), alone(length);
  const float* in[4];
  const KAudioThread thread;
  KTimePair(
      state, int64_t{2} * kBatch * length,
      [&](int64_t batch) {
        for (int64_t k = batch * kBatch; k < (batch + 1) * kBatch; ++k) {
          signal.Block(k, length, in);
          plugin.ProcessHostBlock(in, cycle.outputs, length);
        }
      },
      [&](int64_t batch) {
        for (int64_t k = batch * kBatch; k < (batch + 1) * kBatch; ++k) {
          signal.Block(k, length, in);
          engine.Process(length, in, alone.outputs, nullptr, 2);
        }
      });
  state.counters["cycle_over_engine"] = 1.0 / state.counters["ratio"];
  // Both hold the last block now, out of the timed turns.
  state.counters["max_difference"] = KLargestDifference(cycle.outputs, alone.outputs, 2, length);
}
BENCHMARK(BM_CompressorCycleOverEngine)->ArgName("block")->Arg(64)->Arg(512)->UseManualTime();

// Ten minutes of stereo at 48 kHz in 64-sample host blocks, in one go.
void BM_CompressorTenMinutes(benchmark::State& state) {
  constexpr int32_t kBlock = 64;
  constexpr int64_t kBlocks = static_cast<int64_t>(600 * kRate) / kBlock;
  KCompressorPlugin plugin;
  SetUpCompressor(plugin);
  const KSignal signal;
  KStereoOut out(kBlock);
  const float* in[4];
  for (auto _ : state) {
    for (int64_t k = 0; k < kBlocks; ++k) {
      signal.Block(k, kBlock, in);
      plugin.ProcessHostBlock(in, out.outputs, kBlock);
      benchmark::ClobberMemory();
    }
  }
  const double seconds = static_cast<double>(state.iterations()) * 600.0;
  state.counters["realtime"] = benchmark::Counter(seconds, benchmark::Counter::kIsRate);
}
BENCHMARK(BM_CompressorTenMinutes)->Iterations(3)->Unit(benchmark::kMillisecond);

// Eight bands, each boosting or cutting, all in the cascade.
void SetUpEqualizer(KEqualizerPlugin& plugin) {
  plugin.SetSampleRate(kRate);
  for (int32_t band = 0; band < KEqualizerPlugin::kBandCount; ++band)
    plugin.GetParameter(KEqualizerPlugin::Index(band, KEqualizerPlugin::kGain)).SetWorking(band % 2 == 0 ? 4.0 : -3.0);
}

void BM_EqualizerHostBlock(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KEqualizerPlugin plugin;
  SetUpEqualizer(plugin);
  RunHostBlocks(state, plugin, length);
}
BENCHMARK(BM_EqualizerHostBlock)->ArgName("block")->Arg(512);

// The plain way: the plug-in's eight designs as biquads in transposed direct form II, in
// double, one channel after the other.
void BM_EqualizerReference(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KEqualizerPlugin designs;
  SetUpEqualizer(designs);
  const KSignal signal;
  KStereoOut out(length);
  const float* in[4];
  {
    const float* first[4];
    signal.Block(0, length, first);
    designs.ProcessHostBlock(first, out.outputs, length);  // lets the plug-in design its bands
  }
  double k[KEqualizerPlugin::kBandCount][5];
  for (int32_t b = 0; b < KEqualizerPlugin::kBandCount; ++b) {
    const KFilterSection& s = designs.BandDesign(b);
    const double row[5] = {s.b0, s.b1, s.b2, s.minusA1, s.minusA2};
    std::copy(std::begin(row), std::end(row), std::begin(k[b]));
  }
  double s1[2][KEqualizerPlugin::kBandCount] = {}, s2[2][KEqualizerPlugin::kBandCount] = {};
  int64_t n = 0;
  for (auto _ : state) {
    signal.Block(n++, length, in);
    for (size_t c = 0; c < 2; ++c) {
      for (int32_t i = 0; i < length; ++i) {
        double x = in[c][i];
        for (int32_t b = 0; b < KEqualizerPlugin::kBandCount; ++b) {
          const double y = k[b][0] * x + s1[c][b];
          s1[c][b] = k[b][1] * x + s2[c][b] + k[b][3] * y;
          s2[c][b] = k[b][2] * x + k[b][4] * y;
          x = y;
        }
        out.outputs[c][i] = static_cast<float>(x);
      }
    }
    benchmark::ClobberMemory();
  }
  Report(state, length);
}
BENCHMARK(BM_EqualizerReference)->ArgName("block")->Arg(512);
}  // namespace

namespace {
// The saturator at 48 kHz (4x oversampling) with a working setting, for each curve.
void SetUpWarmer(KSampleWarmer& plugin, int32_t shape) {
  plugin.SetSampleRate(kRate);
  plugin.GetParameter(KSampleWarmer::kDrive).SetWorking(12.0);
  plugin.GetParameter(KSampleWarmer::kShape).SetWorking(shape);
  plugin.GetParameter(KSampleWarmer::kTone).SetWorking(30.0);
}

void BM_WarmerHostBlock(benchmark::State& state) {
  constexpr int32_t kLength = 512;
  KSampleWarmer plugin;
  SetUpWarmer(plugin, static_cast<int32_t>(state.range(0)));
  RunHostBlocks(state, plugin, kLength);
  KCountPerSampleChannel(state, 2 * kLength);
}
BENCHMARK(BM_WarmerHostBlock)->ArgName("shape")->DenseRange(0, KSampleWarmer::kShapeCount - 1);

// One doubling's half-band low-pass as its full FIR of 4·pairs − 1 taps, zeros and all, designed
// as KHalfBandOversampler designs it: a Kaiser-windowed sinc with the taps beside the centre's 1/2
// scaled to sum to 1/4; `gain` 2 makes the interpolator's taps.
std::vector<double> FullHalfBand(int32_t pairs, double beta, double gain) {
  const auto bessel = [](double x) {  // I0, by its power series
    double sum = 1.0, term = 1.0;
    for (int k = 1; k < 100 && term > 1e-17 * sum; ++k) sum += term *= (x / (2.0 * k)) * (x / (2.0 * k));
    return sum;
  };
  std::vector<double> taps(static_cast<size_t>(4 * pairs - 1));
  const auto centre = static_cast<size_t>(2 * pairs - 1);
  double sum = 0.0;
  for (int32_t j = 0; j < pairs; ++j) {
    const double offset = 2.0 * j + 1.0, r = offset / (2.0 * pairs);
    const double window = bessel(beta * std::sqrt(1.0 - r * r)) / bessel(beta);
    const double tap = (j % 2 == 0 ? 1.0 : -1.0) / (3.141592653589793 * offset) * window;
    taps[centre + 2 * j + 1] = taps[centre - 2 * j - 1] = tap;
    sum += tap;
  }
  for (double& tap : taps) tap = tap * (0.25 / sum) * gain;
  taps[centre] = gain * 0.5;
  return taps;
}

// A full FIR computing every output; the last taps − 1 samples of the stream wait before each block.
struct KPlainFir {
  KPlainFir(std::vector<double> h, size_t longest) : taps(std::move(h)), line(taps.size() - 1 + longest) {}
  void Run(const double* in, double* out, size_t n) {  // `out` may be `in`
    const size_t past = taps.size() - 1;
    std::copy(in, in + n, line.begin() + static_cast<std::ptrdiff_t>(past));
    for (size_t i = 0; i < n; ++i) {
      double y = 0.0;
      for (size_t k = 0; k <= past; ++k) y += taps[k] * line[i + past - k];
      out[i] = y;
    }
    std::copy_n(line.begin() + static_cast<std::ptrdiff_t>(n), past, line.begin());
  }
  std::vector<double> taps, line;
};

// One channel of the saturator at 4x written plainly: each doubling zero-stuffs and runs its full
// FIR over every sample; the curve is looked up by shape for every sample and run on it alone;
// each halving runs its full FIR for every sample and keeps every second output (the phases
// KHalfBandOversampler takes at 4x: the inner halving keeps the first of each pair, the outer
// one the second, which makes the round trip a whole number of base samples).
struct KPlainSaturator {
  static constexpr double kOuterBeta = 8.44, kInnerBeta = 10.09;  // KHalfBandOversampler's windows
  explicit KPlainSaturator(size_t longest)
      : outerUp(FullHalfBand(KHalfBandOversampler::kOuterPairs, kOuterBeta, 2.0), 2 * longest),
        innerUp(FullHalfBand(KHalfBandOversampler::kInnerPairs, kInnerBeta, 2.0), 4 * longest),
        innerDown(FullHalfBand(KHalfBandOversampler::kInnerPairs, kInnerBeta, 1.0), 4 * longest),
        outerDown(FullHalfBand(KHalfBandOversampler::kOuterPairs, kOuterBeta, 1.0), 2 * longest),
        middle(2 * longest), high(4 * longest) {}
  void Run(const float* in, float* out, size_t n, double drive, int32_t shape) {
    for (size_t i = 0; i < 2 * n; ++i) middle[i] = i % 2 == 0 ? drive * in[i / 2] : 0.0;
    outerUp.Run(middle.data(), middle.data(), 2 * n);
    for (size_t i = 0; i < 4 * n; ++i) high[i] = i % 2 == 0 ? middle[i / 2] : 0.0;
    innerUp.Run(high.data(), high.data(), 4 * n);
    for (size_t i = 0; i < 4 * n; ++i) KSampleWarmer::CurveOf(shape)(&high[i], 1);
    innerDown.Run(high.data(), high.data(), 4 * n);
    for (size_t i = 0; i < 2 * n; ++i) middle[i] = high[2 * i];
    outerDown.Run(middle.data(), middle.data(), 2 * n);
    for (size_t i = 0; i < n; ++i) out[i] = static_cast<float>(middle[2 * i + 1]);
  }
  KPlainFir outerUp, innerUp, innerDown, outerDown;
  std::vector<double> middle, high;
};

// Drive, the curve at 4x through KHalfBandOversampler and back, per shape: the saturator's own
// arithmetic (KSampleWarmer::ProcessPiece without tilt, delay and mix) beside KPlainSaturator, a
// block of each in turn. "max_difference" is the largest difference between their outputs.
void BM_WarmerOversampled(benchmark::State& state) {
  constexpr int32_t kLength = 512, kFactor = 4;
  const auto shape = static_cast<int32_t>(state.range(0));
  const KSampleWarmer::Curve curve = KSampleWarmer::CurveOf(shape);
  const double drive = std::pow(10.0, 12.0 / 20.0);
  const KSignal signal;
  KStereoOut hot(kLength), plain(kLength);
  KHalfBandOversampler oversamplers[2] = {KHalfBandOversampler(kFactor), KHalfBandOversampler(kFactor)};
  KPlainSaturator plainChannels[2] = {KPlainSaturator(kLength), KPlainSaturator(kLength)};
  double base[kLength], high[kFactor * kLength];
  const float* in[4];
  KTimePair(
      state, 2 * kLength,
      [&](int64_t k) {
        signal.Block(k, kLength, in);
        for (size_t c = 0; c < 2; ++c) {
          for (int32_t i = 0; i < kLength; ++i) base[i] = drive * in[c][i];
          oversamplers[c].Up(base, high, kLength);
          curve(high, kFactor * kLength);
          oversamplers[c].Down(high, base, kLength);
          for (int32_t i = 0; i < kLength; ++i) hot.outputs[c][i] = static_cast<float>(base[i]);
        }
      },
      [&](int64_t k) {
        signal.Block(k, kLength, in);
        for (size_t c = 0; c < 2; ++c) plainChannels[c].Run(in[c], plain.outputs[c], kLength, drive, shape);
      });
  state.counters["max_difference"] = KLargestDifference(hot.outputs, plain.outputs, 2, kLength);
}
BENCHMARK(BM_WarmerOversampled)->ArgName("shape")->DenseRange(0, KSampleWarmer::kShapeCount - 1)->UseManualTime();
}  // namespace
