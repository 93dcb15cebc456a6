#pragma once

#include <cstdint>
#include <functional>
#include <utility>
#include <vector>

#include "kernel/KString.h"
#include "ui/controls/KControl.h"

class KButton;
class KEditorHost;
class KEffectPipeline;

// The chain of an effect pipeline in its editor: a row per module in processing order (its
// slot, its name, and buttons to bypass, move up, move down and remove it) and a button that
// adds a module from a menu of the effect-module registry, in the registry's category order.
// Every edit is one undo step, runs through the pipeline's own edits on this thread, and tells
// the host each slot parameter it moved. The rows follow the chain on the tree's tick, so that
// a chain changed elsewhere (undo, a preset, a state from the host) shows as well.
class KPipelineChainPanel final : public KControl {
public:
  static constexpr int32_t kRowHeight = 28;
  // Help keys of the buttons.
  static constexpr const char* kAddKey = "module-add";
  static constexpr const char* kBypassKey = "module-bypass";
  static constexpr const char* kUpKey = "module-up";
  static constexpr const char* kDownKey = "module-down";
  static constexpr const char* kRemoveKey = "module-remove";

  KPipelineChainPanel(const KRect& bounds, KEffectPipeline& pipeline, KEditorHost* host);

  void OnTimer() override;

private:
  // What a row shows: the module's key and slot, in processing order.
  using Shown = std::vector<std::pair<KString, int32_t>>;
  Shown Current() const;
  void Rebuild();
  void OpenAddMenu();
  // One edit of the chain: an undo step first, the host told of what moved after; a KException
  // becomes a message to the user.
  void Edit(const std::function<void()>& edit);
  void Move(int32_t slot, int32_t by);

  KEffectPipeline& pipeline_;
  KEditorHost* host_;
  KControl* section_;
  KButton* add_;
  std::vector<KControl*> rows_;  // the controls of the rows, children of the section
  Shown shown_;
};
