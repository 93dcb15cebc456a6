#pragma once

#include <iterator>

#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"
#include "plugins/KLFOPlugin.h"

// A phaser: a chain of first-order allpass stages whose common corner frequency an LFO sweeps
// between two limits on an octave scale, mixed with the sound. Each pair of stages cancels one
// band against the dry signal, so the stages make a set of notches that glide; feedback from
// the chain's output turns them into resonant peaks.
//
// Non-finite input samples are taken as silence; the feedback path flushes values below
// −300 dB.
class KPhaserPlugin final : public KLFOPlugin {
public:
  static constexpr const char* kStageNames[] = {"2", "4", "6", "8", "10", "12"};
  static constexpr int32_t kMaxStages = 12;

private:
  static inline const KListKind kStagesKind{kStageNames};
  static inline const KFrequencyKind kFrequencyKind{50.0, 16000.0};
  static inline const KNumberKind kFeedbackKind{-95.0, 95.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"rate", "Rate", &KLFOControls::kRateKind, 0.5, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"shape", "Shape", &KLFOControls::kShapeKind, KLFO::kSine, kAutomatable},
      {"stages", "Stages", &kStagesKind, 2.0, kAutomatable},
      {"low", "Low frequency", &kFrequencyKind, 300.0, kAutomatable},
      {"high", "High frequency", &kFrequencyKind, 3000.0, kAutomatable},
      {"feedback", "Feedback", &kFeedbackKind, 40.0, kAutomatable},
      {"spread", "Stereo spread", &KLFOControls::kStereoPhaseKind, 90.0, kAutomatable},
      {"mix", "Dry/wet", &KLFOControls::kPercentKind, 50.0, kAutomatable},
  };
  static constexpr int32_t kStages = KParameterRow(kParameters, "stages");
  static constexpr int32_t kLow = KParameterRow(kParameters, "low");
  static constexpr int32_t kHigh = KParameterRow(kParameters, "high");
  static constexpr int32_t kFeedback = KParameterRow(kParameters, "feedback");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr KLFOControls kLFO{.shape = KParameterRow(kParameters, "shape"),
                                     .rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .stereoPhase = KParameterRow(kParameters, "spread")};

  KPhaserPlugin() : KLFOPlugin(kParameters, kLFO) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  uint32_t TailSamples() const noexcept override;
  // The allpass coefficient of a stage whose phase passes −90° at `frequency`.
  static double Coefficient(double frequency, double sampleRate) noexcept;

protected:
  void UpdateEffect(bool jump) noexcept override;
  void ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept override;
  void ResetEffect() noexcept override;

private:
  static constexpr int32_t kPiece = 256;
  enum GlideLane : int32_t { kLowGlide, kSpanGlide, kFeedbackGlide, kWetGlide, kGlides };

  int32_t StageCount() const noexcept;

  KGlide<kGlides> glides_;
  int32_t stages_ = 6;
  double state_[KPluginLFOs::kChannels][kMaxStages] = {};
  double last_[KPluginLFOs::kChannels] = {};  // the chain's latest output, for the feedback
  double lanes_[kGlides][kPiece] = {};
  double sweep_[kPiece] = {};
};

extern const KPluginDescription kPhaserDescription;
const KPluginHelp& KPhaserHelp();
KEditorDescription KPhaserEditor();
