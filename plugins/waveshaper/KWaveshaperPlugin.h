#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KGlide.h"
#include "dsp/KSectionRunner.h"
#include "kernel/KPluginDescription.h"

// A waveshaper: drive and a bias into one of four curves, with a DC blocker behind, a dry/wet
// mix and an output gain.
//
// Hard curves and folds make harmonics far above the audio band, which would fold back as
// aliasing. Instead of oversampling, each output sample is the curve's mean between the previous
// and the present input (the difference of its antiderivative over the difference of the
// inputs), which takes the worst of the aliasing away without adding latency. The bias moves the
// working point off centre for even harmonics; the curve's value at the bias is taken away again,
// so silence stays exact silence and the DC blocker only has the signal's own offset to remove.
class KWaveshaperPlugin final : public KAudioPlugin {
public:
  enum ShapeChoice : int32_t { kHardClip, kCubic, kSineFold, kRectify, kShapeCount };

private:
  static constexpr const char* kShapeNames[] = {"Hard clip", "Cubic", "Sine fold", "Rectify"};
  static_assert(std::size(kShapeNames) == kShapeCount);
  static inline const KDecibelKind kDriveKind{0.0, 36.0};
  static inline const KListKind kShapeKind{kShapeNames};
  static inline const KNumberKind kBiasKind{-100.0, 100.0, "%", "{0.0}"};
  static inline const KDecibelKind kOutputKind{-24.0, 12.0};
  static inline const KNumberKind kMixKind{0.0, 100.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"drive", "Drive", &kDriveKind, 12.0, kAutomatable},
      {"shape", "Shape", &kShapeKind, kCubic, kAutomatable},
      {"bias", "Bias", &kBiasKind, 0.0, kAutomatable},
      {"outputgain", "Output gain", &kOutputKind, -6.0, kAutomatable},
      {"mix", "Dry/wet", &kMixKind, 100.0, kAutomatable},
  };
  static constexpr int32_t kDrive = KParameterRow(kParameters, "drive");
  static constexpr int32_t kShape = KParameterRow(kParameters, "shape");
  static constexpr int32_t kBias = KParameterRow(kParameters, "bias");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;
  static constexpr double kGlideSeconds = 0.005;
  static constexpr double kDCBlockerHz = 5.0;
  // The bias at +100 %, in units of the curve's input.
  static constexpr double kFullBias = 0.5;

  KWaveshaperPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The curve `shape` at x, as the editor draws it.
  static double Curve(int32_t shape, double x) noexcept;
  // The DC blocker ringing out.
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  enum GlideLane : int32_t { kDriveGlide, kWetGlide, kDryGlide, kGlides };
  using Render = void (KWaveshaperPlugin::*)(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;

  template <class Shape>
  void Shaped(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;
  KFilterSection DCBlocker() const noexcept;

  KGlide<kGlides> glides_;  // drive; wet and dry gains with the output gain inside both
  bool jump_ = true;
  Render render_ = nullptr;
  double bias_ = 0.0;
  double previous_[kChannels] = {};  // the last driven input of each channel
  KSectionRunner blocker_;
  double drive_[kMaxChunk] = {};
  double wetGain_[kMaxChunk] = {};
  double dryGain_[kMaxChunk] = {};
  float wet_[kChannels][kMaxChunk] = {};
};

extern const KPluginDescription kWaveshaperDescription;
const KPluginHelp& KWaveshaperHelp();
KEditorDescription KWaveshaperEditor();
