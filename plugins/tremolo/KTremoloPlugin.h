#pragma once

#include "kernel/KPluginDescription.h"
#include "plugins/KLFOAmountPlugin.h"

// A tremolo: the level rises and falls with an LFO, between full and (1 − depth). The right
// channel's LFO may run behind the left's, up to half a cycle for a tremolo that swings from
// side to side. Smoothing rounds off the edges of the square and stepped shapes.
class KTremoloPlugin final : public KLFOAmountPlugin {
  static inline const KTimeKind kSmoothingKind{0.0, 0.05};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"rate", "Rate", &KLFOControls::kRateKind, 4.0, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"shape", "Shape", &KLFOControls::kShapeKind, KLFO::kSine, kAutomatable},
      {"depth", "Depth", &KLFOControls::kPercentKind, 50.0, kAutomatable},
      {"spread", "Stereo phase", &KLFOControls::kStereoPhaseKind, 0.0, kAutomatable},
      {"smoothing", "Smoothing", &kSmoothingKind, 0.002, kAutomatable},
  };
  static constexpr int32_t kDepth = KParameterRow(kParameters, "depth");
  static constexpr KLFOControls kLFO{.shape = KParameterRow(kParameters, "shape"),
                                     .rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .stereoPhase = KParameterRow(kParameters, "spread"),
                                     .smoothing = KParameterRow(kParameters, "smoothing")};

  KTremoloPlugin() : KLFOAmountPlugin(kParameters, kLFO, kDepth) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

protected:
  void ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t from, int32_t n,
                    const double* depth) noexcept override;
};

extern const KPluginDescription kTremoloDescription;
const KPluginHelp& KTremoloHelp();
KEditorDescription KTremoloEditor();
