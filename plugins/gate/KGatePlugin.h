#pragma once

#include <atomic>
#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "kernel/KPluginDescription.h"

// A gate and downward expander. A peak detector (instant rise, falling with the release) reads
// the level; above the threshold the gain is unity, below it the level's distance from the
// threshold is multiplied by the ratio less one and taken away, down to the range. Once the
// level has fallen below the threshold the gate stays open for the hold time, then closes with
// the release; it opens with the attack. A ratio at its top acts as a gate: anything below the
// threshold drops straight to the range.
//
// The gain reaches its target exactly (it lands once it is within 1e-9), so that what passes
// the open gate comes out bit for bit.
class KGatePlugin final : public KAudioPlugin {
  static inline const KDecibelKind kThresholdKind{-80.0, 0.0};
  static inline const KRatioKind kRatioKind{1.0, 20.0};
  static inline const KDecibelKind kRangeKind{-90.0, 0.0};
  static inline const KTimeKind kAttackKind{0.00005, 0.1};
  static inline const KTimeKind kHoldKind{0.0, 0.5};
  static inline const KTimeKind kReleaseKind{0.005, 2.0};
  static inline const KSwitchKind kSwitch{};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"threshold", "Threshold", &kThresholdKind, -40.0, kAutomatable},
      {"ratio", "Ratio", &kRatioKind, 20.0, kAutomatable},
      {"range", "Range", &kRangeKind, -60.0, kAutomatable},
      {"attack", "Attack", &kAttackKind, 0.0005, kAutomatable},
      {"hold", "Hold", &kHoldKind, 0.02, kAutomatable},
      {"release", "Release", &kReleaseKind, 0.1, kAutomatable},
      {"linkchannels", "Link channels", &kSwitch, 1.0, kAutomatable},
  };
  static constexpr int32_t kThreshold = KParameterRow(kParameters, "threshold");
  static constexpr int32_t kRatio = KParameterRow(kParameters, "ratio");
  static constexpr int32_t kRange = KParameterRow(kParameters, "range");
  static constexpr int32_t kAttack = KParameterRow(kParameters, "attack");
  static constexpr int32_t kHold = KParameterRow(kParameters, "hold");
  static constexpr int32_t kRelease = KParameterRow(kParameters, "release");
  static constexpr int32_t kLinkChannels = KParameterRow(kParameters, "linkchannels");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;

  KGatePlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The static law: gain in dB for a level in dB, at the present settings (the editor's graph).
  double LawDecibels(double levelDb) const noexcept;
  // The hold, then the detector falling from full scale to where the gain stops changing and
  // the gain following it.
  uint32_t TailSamples() const noexcept override;
  float GainReductionDecibels() const noexcept { return reduction_.load(std::memory_order_relaxed); }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  struct Detector {
    double level = 0.0;  // peak envelope
    double gain = 0.0;   // applied gain, linear
    int32_t holding = 0;  // samples of hold left
  };
  // Everything the per-sample law reads, derived once per update.
  struct Law {
    double threshold = 0.0;  // linear
    double slope = 0.0;      // ratio − 1
    double floor = 0.0;      // range, linear
    double attack = 0.0, release = 0.0, fall = 0.0;  // smoothing coefficients
    int32_t hold = 0;
  };
  using Render = void (KGatePlugin::*)(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;

  Law Derive() const noexcept;
  static double Step(Detector& d, const Law& law, double peak) noexcept;
  template <bool Linked>
  void Gate(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;

  Law law_;
  Detector detectors_[kChannels];
  bool rest_ = true;  // the next update leaves the detectors as after a long silence
  Render render_ = &KGatePlugin::Gate<true>;
  double lowest_ = 1.0;
  std::atomic<float> reduction_{0.0f};
};

extern const KPluginDescription kGateDescription;
const KPluginHelp& KGateHelp();
KEditorDescription KGateEditor();
