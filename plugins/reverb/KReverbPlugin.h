#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KDelayLine.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// An algorithmic reverb: a feedback delay network. The input's mono sum waits out the pre-delay,
// is smeared by a chain of allpass diffusers, and enters eight delay lines of unrelated lengths
// whose outputs are mixed by an orthogonal (Hadamard) matrix and fed back. The matrix loses no
// energy, so each line's gain alone sets the decay: a line of L samples is scaled by
// 10^(−3·L / (decay · rate)), and every mode of the network falls by 60 dB in the decay time.
// Damping puts a one-pole low pass of unity gain at DC in each line: the highs die sooner,
// while the decay time holds at low frequencies. The left and right outputs take the lines
// with two orthogonal sign patterns, so they are uncorrelated; width narrows them towards mono.
//
// Non-finite input samples are taken as silence; values below −300 dB are flushed in the
// network, so the tail ends in exact zeros.
class KReverbPlugin final : public KAudioPlugin {
  static inline const KTimeKind kPreDelayKind{0.0, 0.25};
  static inline const KNumberKind kDecayKind{0.2, 20.0, "s", "{0.00}", KValueCurve::kSquare};
  static inline const KNumberKind kSizeKind{50.0, 200.0, "%", "{0}"};
  static inline const KNumberKind kPercentKind{0.0, 100.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"predelay", "Pre-delay", &kPreDelayKind, 0.01, kAutomatable},
      {"decay", "Decay", &kDecayKind, 2.0, kAutomatable},
      {"size", "Size", &kSizeKind, 100.0, 0},
      {"damping", "Damping", &kPercentKind, 30.0, kAutomatable},
      {"width", "Width", &kPercentKind, 100.0, kAutomatable},
      {"mix", "Dry/wet", &kPercentKind, 25.0, kAutomatable},
  };
  static constexpr int32_t kPreDelay = KParameterRow(kParameters, "predelay");
  static constexpr int32_t kDecay = KParameterRow(kParameters, "decay");
  static constexpr int32_t kSize = KParameterRow(kParameters, "size");
  static constexpr int32_t kDamping = KParameterRow(kParameters, "damping");
  static constexpr int32_t kWidth = KParameterRow(kParameters, "width");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr int32_t kLines = 8;
  static constexpr int32_t kDiffusers = 4;
  static constexpr double kGlideSeconds = 0.02;

  KReverbPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  bool SetSampleRate(double sampleRate) override;
  uint32_t TailSamples() const noexcept override;
  // The seconds the tail takes to fall by 60 dB at a frequency: the decay setting at the lowest
  // frequencies, shorter above as the damping takes its share on every pass through a line.
  double DecaySeconds(double hz) const noexcept;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  static constexpr int32_t kPiece = 256;
  // Per-line gains and damping, then the output's shares, gliding together.
  enum GlideLane : int32_t { kDampingGlide = kLines, kDryGlide, kWetGlide, kSideGlide, kGlides };

  void Prepare();
  // Line and diffuser lengths in samples at the current size and rate.
  int32_t LineLength(int32_t line) const noexcept;
  int32_t DiffuserLength(int32_t diffuser) const noexcept;
  int32_t PreDelaySamples() const noexcept;

  KDelayLine preDelay_;
  KDelayLine diffusers_[kDiffusers];
  KDelayLine lines_[kLines];
  int32_t lengths_[kLines] = {};
  int32_t diffuserLengths_[kDiffusers] = {};
  double lowPass_[kLines] = {};  // the damping filters' states
  double preparedSize_ = 0.0;
  KGlide<kGlides> glides_;
  bool jump_ = true;
  double lanes_[kGlides][kPiece] = {};
};

extern const KPluginDescription kReverbDescription;
const KPluginHelp& KReverbHelp();
KEditorDescription KReverbEditor();
