#pragma once

#include <atomic>
#include <iterator>
#include <mutex>
#include <span>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KDynamicsProcessor.h"
#include "dsp/KSectionRunner.h"
#include "dsp/KTransferCurve.h"
#include "kernel/KPluginDescription.h"

// The compressor: the dynamics engine behind a parameter table, with a side-chain input bus
// (the second input bus) that can drive the detector, detector band limits, an audition of what
// the detector hears, and a user-drawn transfer graph that replaces threshold, ratio and knee.
//
// Threads: parameters and the graph may change on any thread; the graph reaches the audio thread
// through three slots handed round without a lock on the audio side, so the engine never reads a
// graph while it is being rebuilt.
class KCompressorPlugin final : public KAudioPlugin {
  static inline const KDecibelKind kGainKind{-24.0, 24.0};
  static inline const KTimeKind kAttackKind{0.00001, 1.0};
  static inline const KTimeKind kReleaseKind{0.001, 5.0};
  static inline const KTimeKind kRmsLengthKind{0.00001, 0.5};
  // Not down to 0: a threshold of 0 leaves no full-scale output to make up from, and "Maximize
  // to 0dB" would divide by it. 0.001 is −60 dB.
  static inline const KNumberKind kThresholdKind{0.001, 1.0, "", "{0.3}"};
  static inline const KRatioKind kRatioKind{1.0, 20.0};
  static constexpr const char* kKneeNames[] = {"Hard", "Linear", "Soft"};
  static inline const KListKind kKneeKind{kKneeNames};
  static inline const KNumberKind kKneeSizeKind{0.0, 1.0, "", "{0.2}"};
  static inline const KSwitchKind kSwitch{};
  // The ends switch their limit off.
  static inline const KFrequencyKind kBandLimitKind{20.0, 20000.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;
  // Where the detector listens and whether it is auditioned are routing choices made while
  // setting up, not performance moves: hosts do not automate them.
  static constexpr uint32_t kRouting = 0;

public:
  // The parameter table; each index below is its key's row.
  static constexpr KParameterInfo kParameters[] = {
      {"gain", "Gain", &kGainKind, 0.0, kAutomatable},
      {"outputgain", "Output gain", &kGainKind, 0.0, kAutomatable},
      {"attack", "Attack", &kAttackKind, 0.01, kAutomatable},
      {"release", "Release", &kReleaseKind, 0.05, kAutomatable},
      {"rmslength", "RMS length", &kRmsLengthKind, 0.001, kAutomatable},
      {"threshold", "Threshold", &kThresholdKind, 0.5, kAutomatable},
      {"ratio", "Ratio", &kRatioKind, 1.8, kAutomatable},
      {"kneemode", "Knee mode", &kKneeKind, KTransferCurve::kHardKnee, kAutomatable},
      {"kneesize", "Knee size", &kKneeSizeKind, 0.25, kAutomatable},
      {"linkchannels", "Link channels", &kSwitch, 1.0, kAutomatable},
      {"maximize", "Maximize to 0dB", &kSwitch, 0.0, kAutomatable},
      {"customshape", "Custom shape", &kSwitch, 0.0, kAutomatable},
      {"SideChainInput", "Side-chain input", &kSwitch, 0.0, kRouting},
      {"SideChainPlay", "Side-chain play", &kSwitch, 0.0, kRouting},
      {"SideChainMinFrequency", "Side-chain min frequency", &kBandLimitKind, 20.0, kAutomatable},
      {"SideChainMaxFrequency", "Side-chain max frequency", &kBandLimitKind, 20000.0, kAutomatable},
  };
  static constexpr int32_t kGain = KParameterRow(kParameters, "gain");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kAttack = KParameterRow(kParameters, "attack");
  static constexpr int32_t kRelease = KParameterRow(kParameters, "release");
  static constexpr int32_t kRmsLength = KParameterRow(kParameters, "rmslength");
  static constexpr int32_t kThreshold = KParameterRow(kParameters, "threshold");
  static constexpr int32_t kRatio = KParameterRow(kParameters, "ratio");
  static constexpr int32_t kKneeMode = KParameterRow(kParameters, "kneemode");
  static constexpr int32_t kKneeSize = KParameterRow(kParameters, "kneesize");
  static constexpr int32_t kLinkChannels = KParameterRow(kParameters, "linkchannels");
  static constexpr int32_t kMaximize = KParameterRow(kParameters, "maximize");
  static constexpr int32_t kCustomShape = KParameterRow(kParameters, "customshape");
  static constexpr int32_t kSideChainInput = KParameterRow(kParameters, "SideChainInput");
  static constexpr int32_t kSideChainPlay = KParameterRow(kParameters, "SideChainPlay");
  static constexpr int32_t kSideChainMinFrequency = KParameterRow(kParameters, "SideChainMinFrequency");
  static constexpr int32_t kSideChainMaxFrequency = KParameterRow(kParameters, "SideChainMaxFrequency");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  using Point = KTransferShape::Point;

  KCompressorPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // ---- the custom transfer graph (not on the audio thread: rebuilding it allocates)
  // Points in ascending input level, amplitudes; fewer than two points restore the default.
  void SetCustomShape(std::span<const Point> points);
  std::vector<Point> CustomShape() const;
  static std::span<const Point> DefaultCustomShape() noexcept;

  // Deepest gain reduction of the latest block in dB (0 or below; make-up and the input and
  // output gains are not reductions). For the editor's meter; any thread.
  float GainReductionDecibels() const noexcept;

  // The engine as the latest block left it: its law for the editor's graph, its detector for
  // tests. Read it only while no block is being processed.
  const KDynamicsProcessor& Engine() const noexcept { return engine_; }

  // The graph, as the attribute "CustomShape" of the plug-in's section ("level,output" pairs
  // separated by spaces); the default graph is not written.
  void StorePluginSettings(Element& section, uint32_t flags) override;
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  using Render = void (KCompressorPlugin::*)(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  static constexpr int32_t kFresh = 4;  // on the spare slot's index: written and not yet taken

  // The engine's settings as the parameters give them (the custom graph aside).
  KDynamicsSettings Settings() const noexcept;
  void Compress(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  void Audition(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  void MeterGainReduction() noexcept;
  void TakePublishedShape() noexcept;

  KDynamicsProcessor engine_;
  KSectionRunner audition_;  // the detector's band limits again, for the audition
  Render render_ = &KCompressorPlugin::Compress;
  bool sideChain_ = false;
  std::vector<float> scratch_;  // the engine's output while the audition plays
  std::atomic<double> gainReduction_{1.0};  // the lowest gain over the total gain

  // The graph: the writer's slot, the spare slot between the sides, the engine's slot.
  KTransferShape shapes_[3];
  mutable std::mutex shapeMutex_;  // writers only: editor, state load
  std::vector<Point> points_;      // guarded by shapeMutex_
  int32_t writing_ = 0;            // guarded by shapeMutex_
  std::atomic<int32_t> spare_{1};
  int32_t reading_ = 2;  // audio thread
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), its help
// and its editor (beside it in this folder).
extern const KPluginDescription kCompressorDescription;
const KPluginHelp& KCompressorHelp();
KEditorDescription KCompressorEditor();
