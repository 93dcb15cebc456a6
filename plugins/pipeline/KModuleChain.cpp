#include "plugins/pipeline/KModuleChain.h"

int32_t KModuleChain::PositionOfSlot(int32_t slot) const noexcept {
  for (size_t i = 0; i < stages.size(); ++i)
    if (stages[i].slot == slot) return static_cast<int32_t>(i);
  return -1;
}

int32_t KModuleChain::FirstFreeSlot() const noexcept {
  for (int32_t slot = 0; slot < kSlots; ++slot)
    if (PositionOfSlot(slot) < 0) return slot;
  return -1;
}
