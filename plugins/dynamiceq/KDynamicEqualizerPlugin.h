#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"
#include "kernel/KPluginDescription.h"

// A four-band dynamic equalizer: each band is a bell or shelf with a static gain, and a detector
// that listens to the band's own frequencies (a band-pass at its frequency and Q) moves the gain
// further while the band is louder than its threshold: one decibel for each decibel over it,
// up to the range (negative: cut when loud, positive: lift when loud).
//
// The detectors run at every sample; every kControlPeriod samples, counted from the last reset
// so that the host's block size changes nothing, the bands are designed anew and the section
// runner glides to the new coefficients over the period, so that the moving gains never click.
class KDynamicEqualizerPlugin final : public KAudioPlugin {
  static constexpr const char* kTypeNames[] = {"Bell", "Low shelf", "High shelf"};
  static inline const KListKind kTypeKind{kTypeNames};
  static inline const KSwitchKind kSwitch{};
  static inline const KFrequencyKind kFrequencyKind{20.0, 20000.0};
  static inline const KNumberKind kQKind{0.1, 10.0, "", "{0.2}", KValueCurve::kLogarithmic};
  static inline const KDecibelKind kGainKind{-24.0, 24.0};
  static inline const KDecibelKind kThresholdKind{-60.0, 0.0};
  static inline const KTimeKind kAttackKind{0.0005, 0.2};
  static inline const KTimeKind kReleaseKind{0.01, 2.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  enum Type : int32_t { kBell, kLowShelf, kHighShelf };
  static constexpr int32_t kBandCount = 4;
  // The rows of band b (0-based) are kFieldCount rows from Index(b, kEnable) on.
  enum BandField : int32_t { kEnable, kType, kFrequency, kQ, kGain, kThreshold, kRange, kFieldCount };
  static constexpr KParameterInfo kParameters[] = {
      {"band1enable", "Band 1 on", &kSwitch, 1.0, kAutomatable},
      {"band1type", "Band 1 type", &kTypeKind, kLowShelf, kAutomatable},
      {"band1freq", "Band 1 frequency", &kFrequencyKind, 120.0, kAutomatable},
      {"band1q", "Band 1 Q", &kQKind, 0.71, kAutomatable},
      {"band1gain", "Band 1 gain", &kGainKind, 0.0, kAutomatable},
      {"band1threshold", "Band 1 threshold", &kThresholdKind, -30.0, kAutomatable},
      {"band1range", "Band 1 range", &kGainKind, 0.0, kAutomatable},
      {"band2enable", "Band 2 on", &kSwitch, 1.0, kAutomatable},
      {"band2type", "Band 2 type", &kTypeKind, kBell, kAutomatable},
      {"band2freq", "Band 2 frequency", &kFrequencyKind, 500.0, kAutomatable},
      {"band2q", "Band 2 Q", &kQKind, 1.0, kAutomatable},
      {"band2gain", "Band 2 gain", &kGainKind, 0.0, kAutomatable},
      {"band2threshold", "Band 2 threshold", &kThresholdKind, -30.0, kAutomatable},
      {"band2range", "Band 2 range", &kGainKind, 0.0, kAutomatable},
      {"band3enable", "Band 3 on", &kSwitch, 1.0, kAutomatable},
      {"band3type", "Band 3 type", &kTypeKind, kBell, kAutomatable},
      {"band3freq", "Band 3 frequency", &kFrequencyKind, 3000.0, kAutomatable},
      {"band3q", "Band 3 Q", &kQKind, 2.0, kAutomatable},
      {"band3gain", "Band 3 gain", &kGainKind, 0.0, kAutomatable},
      {"band3threshold", "Band 3 threshold", &kThresholdKind, -30.0, kAutomatable},
      {"band3range", "Band 3 range", &kGainKind, -6.0, kAutomatable},
      {"band4enable", "Band 4 on", &kSwitch, 1.0, kAutomatable},
      {"band4type", "Band 4 type", &kTypeKind, kHighShelf, kAutomatable},
      {"band4freq", "Band 4 frequency", &kFrequencyKind, 8000.0, kAutomatable},
      {"band4q", "Band 4 Q", &kQKind, 0.71, kAutomatable},
      {"band4gain", "Band 4 gain", &kGainKind, 0.0, kAutomatable},
      {"band4threshold", "Band 4 threshold", &kThresholdKind, -30.0, kAutomatable},
      {"band4range", "Band 4 range", &kGainKind, 0.0, kAutomatable},
      {"attack", "Attack", &kAttackKind, 0.005, kAutomatable},
      {"release", "Release", &kReleaseKind, 0.12, kAutomatable},
      {"outputgain", "Output gain", &kGainKind, 0.0, kAutomatable},
  };
  static constexpr int32_t Index(int32_t band, BandField field) noexcept { return band * kFieldCount + field; }
  static constexpr int32_t kAttack = KParameterRow(kParameters, "attack");
  static constexpr int32_t kRelease = KParameterRow(kParameters, "release");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;
  static constexpr int32_t kControlPeriod = 32;

  KDynamicEqualizerPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // Band `band`'s design at its static gain plus `dynamicDb`, at the current sample rate.
  KFilterSection BandDesign(int32_t band, double dynamicDb) const noexcept;
  // The dynamic gain of band `band` for a detector level in dB.
  double DynamicDecibels(int32_t band, double levelDb) const noexcept;
  // The gain each band moved by at the latest control point, in dB (for tests and meters).
  double DynamicGain(int32_t band) const noexcept { return bands_[band].dynamicDb; }
  // The bands ringing at the deepest or highest gain their range allows, then the detectors'
  // release from full scale and one control period.
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // A band's detector: its band-pass, the filter's state per channel and the envelope.
  struct Band {
    bool on = false;
    KFilterSection listen;
    double s1[kChannels] = {}, s2[kChannels] = {};
    double envelope = 0.0;
    double dynamicDb = 0.0;
  };

  void Control(bool jump) noexcept;
  void Detect(const float* const* inputs, int32_t channels, int32_t n) noexcept;

  Band bands_[kBandCount];
  KSectionRunner runner_;
  double attack_ = 0.0, release_ = 0.0;
  int32_t untilControl_ = 0;
  bool jump_ = true;
  float clean_[kChannels][kMaxChunk] = {};
};

static_assert(KParameterRow(KDynamicEqualizerPlugin::kParameters, "band4range") ==
              KDynamicEqualizerPlugin::Index(3, KDynamicEqualizerPlugin::kRange));

extern const KPluginDescription kDynamicEqualizerDescription;
const KPluginHelp& KDynamicEqualizerHelp();
KEditorDescription KDynamicEqualizerEditor();
