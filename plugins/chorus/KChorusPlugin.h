#pragma once

#include "kernel/KPluginDescription.h"
#include "plugins/KSweptDelayPlugin.h"

// A chorus: up to four voices a little behind the sound, their delays swaying slowly with a
// sine LFO, so that they drift in pitch against it and thicken it. The right channel's LFO runs
// behind the left's by the spread, which widens a mono source.
class KChorusPlugin final : public KSweptDelayPlugin {
  static inline const KTimeKind kDelayKind{0.005, 0.04};
  static inline const KTimeKind kDepthKind{0.0, 0.01};
  static inline const KIntegerKind kVoicesKind{1, KSweptDelay::kMaxVoices};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"rate", "Rate", &KLFOControls::kRateKind, 0.8, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"depth", "Depth", &kDepthKind, 0.003, kAutomatable},
      {"delay", "Delay", &kDelayKind, 0.015, kAutomatable},
      {"voices", "Voices", &kVoicesKind, 2.0, kAutomatable},
      {"spread", "Stereo spread", &KLFOControls::kStereoPhaseKind, 90.0, kAutomatable},
      {"mix", "Dry/wet", &KLFOControls::kPercentKind, 50.0, kAutomatable},
  };
  static constexpr int32_t kDepth = KParameterRow(kParameters, "depth");
  static constexpr int32_t kDelay = KParameterRow(kParameters, "delay");
  static constexpr int32_t kVoices = KParameterRow(kParameters, "voices");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr KLFOControls kLFO{.rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .stereoPhase = KParameterRow(kParameters, "spread")};
  static constexpr Layout kLayout{kLFO,
                                  kDelay,
                                  kDepth,
                                  kVoices,
                                  -1,
                                  kMix,
                                  0.04 * (1.0 + KSweptDelay::kVoiceSpread * (KSweptDelay::kMaxVoices - 1)) + 0.01};

  KChorusPlugin() : KSweptDelayPlugin(kParameters, kLayout) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);
};

extern const KPluginDescription kChorusDescription;
const KPluginHelp& KChorusHelp();
KEditorDescription KChorusEditor();
