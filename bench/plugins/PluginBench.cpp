#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "dsp/KDynamicsProcessor.h"
#include "dsp/KFilterSection.h"
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
BENCHMARK(BM_CompressorHostBlock)->ArgName("block")->Arg(64)->Arg(512);

// The same engine with the same settings, called directly.
void BM_CompressorReference(benchmark::State& state) {
  const auto length = static_cast<int32_t>(state.range(0));
  KDynamicsProcessor engine;
  engine.Prepare(2, length);
  KDynamicsSettings settings;
  settings.threshold = 0.3;
  settings.ratio = 4.0;
  settings.kneeMode = KTransferCurve::kSoftKnee;
  settings.sampleRate = kRate;
  engine.Update(settings);
  const KSignal signal;
  KStereoOut out(length);
  const float* in[4];
  int64_t k = 0;
  for (auto _ : state) {
    signal.Block(k++, length, in);
    engine.Process(length, in, out.outputs, nullptr, 2);
    benchmark::ClobberMemory();
  }
  Report(state, length);
}
BENCHMARK(BM_CompressorReference)->ArgName("block")->Arg(64)->Arg(512);

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
  const KSignal signal;
  KStereoOut out(kLength);
  const float* in[4];
  int64_t k = 0;
  for (auto _ : state) {
    signal.Block(k++, kLength, in);
    plugin.ProcessHostBlock(in, out.outputs, kLength);
    benchmark::ClobberMemory();
  }
  Report(state, kLength);
}
BENCHMARK(BM_WarmerHostBlock)->ArgName("shape")->DenseRange(0, KSampleWarmer::kShapeCount - 1);

// The plain way: the same drive and curve at the base rate, in a direct loop, without
// oversampling, tone or mix.
void BM_WarmerReference(benchmark::State& state) {
  constexpr int32_t kLength = 512;
  const KSampleWarmer::Curve curve = KSampleWarmer::CurveOf(static_cast<int32_t>(state.range(0)));
  const double drive = std::pow(10.0, 12.0 / 20.0);
  const KSignal signal;
  KStereoOut out(kLength);
  const float* in[4];
  double samples[kLength];
  int64_t k = 0;
  for (auto _ : state) {
    signal.Block(k++, kLength, in);
    for (size_t c = 0; c < 2; ++c) {
      for (int32_t i = 0; i < kLength; ++i) samples[i] = drive * in[c][i];
      curve(samples, kLength);
      for (int32_t i = 0; i < kLength; ++i) out.outputs[c][i] = static_cast<float>(samples[i]);
    }
    benchmark::ClobberMemory();
  }
  Report(state, kLength);
}
BENCHMARK(BM_WarmerReference)->ArgName("shape")->DenseRange(0, KSampleWarmer::kShapeCount - 1);
}  // namespace
