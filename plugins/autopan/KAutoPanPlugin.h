#pragma once

#include "kernel/KPluginDescription.h"
#include "plugins/KLFOAmountPlugin.h"

// An auto-pan: an LFO moves the balance between the two channels. At the LFO's top the left
// channel is silent, at its bottom the right, at its middle both pass at full level; width
// scales how far the balance travels. A single channel passes unchanged.
class KAutoPanPlugin final : public KLFOAmountPlugin {
  static inline const KTimeKind kSmoothingKind{0.0, 0.05};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"rate", "Rate", &KLFOControls::kRateKind, 0.5, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"shape", "Shape", &KLFOControls::kShapeKind, KLFO::kSine, kAutomatable},
      {"width", "Width", &KLFOControls::kPercentKind, 100.0, kAutomatable},
      {"smoothing", "Smoothing", &kSmoothingKind, 0.002, kAutomatable},
  };
  static constexpr int32_t kWidth = KParameterRow(kParameters, "width");
  static constexpr KLFOControls kLFO{.shape = KParameterRow(kParameters, "shape"),
                                     .rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .smoothing = KParameterRow(kParameters, "smoothing")};

  KAutoPanPlugin() : KLFOAmountPlugin(kParameters, kLFO, kWidth) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

protected:
  void ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t from, int32_t n,
                    const double* width) noexcept override;
};

extern const KPluginDescription kAutoPanDescription;
const KPluginHelp& KAutoPanHelp();
KEditorDescription KAutoPanEditor();
