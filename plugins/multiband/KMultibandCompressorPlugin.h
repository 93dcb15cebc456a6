#pragma once

#include <atomic>
#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KDynamicsProcessor.h"
#include "dsp/KMultibandSplitter.h"
#include "kernel/KPluginDescription.h"

// A multiband compressor: the splitter cuts the signal into two to four bands whose sum is an
// all-pass of the input, each band runs through a compressor engine of its own, and the bands
// are added up again. With every band left uncompressed, the output has the input's magnitude
// at every frequency, only its phase turned at the crossovers.
class KMultibandCompressorPlugin final : public KAudioPlugin {
  static inline const KIntegerKind kBandsKind{2, 4};
  static inline const KFrequencyKind kCrossoverKind{40.0, 16000.0};
  static inline const KDecibelKind kThresholdKind{-60.0, 0.0};
  static inline const KRatioKind kRatioKind{1.0, 20.0};
  static inline const KTimeKind kAttackKind{0.0001, 0.5};
  static inline const KTimeKind kReleaseKind{0.005, 2.0};
  static inline const KDecibelKind kGainKind{-24.0, 24.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr int32_t kMaxBands = 4;
  // The rows of band b (0-based) are kFieldCount rows from BandRow(b, kThreshold) on.
  enum BandField : int32_t { kThreshold, kRatio, kAttack, kRelease, kGain, kFieldCount };
  static constexpr KParameterInfo kParameters[] = {
      {"bands", "Bands", &kBandsKind, 3.0, kAutomatable},
      {"crossover1", "Crossover 1", &kCrossoverKind, 200.0, kAutomatable},
      {"crossover2", "Crossover 2", &kCrossoverKind, 2000.0, kAutomatable},
      {"crossover3", "Crossover 3", &kCrossoverKind, 8000.0, kAutomatable},
      {"band1threshold", "Band 1 threshold", &kThresholdKind, -24.0, kAutomatable},
      {"band1ratio", "Band 1 ratio", &kRatioKind, 3.0, kAutomatable},
      {"band1attack", "Band 1 attack", &kAttackKind, 0.02, kAutomatable},
      {"band1release", "Band 1 release", &kReleaseKind, 0.2, kAutomatable},
      {"band1gain", "Band 1 gain", &kGainKind, 0.0, kAutomatable},
      {"band2threshold", "Band 2 threshold", &kThresholdKind, -24.0, kAutomatable},
      {"band2ratio", "Band 2 ratio", &kRatioKind, 3.0, kAutomatable},
      {"band2attack", "Band 2 attack", &kAttackKind, 0.01, kAutomatable},
      {"band2release", "Band 2 release", &kReleaseKind, 0.15, kAutomatable},
      {"band2gain", "Band 2 gain", &kGainKind, 0.0, kAutomatable},
      {"band3threshold", "Band 3 threshold", &kThresholdKind, -24.0, kAutomatable},
      {"band3ratio", "Band 3 ratio", &kRatioKind, 3.0, kAutomatable},
      {"band3attack", "Band 3 attack", &kAttackKind, 0.005, kAutomatable},
      {"band3release", "Band 3 release", &kReleaseKind, 0.1, kAutomatable},
      {"band3gain", "Band 3 gain", &kGainKind, 0.0, kAutomatable},
      {"band4threshold", "Band 4 threshold", &kThresholdKind, -24.0, kAutomatable},
      {"band4ratio", "Band 4 ratio", &kRatioKind, 3.0, kAutomatable},
      {"band4attack", "Band 4 attack", &kAttackKind, 0.003, kAutomatable},
      {"band4release", "Band 4 release", &kReleaseKind, 0.08, kAutomatable},
      {"band4gain", "Band 4 gain", &kGainKind, 0.0, kAutomatable},
      {"outputgain", "Output gain", &kGainKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kBands = KParameterRow(kParameters, "bands");
  static constexpr int32_t kCrossover1 = KParameterRow(kParameters, "crossover1");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t BandRow(int32_t band, BandField field) noexcept {
    return KParameterRow(kParameters, "band1threshold") + band * kFieldCount + field;
  }
  static constexpr int32_t kChannels = 2;

  KMultibandCompressorPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The crossovers' ringing, then the slowest band's detector coming to rest.
  uint32_t TailSamples() const noexcept override;
  // Deepest gain reduction of any band in the latest block, in dB (0 or below); any thread.
  float GainReductionDecibels() const noexcept { return reduction_.load(std::memory_order_relaxed); }
  const KMultibandSplitter& Splitter() const noexcept { return splitter_; }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  int32_t BandCount() const noexcept;
  KDynamicsSettings BandSettings(int32_t band) const noexcept;
  void Design(KMultibandSplitter& splitter) const noexcept;

  KMultibandSplitter splitter_;
  KDynamicsProcessor engines_[kMaxBands];
  double output_ = 1.0;
  float clean_[kChannels][kMaxChunk] = {};
  float bands_[kMaxBands][kChannels][kMaxChunk] = {};
  std::atomic<float> reduction_{0.0f};
};

extern const KPluginDescription kMultibandCompressorDescription;
const KPluginHelp& KMultibandCompressorHelp();
KEditorDescription KMultibandCompressorEditor();
