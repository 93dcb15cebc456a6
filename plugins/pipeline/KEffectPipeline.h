#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "core/KPipelineFile.h"
#include "kernel/KPluginDescription.h"
#include "plugins/pipeline/KModuleChain.h"

// A parameter of a slot: its value is the normalised value of the module parameter it carries,
// and its text is that parameter's text, so hosts show "4.0 : 1" rather than 0.43; its control
// in the editor is labelled with that parameter's name. A slot parameter without a module
// parameter behind it reads "-" and has no label. Hosts ask from threads of their own, so it
// reads the chain through the shared view, never the hand-over.
class KSlotKind final : public KValueKind {
public:
  KSlotKind(const KChainView& view, int32_t slot, int32_t parameter)
      : KValueKind(0.0, 1.0, "", KValueCurve::kLinear), view_(view), slot_(slot), parameter_(parameter) {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
  bool CurrentName(KString& name) const override;

private:
  // The module parameter behind this one in `chain`, or null.
  const KAudioPluginBase::Parameter* Carried(const KModuleChain& chain) const noexcept;

  const KChainView& view_;
  int32_t slot_;
  int32_t parameter_;
};

// The per-instance parameter table of a pipeline, made before the plug-in core that refers to
// it: slot kinds look modules up in the instance's own chains.
struct KPipelineTable {
  static constexpr int32_t kSlots = KModuleChain::kSlots;
  // Host parameters of a slot: its first twelve module parameters sit in a block after its
  // bypass; the rest, up to the largest module's count, follow all six such blocks, slot by
  // slot, so that no index released before them moved.
  static constexpr int32_t kSlotParameters = 12;
  static constexpr int32_t kModuleParameters = 41;
  static constexpr int32_t kSlotStride = 1 + kSlotParameters;
  static constexpr int32_t kExtraParameters = kModuleParameters - kSlotParameters;
  static constexpr int32_t kFirstExtra = kSlots * kSlotStride;
  static constexpr int32_t kParameterCount = kFirstExtra + kSlots * kExtraParameters;
  static constexpr int32_t BypassIndex(int32_t slot) noexcept { return slot * kSlotStride; }
  static constexpr int32_t ParameterIndex(int32_t slot, int32_t parameter) noexcept {
    return parameter < kSlotParameters ? slot * kSlotStride + 1 + parameter
                                       : kFirstExtra + slot * kExtraParameters + parameter - kSlotParameters;
  }

  KPipelineTable();

  KChainExchange chains{std::make_unique<KModuleChain>()};
  KChainView view{std::make_shared<const KModuleChain>()};
  std::vector<std::unique_ptr<KSlotKind>> kinds;
  std::vector<KParameterInfo> rows;
};

// The effect pipeline: modules of the effect-module registry in series, each added, removed,
// moved and bypassed on its own, stored with the plug-in's state and as an "Effect pipeline
// file" (core/KPipelineFile.h).
//
// Host parameters: six fixed slots, each with its bypass ("slot<s+1>bypass") and one parameter
// per module parameter p ("slot<s+1>param<p+1>", every parameter of the largest module) at
// BypassIndex and ParameterIndex. A module keeps the slot it was given from being added until it
// is removed; moving it changes only the processing order, so automation stays with its module
// whatever the order. Parameters past a module's own count, and those of free slots, do nothing.
//
// Edits run on the user-interface thread: they build a new chain (creating and configuring new
// modules there) and hand it over lock-free; the audio thread takes it at its next block and
// never allocates or frees. Each edit tells the host that the slot parameters' texts changed.
// Latency is the sum over the modules not bypassed, tail the sum over
// all of them.
class KEffectPipeline final : private KPipelineTable, public KAudioPlugin {
public:
  using KPipelineTable::kFirstExtra;
  using KPipelineTable::kModuleParameters;
  using KPipelineTable::kParameterCount;
  using KPipelineTable::kSlotParameters;
  using KPipelineTable::kSlots;
  using KPipelineTable::BypassIndex;
  using KPipelineTable::ParameterIndex;

  KEffectPipeline();
  ~KEffectPipeline() override;
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // ---- the chain (user-interface thread); KException with a sentence for the user
  // Adds the module of `key` (effect-module registry) at `position` (-1: the end) in the first
  // free slot, with its defaults; answers the slot.
  int32_t AddModule(const KString& key, int32_t position = -1);
  void RemoveModule(int32_t slot);
  // Moves the module of `slot` to `position` in the processing order.
  void MoveModule(int32_t slot, int32_t position);
  void SetModuleBypass(int32_t slot, bool bypass);
  int32_t ModuleCount() const noexcept { return static_cast<int32_t>(Chain().stages.size()); }
  int32_t SlotAt(int32_t position) const noexcept { return Chain().stages[position].slot; }
  // The position of the module in `slot`, -1 for a free slot.
  int32_t PositionOfSlot(int32_t slot) const noexcept { return Chain().PositionOfSlot(slot); }
  const KString& KeyAt(int32_t position) const noexcept { return Chain().stages[position].key; }
  // The module in `slot`, or null.
  KAudioPlugin* ModuleInSlot(int32_t slot) const noexcept;

  // The chain as a document; loading is all or nothing: a document naming an unknown module or
  // holding more modules than slots leaves the pipeline as it was.
  Element WritePipeline() const;
  void LoadPipeline(const Element& document);

  bool SetSampleRate(double sampleRate) override;
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override { forward_ = true; }
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;
  void StorePluginSettings(Element& section, uint32_t flags) override;

private:
  const KModuleChain& Chain() const noexcept { return *chains.Latest(); }
  std::shared_ptr<KAudioPlugin> MakeModule(const KString& key) const;
  int32_t CheckedPosition(int32_t slot) const;
  // Gives the slot's parameters the module's present values, or their defaults for no module.
  void ShowInSlot(int32_t slot, const KAudioPlugin* module, bool bypass);
  void Publish(std::unique_ptr<KModuleChain> chain);
  // Audio thread: the slots' values, bypass and channels to their modules.
  void Forward(const KModuleChain& chain) noexcept;
  // The slot's values to its module's parameters (either thread: values are atomic).
  void PassValues(const KModuleChain::Stage& stage) const noexcept;
  int32_t LatencyOf(const KModuleChain& chain) const noexcept;

  bool forward_ = true;  // audio thread: slot values to pass on before the next sub-block
};

extern const KPluginDescription kEffectPipelineDescription;
const KPluginHelp& KEffectPipelineHelp();
KEditorDescription KEffectPipelineEditor();
// The help-window mark-up of the editor's chain buttons by help key; empty for other keys.
KString KEffectPipelineButtonHelp(const KString& key);
