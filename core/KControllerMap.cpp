#include "core/KControllerMap.h"

bool KControllerMap::Assign(const Assignment& a) noexcept {
  if (a.number < 0 || a.number >= kNumberCount || a.channel < 0 || a.channel >= kChannelCount || a.parameter < 0 ||
      a.parameter >= kMaxParameters)
    return false;
  const int32_t count = Count();
  for (int32_t i = 0; i < count; ++i) {
    if (Get(i).parameter == a.parameter) {
      slots_[i].store(Pack(a), std::memory_order_relaxed);
      return true;
    }
  }
  if (count == kCapacity) return false;
  slots_[count].store(Pack(a), std::memory_order_relaxed);
  count_.store(count + 1, std::memory_order_release);  // the entry is whole before it is counted
  return true;
}
