#pragma once

#include "kernel/KPluginDescription.h"
#include "plugins/KSweptDelayPlugin.h"

// A flanger: one very short delay swept by an LFO and mixed with the sound, which carves a comb
// of notches that glide up and down; feedback from the delayed voice sharpens the comb into
// resonant peaks (negative feedback moves them between the notches).
class KFlangerPlugin final : public KSweptDelayPlugin {
  static inline const KTimeKind kDelayKind{0.0002, 0.01};
  static inline const KTimeKind kDepthKind{0.0, 0.008};
  static inline const KNumberKind kFeedbackKind{-95.0, 95.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"rate", "Rate", &KLFOControls::kRateKind, 0.25, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"shape", "Shape", &KLFOControls::kShapeKind, KLFO::kTriangle, kAutomatable},
      {"depth", "Depth", &kDepthKind, 0.002, kAutomatable},
      {"delay", "Delay", &kDelayKind, 0.001, kAutomatable},
      {"feedback", "Feedback", &kFeedbackKind, 50.0, kAutomatable},
      {"spread", "Stereo spread", &KLFOControls::kStereoPhaseKind, 90.0, kAutomatable},
      {"mix", "Dry/wet", &KLFOControls::kPercentKind, 50.0, kAutomatable},
  };
  static constexpr int32_t kDepth = KParameterRow(kParameters, "depth");
  static constexpr int32_t kDelay = KParameterRow(kParameters, "delay");
  static constexpr int32_t kFeedback = KParameterRow(kParameters, "feedback");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr KLFOControls kLFO{.shape = KParameterRow(kParameters, "shape"),
                                     .rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .stereoPhase = KParameterRow(kParameters, "spread")};
  static constexpr Layout kLayout{kLFO,
                                  kDelay,
                                  kDepth,
                                  -1,
                                  kFeedback,
                                  kMix,
                                  0.018};

  KFlangerPlugin() : KSweptDelayPlugin(kParameters, kLayout) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);
};

extern const KPluginDescription kFlangerDescription;
const KPluginHelp& KFlangerHelp();
KEditorDescription KFlangerEditor();
