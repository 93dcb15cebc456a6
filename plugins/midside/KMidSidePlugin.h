#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KStereoMatrix.h"
#include "kernel/KPluginDescription.h"

// A mid/side processor: the sum of the sides (mid) and their difference (side) each get a gain,
// and either can be heard alone. It can also code a stereo signal into mid/side channels for
// other plug-ins to treat apart, and decode them back. Everything is one matrix that glides to
// each new setting.
class KMidSidePlugin final : public KAudioPlugin {
  static constexpr const char* kModeNames[] = {"Stereo", "Encode", "Decode"};
  static inline const KListKind kModeKind{kModeNames};
  static constexpr const char* kListenNames[] = {"Both", "Mid", "Side"};
  static inline const KListKind kListenKind{kListenNames};
  static inline const KDecibelKind kGainKind{-24.0, 12.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"midgain", "Mid gain", &kGainKind, 0.0, kAutomatable},
      {"sidegain", "Side gain", &kGainKind, 0.0, kAutomatable},
      {"listen", "Listen", &kListenKind, 0.0, kAutomatable},
      {"mode", "Mode", &kModeKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kMidGain = KParameterRow(kParameters, "midgain");
  static constexpr int32_t kSideGain = KParameterRow(kParameters, "sidegain");
  static constexpr int32_t kListen = KParameterRow(kParameters, "listen");
  static constexpr int32_t kMode = KParameterRow(kParameters, "mode");
  enum Mode : int32_t { kStereo, kEncode, kDecode };
  enum Listen : int32_t { kBoth, kMidOnly, kSideOnly };
  static constexpr double kGlideSeconds = 0.005;

  KMidSidePlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);
  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override { jumpToTarget_ = true; }

private:
  KStereoMatrix matrix_;
  bool jumpToTarget_ = true;
};

extern const KPluginDescription kMidSideDescription;
const KPluginHelp& KMidSideHelp();
KEditorDescription KMidSideEditor();
