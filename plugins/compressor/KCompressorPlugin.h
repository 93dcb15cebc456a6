#pragma once

#include <atomic>
#include <mutex>
#include <span>
#include <vector>

#include "core/KAudioPlugin.h"
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
public:
  enum ParameterIndex : int32_t {
    kGain,
    kOutputGain,
    kAttack,
    kRelease,
    kRmsLength,
    kThreshold,
    kRatio,
    kKneeMode,
    kKneeSize,
    kLinkChannels,
    kMaximize,
    kCustomShape,
    kSideChainInput,
    kSideChainPlay,
    kSideChainMinFrequency,
    kSideChainMaxFrequency,
    kParameterCount
  };
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
  float GainReductionDecibels() const noexcept { return gainReduction_.load(std::memory_order_relaxed); }

  // The engine as the latest block left it: its law for the editor's graph, its detector for
  // tests. Read it only while no block is being processed.
  const KDynamicsProcessor& Engine() const noexcept { return engine_; }

  // The graph, as the attribute "CustomShape" of the plug-in's section ("level,output" pairs
  // separated by spaces); the default graph is not written.
  void StorePluginSettings(Element& section, uint32_t flags) override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  using Render = void (KCompressorPlugin::*)(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  static constexpr int32_t kFresh = 4;  // on the spare slot's index: written and not yet taken

  void Compress(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  void Audition(const float* const* inputs, float* const* outputs, int32_t n) noexcept;
  void MeterGainReduction(int32_t n) noexcept;
  void TakePublishedShape() noexcept;

  KDynamicsProcessor engine_;
  KSectionRunner audition_;  // the detector's band limits again, for the audition
  Render render_ = &KCompressorPlugin::Compress;
  bool sideChain_ = false;
  int32_t meteredRows_ = 0;  // gain rows the engine wrote: 0 when idle, 1 when linked
  std::vector<float> scratch_;  // the engine's output while the audition plays
  std::atomic<float> gainReduction_{0.0f};

  // The graph: the writer's slot, the spare slot between the sides, the engine's slot.
  KTransferShape shapes_[3];
  mutable std::mutex shapeMutex_;  // writers only: editor, state load
  std::vector<Point> points_;      // guarded by shapeMutex_
  int32_t writing_ = 0;            // guarded by shapeMutex_
  std::atomic<int32_t> spare_{1};
  int32_t reading_ = 2;  // audio thread
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), and its
// help (beside it in this folder).
extern const KPluginDescription kCompressorDescription;
const KPluginHelp& KCompressorHelp();
