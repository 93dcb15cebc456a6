#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// A transient shaper: louder or softer attacks and sustains, whatever the level.
//
// Three envelopes follow the peak of all channels together: a quick one, one that rises slowly,
// and one that falls slowly. While a note starts, the quick envelope runs ahead of the slow
// riser; while it dies away, the slow faller stays above the quick one. The gain raises each of
// those two ratios to a power set by Attack and Sustain (0 % leaves the gain at exactly 1), so
// the shaping follows the shape of the sound and not its loudness, within ±kMaxDecibels.
class KTransientShaperPlugin final : public KAudioPlugin {
  static inline const KNumberKind kAmountKind{-100.0, 100.0, "%", "{0.0}"};
  static inline const KDecibelKind kOutputKind{-24.0, 12.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"attack", "Attack", &kAmountKind, 0.0, kAutomatable},
      {"sustain", "Sustain", &kAmountKind, 0.0, kAutomatable},
      {"outputgain", "Output gain", &kOutputKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kAttack = KParameterRow(kParameters, "attack");
  static constexpr int32_t kSustain = KParameterRow(kParameters, "sustain");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;
  static constexpr double kGlideSeconds = 0.005;
  static constexpr double kMaxDecibels = 18.0;
  // The envelopes' times: quick rise and fall, slow rise, slow fall.
  static constexpr double kQuickRise = 0.0005, kQuickFall = 0.03, kSlowRise = 0.03, kSlowFall = 0.3;

  KTransientShaperPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // Until the slow faller has come down 100 dB from full scale: then the next sound finds the
  // envelopes at rest.
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  enum GlideLane : int32_t { kAttackGlide, kSustainGlide, kOutputGlide, kGlides };
  // A peak follower: `rise` and `fall` are the smoothing coefficients.
  struct Follower {
    double rise = 0.0, fall = 0.0, value = 0.0;
    double Follow(double peak) noexcept {
      value = peak + (peak > value ? rise : fall) * (value - peak);
      return value;
    }
  };

  KGlide<kGlides> glides_;  // the two exponents and the output gain
  bool jump_ = true;
  Follower quick_, riser_, faller_;
  double attack_[kMaxChunk] = {};
  double sustain_[kMaxChunk] = {};
  double output_[kMaxChunk] = {};
};

extern const KPluginDescription kTransientShaperDescription;
const KPluginHelp& KTransientShaperHelp();
KEditorDescription KTransientShaperEditor();
