#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KStereoMatrix.h"
#include "kernel/KPluginDescription.h"

// A channel utility: gain, balance, stereo width, polarity, channel swap, mono and mute.
// Every setting becomes one 2x2 matrix from input to output; when it changes, each coefficient
// glides to its new value over a few milliseconds, so no setting ever clicks. The signal runs
// polarity (on the input channels), swap, width, then balance and gain.
class KUtilityPlugin final : public KAudioPlugin {
  static inline const KDecibelKind kGainKind{-60.0, 24.0};
  static inline const KBalanceKind kBalanceKind{};
  static inline const KNumberKind kWidthKind{0.0, 200.0, "%", "{0.0}"};
  static inline const KSwitchKind kSwitch{};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  // The parameter table; each index below is its key's row.
  static constexpr KParameterInfo kParameters[] = {
      {"gain", "Gain", &kGainKind, 0.0, kAutomatable},
      {"balance", "Balance", &kBalanceKind, 0.0, kAutomatable},
      {"width", "Width", &kWidthKind, 100.0, kAutomatable},
      {"invertleft", "Invert left", &kSwitch, 0.0, kAutomatable},
      {"invertright", "Invert right", &kSwitch, 0.0, kAutomatable},
      {"swap", "Swap channels", &kSwitch, 0.0, kAutomatable},
      {"mono", "Mono", &kSwitch, 0.0, kAutomatable},
      {"mute", "Mute", &kSwitch, 0.0, kAutomatable},
  };
  static constexpr int32_t kGain = KParameterRow(kParameters, "gain");
  static constexpr int32_t kBalance = KParameterRow(kParameters, "balance");
  static constexpr int32_t kWidth = KParameterRow(kParameters, "width");
  static constexpr int32_t kInvertLeft = KParameterRow(kParameters, "invertleft");
  static constexpr int32_t kInvertRight = KParameterRow(kParameters, "invertright");
  static constexpr int32_t kSwap = KParameterRow(kParameters, "swap");
  static constexpr int32_t kMono = KParameterRow(kParameters, "mono");
  static constexpr int32_t kMute = KParameterRow(kParameters, "mute");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr double kGlideSeconds = 0.005;

  KUtilityPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // Output is a matrix times the input of the same sample: nothing rings.
  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // The matrix the present settings ask for.
  void TargetMatrix(double (&m)[4]) const;

  KStereoMatrix matrix_;
  bool jumpToTarget_ = true;
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), its help
// and its editor (beside it in this folder).
extern const KPluginDescription kUtilityDescription;
const KPluginHelp& KUtilityHelp();
KEditorDescription KUtilityEditor();
