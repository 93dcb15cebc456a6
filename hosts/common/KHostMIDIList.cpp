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
  return true;
}

int32_t KHostMIDIList::Swap() noexcept {
  std::unique_lock<std::mutex> lock(lock_, std::try_to_lock);
  if (!lock.owns_lock()) return 0;
  std::swap(filling_, taken_);
  return std::exchange(count_, 0);
}
