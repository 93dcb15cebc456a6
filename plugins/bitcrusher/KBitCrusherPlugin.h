#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// A bit crusher: the signal is held for a number of samples (a lower sample rate without any
// filtering, so its images fold back as the grit of early samplers), then rounded to 2^bits
// evenly spaced levels between −1 and 1, then mixed with the dry signal and given an output
// gain. With the mix full and the output gain at 0 dB, at most 2^bits distinct values come out.
//
// The hold counts from the last reset, not from each block, so that the host's block size
// changes nothing.
class KBitCrusherPlugin final : public KAudioPlugin {
  static inline const KIntegerKind kBitsKind{1, 24, "bits"};
  static inline const KIntegerKind kHoldKind{1, 64, "x"};
  static inline const KNumberKind kMixKind{0.0, 100.0, "%", "{0.0}"};
  static inline const KDecibelKind kOutputKind{-24.0, 12.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"bits", "Bits", &kBitsKind, 8.0, kAutomatable},
      {"downsample", "Downsample", &kHoldKind, 1.0, kAutomatable},
      {"mix", "Dry/wet", &kMixKind, 100.0, kAutomatable},
      {"outputgain", "Output gain", &kOutputKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kBits = KParameterRow(kParameters, "bits");
  static constexpr int32_t kDownsample = KParameterRow(kParameters, "downsample");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;
  static constexpr double kGlideSeconds = 0.005;

  KBitCrusherPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The level `x` is rounded to with `bits` bits: one of 2^bits steps from −1 up to just below 1.
  static double Quantize(double x, double halfLevels) noexcept;
  // A held sample lasts up to the hold length after the input fell silent.
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  enum GlideLane : int32_t { kWetGlide, kDryGlide, kGlides };

  KGlide<kGlides> glides_;  // wet and dry gains, the output gain inside both
  bool jump_ = true;
  double halfLevels_ = 128.0;  // 2^(bits − 1)
  int32_t hold_ = 1;
  int32_t phase_ = 0;  // samples since the held value was taken
  double held_[kChannels] = {};
  double wet_[kMaxChunk] = {};
  double dry_[kMaxChunk] = {};
};

extern const KPluginDescription kBitCrusherDescription;
const KPluginHelp& KBitCrusherHelp();
KEditorDescription KBitCrusherEditor();
