#pragma once

#include <atomic>
#include <cstdint>

#include "kernel/KExport.h"

// Which MIDI controllers move which parameters. The user-interface thread changes the map
// (editing, state loading; one thread at a time); the audio thread reads it while processing,
// without a lock or an allocation: each assignment is one atomic word in a fixed table, so a
// reader sees every entry whole, either as it was or as it became. A reader that meets a state
// load half done hears the assignments loaded so far; the next controller value finds them all.
class TORVANE_API KControllerMap {
public:
  static constexpr int32_t kCapacity = 128;
  // Controller numbers 0 to 127 and pitch bend (KMIDIEvent::kPitchBend).
  static constexpr int32_t kNumberCount = 129;
  static constexpr int32_t kChannelCount = 16;
  static constexpr int32_t kMaxParameters = 0x10000;

  struct Assignment {
    int32_t number;
    int32_t channel;  // 0 to 15; heard alone only while single-channel listening is on
    int32_t parameter;
    bool operator==(const Assignment&) const noexcept = default;
  };

  // Makes `parameter` follow a controller, replacing whatever it followed before. False for a
  // number, channel or parameter out of range, or when the table is full.
  bool Assign(const Assignment& assignment) noexcept;
  void Clear() noexcept { count_.store(0, std::memory_order_release); }
  int32_t Count() const noexcept { return count_.load(std::memory_order_acquire); }
  // In the order assigned.
  Assignment Get(int32_t index) const noexcept { return Unpack(slots_[index].load(std::memory_order_relaxed)); }

  // Switches every assignment off or on, keeping them.
  void SetEnabled(bool enabled) noexcept { enabled_.store(enabled, std::memory_order_relaxed); }
  bool IsEnabled() const noexcept { return enabled_.load(std::memory_order_relaxed); }
  // On: an assignment hears only its own channel. Off: it hears its controller on any channel.
  void SetSingleChannel(bool single) noexcept { singleChannel_.store(single, std::memory_order_relaxed); }
  bool IsSingleChannel() const noexcept { return singleChannel_.load(std::memory_order_relaxed); }

  // Not read while processing: notes that move parameters (kept in the state, not played by
  // this product yet), and whether loading a preset keeps the assignments as they are.
  void SetNoteControllersEnabled(bool enabled) noexcept { noteControllersEnabled_ = enabled; }
  bool AreNoteControllersEnabled() const noexcept { return noteControllersEnabled_; }
  void SetDoNotLoadFromPresets(bool keep) noexcept { doNotLoadFromPresets_ = keep; }
  bool DoNotLoadFromPresets() const noexcept { return doNotLoadFromPresets_; }

  // Audio thread: calls `apply(parameter)` for every assignment that hears this controller.
  template <class Apply>
  void ForEachListener(int32_t number, int32_t channel, Apply&& apply) const noexcept {
    if (!IsEnabled()) return;
    const bool single = IsSingleChannel();
    const int32_t count = Count();
    for (int32_t i = 0; i < count; ++i) {
      const Assignment a = Get(i);
      if (a.number == number && (!single || a.channel == channel)) apply(a.parameter);
    }
  }

private:
  // Number in bits 0-7, channel in 8-11, parameter in 16-31.
  static uint32_t Pack(const Assignment& a) noexcept {
    return static_cast<uint32_t>(a.number) | static_cast<uint32_t>(a.channel) << 8 | static_cast<uint32_t>(a.parameter) << 16;
  }
  static Assignment Unpack(uint32_t word) noexcept {
    return {static_cast<int32_t>(word & 0xFF), static_cast<int32_t>(word >> 8 & 0xF), static_cast<int32_t>(word >> 16)};
  }
  std::atomic<uint32_t> slots_[kCapacity] = {};
  std::atomic<int32_t> count_{0};
  std::atomic<bool> enabled_{true};
  std::atomic<bool> singleChannel_{false};
  bool noteControllersEnabled_ = true;
  bool doNotLoadFromPresets_ = false;
};
