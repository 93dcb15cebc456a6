#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <thread>

#include "core/KMIDIQueue.h"
#include "kernel/KExport.h"

// MIDI on its way between a host and the plug-in, one list per direction: the host's input
// waiting for the next processing call (VST 2's processEvents may come on any thread), or the
// plug-in's output waiting for the end of the block. Storage for kCapacity messages is made
// with the list, so nothing allocates later; the lock is held only to append or to swap the
// filled list out, never while messages are delivered.
//
// The processing thread never waits: between BeginBlock and EndBlock an append from that thread
// only tries the lock, and Drain always does; a message that finds the list full or busy is
// dropped (an append) or waits for the next block (a drain).
class TORVANE_API KHostMIDIList {
public:
  static constexpr int32_t kCapacity = 1024;
  struct Message {
    int32_t sampleOffset;
    KMIDIBytes bytes;
  };

  KHostMIDIList();
  KHostMIDIList(const KHostMIDIList&) = delete;
  KHostMIDIList& operator=(const KHostMIDIList&) = delete;
  ~KHostMIDIList();

  // Any thread. False when the message was dropped.
  bool Append(int32_t sampleOffset, const uint8_t bytes[4]) noexcept;
  // The processing thread, around the plug-in's processing of a block.
  void BeginBlock() noexcept { processThread_.store(std::this_thread::get_id(), std::memory_order_release); }
  void EndBlock() noexcept { processThread_.store(std::thread::id(), std::memory_order_release); }
  // The processing thread: swaps the filled list out and hands every message to `deliver`, in
  // the order appended.
  template <class Deliver>
  void Drain(Deliver&& deliver) noexcept {
    const int32_t count = Swap();
    for (int32_t i = 0; i < count; ++i) deliver(taken_[i]);
  }

private:
  // The number of messages now in taken_ (0 when the lock was busy or nothing was appended).
  int32_t Swap() noexcept;

  std::mutex lock_;
  std::unique_ptr<Message[]> storage_;
  Message* filling_;  // under lock_
  int32_t count_ = 0;
  // Set with the first append after a swap: most blocks find it clear and take no lock at all.
  std::atomic<bool> filled_{false};
  Message* taken_;  // the processing thread's, between swaps
  std::atomic<std::thread::id> processThread_{};
};
