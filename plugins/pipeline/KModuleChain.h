#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KHandOver.h"
#include "kernel/KString.h"

// One arrangement of an effect pipeline's modules. Made and configured off the audio thread and
// never changed once published (KHandOver): an edit makes a new chain that shares the modules
// it keeps, so that they go on sounding (tails, delay lines) across the swap.
struct KModuleChain {
  static constexpr int32_t kSlots = 6;

  struct Stage {
    std::shared_ptr<KAudioPlugin> module;
    KString key;   // in the effect-module registry
    int32_t slot;  // which parameter slot of the host carries its parameters
  };

  std::vector<Stage> stages;  // processing order
  // The position of the stage in each slot, -1 for a free slot.
  int32_t PositionOfSlot(int32_t slot) const noexcept;
  int32_t FirstFreeSlot() const noexcept;
};

using KChainExchange = KHandOver<KModuleChain>;

// The newest chain as threads other than the audio thread read it (a host asking a slot
// parameter's text while the user-interface thread edits): shared, so that a reader keeps the
// chain and its modules it holds alive however soon the hand-over lets that chain go. The
// audio thread never touches it.
using KChainView = std::atomic<std::shared_ptr<const KModuleChain>>;
