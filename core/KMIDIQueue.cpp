#include "core/KMIDIQueue.h"

#include <bit>
#include <cstdlib>
#include <new>

#include "kernel/KException.h"
#include "kernel/KGuard.h"

KMIDIMonitor::~KMIDIMonitor() = default;

KMIDIQueue::KMIDIQueue() {
  // The reset rule keeps the count at or below kResetCount, so the storage is made for that
  // many at once (at the power of two the queue's growth would reach) and scheduling never
  // allocates.
  const int32_t capacity = static_cast<int32_t>(std::bit_ceil(static_cast<uint32_t>(kResetCount)));
  messages_ = static_cast<uint64_t*>(std::malloc(sizeof(uint64_t) * static_cast<size_t>(capacity)));
  if (!messages_) throw std::bad_alloc();
  capacity_ = capacity;
}

KMIDIQueue::~KMIDIQueue() { std::free(messages_); }

uint64_t KMIDIQueue::Pack(int32_t timeStamp, KMIDIBytes bytes) noexcept {
  return uint64_t{static_cast<uint32_t>(timeStamp)} | uint64_t{bytes[0]} << 32 | uint64_t{bytes[1]} << 40 |
         uint64_t{bytes[2]} << 48 | uint64_t{bytes[3]} << 56;
}

KMIDIBytes KMIDIQueue::Bytes(uint64_t message) noexcept {
  return {static_cast<uint8_t>(message >> 32), static_cast<uint8_t>(message >> 40), static_cast<uint8_t>(message >> 48),
          static_cast<uint8_t>(message >> 56)};
}

void KMIDIQueue::ScheduleMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept {
  KGuard("ScheduleMIDIEvent", [&] {
    if (!IsInputEnabled()) return;
    if (KMIDIMonitor* monitor = monitor_.load(std::memory_order_acquire)) {
      try {
        monitor->MonitorMIDIEvent(sampleOffset, bytes);
      } catch (const KException&) {
        return;  // the monitor vetoed the message
      }
    }
    const auto stamp = static_cast<int32_t>(int64_t{sampleOffset} * timeScale_ + timeOffset_);
    if (count_ >= kResetCount) Clear();
    if (count_ > delivered_ && stamp < TimeStamp(messages_[count_ - 1])) inOrder_ = false;
    messages_[count_++] = Pack(stamp, bytes);
  });
}

void KMIDIQueue::Clear() noexcept {
  count_ = 0;
  delivered_ = 0;
  inOrder_ = true;
}

// Insertion sort: stable, free of allocation, and linear on the almost sorted lists hosts send.
void KMIDIQueue::SortUndelivered() noexcept {
  for (int32_t i = delivered_ + 1; i < count_; ++i) {
    const uint64_t message = messages_[i];
    int32_t j = i;
    for (; j > delivered_ && TimeStamp(messages_[j - 1]) > TimeStamp(message); --j) messages_[j] = messages_[j - 1];
    messages_[j] = message;
  }
  inOrder_ = true;
}
