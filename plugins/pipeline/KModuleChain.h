#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
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
// chain it holds, and its modules, alive however soon the hand-over lets that chain go. The lock
// covers the copy of one pointer and nothing else; the audio thread never takes it.
class KChainView {
public:
  explicit KChainView(std::shared_ptr<const KModuleChain> chain) : chain_(std::move(chain)) {}
  std::shared_ptr<const KModuleChain> Load() const {
    std::lock_guard lock(mutex_);
    return chain_;
  }
  // The chain replaced is let go after the lock, where freeing it (and modules) costs readers nothing.
  void Store(std::shared_ptr<const KModuleChain> chain) {
    std::lock_guard lock(mutex_);
    chain_.swap(chain);
  }

private:
  mutable std::mutex mutex_;
  std::shared_ptr<const KModuleChain> chain_;
};
