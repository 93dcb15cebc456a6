#pragma once

#include "dsp/KFilterSection.h"
#include "dsp/KGlide.h"
#include "dsp/KSectionState.h"
#include "kernel/KPluginDescription.h"
#include "plugins/KLFOPlugin.h"

// A filter whose cutoff an LFO sweeps: a second-order low pass, high pass, band pass or notch,
// moved up and down by up to four octaves about its cutoff. The section is designed again
// every kStep samples (counted from the stream's start, so the host's block size changes
// nothing) and the coefficients glide in straight lines between designs, which keeps the filter
// stable and the sweep free of steps.
class KAutoFilterPlugin final : public KLFOPlugin {
public:
  static constexpr const char* kTypeNames[] = {"Low pass", "High pass", "Band pass", "Notch"};
  static constexpr int32_t kSectionTypes[] = {KFilterSection::kLowPass, KFilterSection::kHighPass, KFilterSection::kBandPass,
                                              KFilterSection::kNotch};
  static constexpr int32_t kStep = 32;

private:
  static inline const KListKind kTypeKind{kTypeNames};
  static inline const KFrequencyKind kCutoffKind{20.0, 20000.0};
  static inline const KNumberKind kResonanceKind{0.5, 12.0, "", "{0.00}", KValueCurve::kSquare};
  static inline const KNumberKind kDepthKind{0.0, 4.0, "oct", "{0.00}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"type", "Type", &kTypeKind, 0.0, kAutomatable},
      {"cutoff", "Cutoff", &kCutoffKind, 800.0, kAutomatable},
      {"resonance", "Resonance", &kResonanceKind, 2.0, kAutomatable},
      {"depth", "Depth", &kDepthKind, 2.0, kAutomatable},
      {"rate", "Rate", &KLFOControls::kRateKind, 1.0, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"shape", "Shape", &KLFOControls::kShapeKind, KLFO::kSine, kAutomatable},
      {"spread", "Stereo spread", &KLFOControls::kStereoPhaseKind, 0.0, kAutomatable},
  };
  static constexpr int32_t kType = KParameterRow(kParameters, "type");
  static constexpr int32_t kCutoff = KParameterRow(kParameters, "cutoff");
  static constexpr int32_t kResonance = KParameterRow(kParameters, "resonance");
  static constexpr int32_t kDepth = KParameterRow(kParameters, "depth");
  static constexpr KLFOControls kLFO{.shape = KParameterRow(kParameters, "shape"),
                                     .rate = KParameterRow(kParameters, "rate"),
                                     .sync = KParameterRow(kParameters, "sync"),
                                     .stereoPhase = KParameterRow(kParameters, "spread")};

  KAutoFilterPlugin() : KLFOPlugin(kParameters, kLFO) {}
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  uint32_t TailSamples() const noexcept override;
  // The section at an LFO value (−1..1) of the present settings.
  void Design(KFilterSection& section, double sweep) const noexcept;

protected:
  void UpdateEffect(bool jump) noexcept override;
  void ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept override;
  void ResetEffect() noexcept override;

private:
  static constexpr int32_t kChannels = KPluginLFOs::kChannels;
  static constexpr int32_t kPiece = 256;

  KGlide<5> coefficients_[kChannels];
  KSectionState states_[kChannels];
  int32_t intoStep_ = 0;  // samples since the latest design
  bool jump_ = true;
  double sweep_[kPiece] = {};
  double row_[5][kStep] = {};
};

extern const KPluginDescription kAutoFilterDescription;
const KPluginHelp& KAutoFilterHelp();
KEditorDescription KAutoFilterEditor();
