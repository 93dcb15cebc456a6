#pragma once

#include <cstdint>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostChannelMap.h"
#include "hosts/vst3/KVST3Processing.h"

namespace KVST3 {

// The plug-in's buses as the host sees them, and the host's buffers as the plug-in sees them.
//   inputs:  one "Input" (main); two: "Input" (main) and "Sidechain" (auxiliary, inactive until
//            the host activates it); three or more: "Input 1", "Input 2", ... (all main)
//   outputs: one "Output"; two or more: "Output 1", "Output 2", ...
//   events:  "Midi In" when the plug-in accepts MIDI, "Midi Out" when it produces it (16 channels)
// Every audio bus carries the plug-in's channels per bus: mono or stereo, the same on all.
class KBusLayout {
public:
  explicit KBusLayout(KAudioPlugin& plugin) noexcept : plugin_(plugin) {}

  // Makes the buses (at initialize), each in its default activation.
  void Build() noexcept;
  int32_t Count(int32_t type, int32_t direction) const noexcept;
  bool Describe(int32_t type, int32_t direction, int32_t index, BusInfo& info) const;
  bool Activate(int32_t type, int32_t direction, int32_t index, bool active) noexcept;

  // Accepts the host's arrangements when they are one of the plug-in's channel counts, the
  // same on every bus; refuses anything else and keeps the present count.
  bool Arrange(const SpeakerArrangement* inputs, int32_t inputCount, const SpeakerArrangement* outputs, int32_t outputCount) noexcept;
  bool Arrangement(int32_t direction, int32_t index, SpeakerArrangement& arrangement) const noexcept;

  // The plug-in's channel pointers for one block of the host's buffers, bus by bus through
  // `map`: a bus the host left out or did not activate reads as silence. False when an output
  // has nowhere to go.
  bool MapBuffers(const ProcessData& data, const KHostChannelMap& map, const float** inputs, float** outputs) const noexcept;
  // Raises the silence flag of every output channel whose block is all zeros.
  static void MarkSilence(ProcessData& data) noexcept;

private:
  static constexpr int32_t kMaxBuses = KAudioPlugin::kMaxChannels;

  KAudioPlugin& plugin_;
  int32_t inputBuses_ = 0;
  int32_t outputBuses_ = 0;
  int32_t eventInputs_ = 0;
  int32_t eventOutputs_ = 0;
  bool inputActive_[kMaxBuses] = {};
  bool outputActive_[kMaxBuses] = {};
};

}  // namespace KVST3
