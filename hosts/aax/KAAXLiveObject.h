#pragma once

#include <atomic>
#include <cstdint>

// A member of every object the kernel hands an AAX host (effects, GUIs): while any lives, the
// library must stay loaded (ACFCanUnloadNow).
class KAAXLiveObject {
public:
  KAAXLiveObject() noexcept { count_.fetch_add(1, std::memory_order_relaxed); }
  KAAXLiveObject(const KAAXLiveObject&) = delete;
  KAAXLiveObject& operator=(const KAAXLiveObject&) = delete;
  ~KAAXLiveObject() { count_.fetch_sub(1, std::memory_order_relaxed); }

  static int32_t Count() noexcept { return count_.load(std::memory_order_relaxed); }

private:
  static inline std::atomic<int32_t> count_{0};
};
