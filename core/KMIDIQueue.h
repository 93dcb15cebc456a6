#pragma once

#include <array>
#include <atomic>
#include <cstdint>

#include "kernel/KExport.h"

// One short MIDI message as a host delivers it: status, two data bytes and a fourth byte
// (0 for ordinary three-byte messages).
using KMIDIBytes = std::array<uint8_t, 4>;

// Sees every incoming message before it is queued (a MIDI activity display, controller learn).
class TORVANE_API KMIDIMonitor {
public:
  KMIDIMonitor() noexcept = default;
  KMIDIMonitor(const KMIDIMonitor&) = delete;
  KMIDIMonitor& operator=(const KMIDIMonitor&) = delete;
  virtual ~KMIDIMonitor();

  // Throwing a KException drops the message without a trace.
  virtual void MonitorMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) = 0;
};

// The MIDI messages of the current block, each packed into one word so that the queue is a
// flat array of integers: bits 0-31 the time stamp in samples, 32-39 the status, 40-47 and
// 48-55 the data bytes, 56-63 the fourth byte.
//
// Threading: the host adapter schedules and the processing cycle drains on the audio thread,
// without a lock. The input switch and the monitor may be changed from any thread; a monitor
// must outlive its installation plus the processing call that may still be using it.
class TORVANE_API KMIDIQueue {
public:
  // A block that brings this many messages is runaway input: the queue starts over.
  static constexpr int32_t kResetCount = 1025;

  KMIDIQueue();
  KMIDIQueue(const KMIDIQueue&) = delete;
  KMIDIQueue& operator=(const KMIDIQueue&) = delete;
  ~KMIDIQueue();

  static uint64_t Pack(int32_t timeStamp, KMIDIBytes bytes) noexcept;
  static int32_t TimeStamp(uint64_t message) noexcept { return static_cast<int32_t>(static_cast<uint32_t>(message)); }
  static KMIDIBytes Bytes(uint64_t message) noexcept;

  // Switched off, incoming messages are dropped before the monitor sees them.
  void SetInputEnabled(bool enabled) noexcept { inputEnabled_.store(enabled, std::memory_order_relaxed); }
  bool IsInputEnabled() const noexcept { return inputEnabled_.load(std::memory_order_relaxed); }
  // Null removes the monitor.
  void SetMonitor(KMIDIMonitor* monitor) noexcept { monitor_.store(monitor, std::memory_order_release); }

  // How the host's sample offsets map to the plug-in's block: stamp = offset x scale + offset.
  // Set by the plug-in for the current block (an oversampling factor, samples already done).
  void SetTimeBase(int32_t scale, int32_t offset) noexcept {
    timeScale_ = scale;
    timeOffset_ = offset;
  }

  // Queues one message of the host's current block. Never allocates and never throws.
  void ScheduleMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept;

  int32_t Count() const noexcept { return count_; }
  int32_t Capacity() const noexcept { return capacity_; }
  uint64_t operator[](int32_t index) const noexcept { return messages_[index]; }
  // Empties the queue; the processing cycle does so once a block is done.
  void Clear() noexcept;

  // Hands visit(timeStamp, bytes) every message stamped before `end` that it has not handed out
  // yet, earliest first (messages with equal stamps keep their order of arrival).
  template <class Visit>
  void Drain(int32_t end, Visit&& visit) {
    if (!inOrder_) SortUndelivered();
    while (delivered_ < count_ && TimeStamp(messages_[delivered_]) < end) {
      const uint64_t message = messages_[delivered_++];
      visit(TimeStamp(message), Bytes(message));
    }
  }

  // The time stamp of the earliest message not handed out yet; false when there is none.
  bool NextTimeStamp(int32_t& stamp) noexcept {
    if (!inOrder_) SortUndelivered();
    if (delivered_ >= count_) return false;
    stamp = TimeStamp(messages_[delivered_]);
    return true;
  }

private:
  void SortUndelivered() noexcept;

  uint64_t* messages_ = nullptr;
  int32_t count_ = 0;
  int32_t capacity_ = 0;
  int32_t delivered_ = 0;  // messages before this index were handed out by Drain
  bool inOrder_ = true;    // the messages not handed out yet are sorted by time stamp
  int32_t timeScale_ = 1;
  int32_t timeOffset_ = 0;
  std::atomic<bool> inputEnabled_{true};
  std::atomic<KMIDIMonitor*> monitor_{nullptr};
};
