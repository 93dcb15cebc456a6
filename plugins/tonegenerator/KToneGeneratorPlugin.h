#pragma once

#include <cstdint>
#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// A test-tone generator for lining up levels and checking speakers, rooms and plug-in chains: a
// sine, triangle, square or sawtooth (the last two band-limited at their steps) or white noise,
// added to the input or replacing it while it plays. Switched off, the input passes unchanged.
// Starting, stopping and level changes glide over a few milliseconds, so nothing clicks.
class KToneGeneratorPlugin final : public KAudioPlugin {
  static constexpr const char* kWaveNames[] = {"Sine", "Triangle", "Square", "Sawtooth", "White noise"};
  static inline const KListKind kWaveKind{kWaveNames};
  static inline const KFrequencyKind kFrequencyKind{20.0, 20000.0};
  static inline const KDecibelKind kLevelKind{-60.0, 0.0};
  static constexpr const char* kOutputNames[] = {"Add to input", "Replace input"};
  static inline const KListKind kOutputKind{kOutputNames};
  static inline const KSwitchKind kSwitch{};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"play", "Play", &kSwitch, 0.0, kAutomatable},
      {"waveform", "Waveform", &kWaveKind, 0.0, kAutomatable},
      {"frequency", "Frequency", &kFrequencyKind, 1000.0, kAutomatable},
      {"level", "Level", &kLevelKind, -18.0, kAutomatable},
      {"output", "Output", &kOutputKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kPlay = KParameterRow(kParameters, "play");
  static constexpr int32_t kWaveform = KParameterRow(kParameters, "waveform");
  static constexpr int32_t kFrequency = KParameterRow(kParameters, "frequency");
  static constexpr int32_t kLevel = KParameterRow(kParameters, "level");
  static constexpr int32_t kOutput = KParameterRow(kParameters, "output");
  enum Wave : int32_t { kSine, kTriangle, kSquare, kSawtooth, kNoise };
  static constexpr double kGlideSeconds = 0.005;

  KToneGeneratorPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);
  // The tone starts and stops with the switch, not with the input: no tail.
  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  using Oscillator = double (*)(KToneGeneratorPlugin& self) noexcept;
  template <int Wave>
  static double Next(KToneGeneratorPlugin& self) noexcept;

  Oscillator oscillator_ = &Next<kSine>;
  double phase_ = 0.0;      // 0..1
  double increment_ = 0.0;  // per sample
  uint64_t noise_ = 1;
  // The tone's gain and the input's gain.
  KGlide<2> gains_;
  bool jumpToTarget_ = true;
};

extern const KPluginDescription kToneGeneratorDescription;
const KPluginHelp& KToneGeneratorHelp();
KEditorDescription KToneGeneratorEditor();
