#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KFilterSection.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// A stereo imager: the width of the image set apart below and above a crossover, so that the
// bass can be narrowed towards mono while the highs are widened. Only the side signal is split,
// by a fourth-order crossover whose two bands sum to an all-pass (flat in level); the mid passes
// untouched, so a mono mix of the output is the mono mix of the input at any setting.
class KStereoImagerPlugin final : public KAudioPlugin {
  static inline const KNumberKind kWidthKind{0.0, 200.0, "%", "{0.0}"};
  static inline const KFrequencyKind kCrossoverKind{40.0, 1000.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"width", "Width", &kWidthKind, 120.0, kAutomatable},
      {"lowwidth", "Low width", &kWidthKind, 100.0, kAutomatable},
      {"crossover", "Crossover", &kCrossoverKind, 150.0, kAutomatable},
  };
  static constexpr int32_t kWidth = KParameterRow(kParameters, "width");
  static constexpr int32_t kLowWidth = KParameterRow(kParameters, "lowwidth");
  static constexpr int32_t kCrossover = KParameterRow(kParameters, "crossover");
  static constexpr double kGlideSeconds = 0.005;

  KStereoImagerPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);
  // The crossover on the side signal rings briefly; 100 ms covers it at the lowest crossover to
  // far below −100 dB.
  uint32_t TailSamples() const noexcept override { return static_cast<uint32_t>(SampleRate() * 0.1); }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  KFilterSection lowPass_, highPass_;  // each applied twice
  double state_[4][2] = {};            // each stage's two delays: low, low, high, high
  // The side's gains above and below the crossover.
  KGlide<2> gains_;
  bool jumpToTarget_ = true;
};

extern const KPluginDescription kStereoImagerDescription;
const KPluginHelp& KStereoImagerHelp();
KEditorDescription KStereoImagerEditor();
