#include "hosts/common/KHostMIDIList.h"

#include <utility>

KHostMIDIList::KHostMIDIList()
    : storage_(new Message[2 * kCapacity]), filling_(storage_.get()), taken_(storage_.get() + kCapacity) {}

KHostMIDIList::~KHostMIDIList() = default;

bool KHostMIDIList::Append(int32_t sampleOffset, const uint8_t bytes[4]) noexcept {
  std::unique_lock<std::mutex> lock(lock_, std::defer_lock);
  if (processThread_.load(std::memory_order_acquire) == std::this_thread::get_id()) {
    if (!lock.try_lock()) return false;
  } else {
    lock.lock();
  }
  if (count_ == kCapacity) return false;
  filling_[count_++] = {sampleOffset, {bytes[0], bytes[1], bytes[2], bytes[3]}};
  filled_.store(true, std::memory_order_release);
  return true;
}

int32_t KHostMIDIList::Swap() noexcept {
  // An append racing with this read is taken at the next swap, as when the lock is busy.
  if (!filled_.load(std::memory_order_acquire)) return 0;
  std::unique_lock<std::mutex> lock(lock_, std::try_to_lock);
  if (!lock.owns_lock()) return 0;
  filled_.store(false, std::memory_order_relaxed);
  std::swap(filling_, taken_);
  return std::exchange(count_, 0);
}
