#include "plugins/multiband/KMultibandCompressorPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
// The crossovers' ringing counts until it is 100 dB down.
constexpr double kRingFall = 1e-5;

constexpr KFactoryPreset::Value kMasterGlue[] = {{"band1threshold", -18.0}, {"band1ratio", 2.0}, {"band2threshold", -20.0},
                                                 {"band2ratio", 1.5}, {"band3threshold", -22.0}, {"band3ratio", 2.0}};
constexpr KFactoryPreset::Value kDeEsser[] = {{"bands", 2.0}, {"crossover1", 5500.0}, {"band1ratio", 1.0},
                                              {"band2threshold", -30.0}, {"band2ratio", 8.0}, {"band2attack", 0.001},
                                              {"band2release", 0.05}};
constexpr KFactoryPreset::Value kBassControl[] = {{"bands", 2.0}, {"crossover1", 150.0}, {"band1threshold", -28.0},
                                                  {"band1ratio", 5.0}, {"band1gain", 3.0}, {"band2ratio", 1.0}};
constexpr KFactoryPreset::Value kFourBandMaster[] = {{"bands", 4.0}, {"crossover1", 120.0}, {"crossover2", 1000.0},
                                                     {"crossover3", 6000.0}, {"band4ratio", 2.0}, {"outputgain", 2.0}};
constexpr KFactoryPreset kPresets[] = {
    {"Master glue", kMasterGlue}, {"De-esser", kDeEsser}, {"Bass control", kBassControl}, {"Four-band master", kFourBandMaster}};
}  // namespace

constinit const KPluginDescription kMultibandCompressorDescription{
    .key = "KMultibandCompressorPlugin",
    .factory = &KMultibandCompressorPlugin::Create,
    .moduleKey = "MultibandCompressor",
    .category = "Dynamics",
    .name = "MultibandCompressor",
    .vst3SubCategories = "Fx|Dynamics",
    .vst2Id = "TvMC",
    .identity = "KMultibandCompressorPlugin",
    .help = &KMultibandCompressorHelp,
    .editor = &KMultibandCompressorEditor,
    .presets = kPresets,
};

KMultibandCompressorPlugin::KMultibandCompressorPlugin() : KAudioPlugin(kParameters, kShape) {
  splitter_.Prepare(kMaxChunk);
  for (KDynamicsProcessor& engine : engines_) engine.Prepare(kChannels, kMaxChunk);
}

KAudioPlugin* KMultibandCompressorPlugin::Create(KModule*, const KPluginRecord*) { return new KMultibandCompressorPlugin; }

int32_t KMultibandCompressorPlugin::BandCount() const noexcept {
  return static_cast<int32_t>(GetParameter(kBands).Working());
}

KDynamicsSettings KMultibandCompressorPlugin::BandSettings(int32_t band) const noexcept {
  auto value = [this, band](BandField field) { return GetParameter(BandRow(band, field)).Working(); };
  KDynamicsSettings s;
  s.threshold = KDecibelsToLinear(value(kThreshold));
  s.ratio = value(kRatio);
  s.attack = value(kAttack);
  s.release = value(kRelease);
  s.outputGainDb = value(kGain);
  s.kneeMode = KTransferCurve::kSoftKnee;
  s.sampleRate = SampleRate();
  return s;
}

void KMultibandCompressorPlugin::Design(KMultibandSplitter& splitter) const noexcept {
  double crossovers[kMaxBands - 1];
  for (int32_t k = 0; k < kMaxBands - 1; ++k) crossovers[k] = GetParameter(kCrossover1 + k).Working();
  splitter.SetCrossovers(crossovers, BandCount(), SampleRate());
}

uint32_t KMultibandCompressorPlugin::TailSamples() const noexcept {
  KMultibandSplitter splitter;
  Design(splitter);
  uint32_t rest = 0;
  for (int32_t b = 0; b < BandCount(); ++b) {
    KDynamicsProcessor engine;
    engine.Update(BandSettings(b));
    rest = std::max(rest, engine.ReleaseSamples());
  }
  return splitter.RingSamples(kRingFall) + rest;
}

void KMultibandCompressorPlugin::ProcessUpdate() {
  Design(splitter_);
  for (int32_t b = 0; b < kMaxBands; ++b) engines_[b].Update(BandSettings(b));
  output_ = KDecibelsToLinear(GetParameter(kOutputGain).Working());
}

void KMultibandCompressorPlugin::ResetState() {
  splitter_.Reset();
  for (KDynamicsProcessor& engine : engines_) engine.Reset();
}

void KMultibandCompressorPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  const int32_t bands = splitter_.BandCount();
  for (int32_t c = 0; c < channels; ++c) {
    // A NaN or infinity passes as silence: no filter or detector ever holds one.
    for (int32_t i = 0; i < sampleCount; ++i) clean_[c][i] = std::isfinite(inputs[c][i]) ? inputs[c][i] : 0.0f;
    float* split[kMaxBands];
    for (int32_t b = 0; b < bands; ++b) split[b] = bands_[b][c];
    splitter_.Process(c, clean_[c], split, sampleCount);
  }
  float lowest = 1.0f;
  for (int32_t b = 0; b < bands; ++b) {
    float* band[kChannels] = {bands_[b][0], bands_[b][1]};
    engines_[b].Process(sampleCount, band, band, nullptr, channels);
    lowest = std::min(lowest, engines_[b].LowestGain() / static_cast<float>(engines_[b].Transfer().TotalGain()));
  }
  for (int32_t c = 0; c < channels; ++c) {
    float* out = outputs[c];
    for (int32_t i = 0; i < sampleCount; ++i) {
      double sum = 0.0;
      for (int32_t b = 0; b < bands; ++b) sum += bands_[b][c][i];
      out[i] = static_cast<float>(output_ * sum);
    }
  }
  reduction_.store(lowest < 1.0f ? static_cast<float>(std::max(KLinearToDecibels(lowest), -200.0)) : 0.0f,
                   std::memory_order_relaxed);
}
