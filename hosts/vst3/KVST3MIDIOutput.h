#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <thread>

#include "core/KMIDIQueue.h"
#include "hosts/vst3/KVST3Processing.h"

namespace KVST3 {

// MIDI the plug-in produces, on its way to the host's "Midi Out" bus. A fixed list under its
// own lock, held only to append or to hand the list over: the processing call never waits for
// it (a send from inside processing, and the hand-over at the block's end, only try the lock;
// a message that finds the list full or busy is dropped rather than stall the audio thread).
class KMIDIOutput {
public:
  static constexpr int32_t kCapacity = 1024;

  // Any thread.
  void Append(int32_t sampleOffset, const uint8_t bytes[4]) noexcept;
  // Audio thread, around the plug-in's processing of a block.
  void BeginBlock() noexcept { processThread_.store(std::this_thread::get_id(), std::memory_order_release); }
  void EndBlock() noexcept { processThread_.store(std::thread::id(), std::memory_order_release); }
  // Hands the pending messages to the host's event list as events of bus 0, in order.
  void Flush(IEventList* events) noexcept;

  // The event a short MIDI message becomes; false for a message that is no channel message.
  static bool ToEvent(int32_t sampleOffset, const uint8_t bytes[4], Event& event) noexcept;

private:
  std::mutex lock_;
  KMIDIBytes bytes_[kCapacity] = {};
  int32_t offsets_[kCapacity] = {};
  int32_t count_ = 0;
  std::atomic<std::thread::id> processThread_{};
};

}  // namespace KVST3
