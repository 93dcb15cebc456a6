#include "hosts/vst3/KVST3Buses.h"

#include <algorithm>

#include "hosts/vst3/KVST3Util.h"
#include "kernel/KFormat.h"

namespace KVST3 {
namespace {
SpeakerArrangement ArrangementOf(int32_t channels) noexcept {
  return channels == 1 ? SpeakerArrangements::kMono : SpeakerArrangements::kStereo;
}

// The channel count of an arrangement the plug-in could take, or 0.
int32_t ChannelsOf(SpeakerArrangement arrangement) noexcept {
  if (arrangement == SpeakerArrangements::kMono) return 1;
  if (arrangement == SpeakerArrangements::kStereo) return 2;
  return 0;
}

// Audio bus names: a single bus keeps the plain name, several are numbered from 1.
KString AudioBusName(int32_t direction, int32_t index, int32_t count) {
  if (direction == kInput && count == 2) return index == 0 ? KString("Input") : KString("Sidechain");
  const KString base = direction == kInput ? KString("Input") : KString("Output");
  return count == 1 ? base : KFormatText("{0} {1}", base, index + 1);
}
}  // namespace

void KBusLayout::Build() noexcept {
  const KAudioPlugin::Shape& shape = plugin_.GetShape();
  inputBuses_ = std::clamp(shape.inputBuses, 0, kMaxBuses);
  outputBuses_ = std::clamp(shape.outputBuses, 0, kMaxBuses);
  eventInputs_ = shape.acceptsMIDI ? 1 : 0;
  eventOutputs_ = shape.producesMIDI ? 1 : 0;
  // A second input is a side-chain: it waits for the host to switch it on.
  for (int32_t b = 0; b < inputBuses_; ++b) inputActive_[b] = !(inputBuses_ == 2 && b == 1);
  for (int32_t b = 0; b < outputBuses_; ++b) outputActive_[b] = true;
}

int32_t KBusLayout::Count(int32_t type, int32_t direction) const noexcept {
  if (type == kAudio) return direction == kInput ? inputBuses_ : outputBuses_;
  if (type == kEvent) return direction == kInput ? eventInputs_ : eventOutputs_;
  return 0;
}

bool KBusLayout::Describe(int32_t type, int32_t direction, int32_t index, BusInfo& info) const {
  const int32_t count = Count(type, direction);
  if (index < 0 || index >= count) return false;
  info = BusInfo{};
  info.mediaType = type;
  info.direction = direction;
  if (type == kEvent) {
    info.channelCount = 16;
    info.busType = kMain;
    info.flags = BusInfo::kDefaultActive;
    KCopyText(direction == kInput ? KString("Midi In") : KString("Midi Out"), info.name, 128);
    return true;
  }
  const bool sideChain = direction == kInput && count == 2 && index == 1;
  info.channelCount = plugin_.ChannelsPerBus();
  info.busType = sideChain ? kAux : kMain;
  info.flags = sideChain ? 0 : BusInfo::kDefaultActive;
  KCopyText(AudioBusName(direction, index, count), info.name, 128);
  return true;
}

bool KBusLayout::Activate(int32_t type, int32_t direction, int32_t index, bool active) noexcept {
  if (index < 0 || index >= Count(type, direction)) return false;
  if (type == kAudio) (direction == kInput ? inputActive_ : outputActive_)[index] = active;
  return true;
}

bool KBusLayout::Arrange(const SpeakerArrangement* inputs, int32_t inputCount, const SpeakerArrangement* outputs,
                         int32_t outputCount) noexcept {
  if (inputCount != inputBuses_ || outputCount != outputBuses_) return false;
  if ((inputCount > 0 && !inputs) || (outputCount > 0 && !outputs)) return false;
  const SpeakerArrangement first = outputCount > 0 ? outputs[0] : (inputCount > 0 ? inputs[0] : SpeakerArrangements::kEmpty);
  const int32_t channels = ChannelsOf(first);
  if (channels == 0) return false;
  for (int32_t b = 0; b < inputCount; ++b)
    if (inputs[b] != first) return false;
  for (int32_t b = 0; b < outputCount; ++b)
    if (outputs[b] != first) return false;
  return plugin_.SetChannelsPerBus(channels);
}

bool KBusLayout::Arrangement(int32_t direction, int32_t index, SpeakerArrangement& arrangement) const noexcept {
  if (index < 0 || index >= Count(kAudio, direction)) return false;
  arrangement = ArrangementOf(plugin_.ChannelsPerBus());
  return true;
}

bool KBusLayout::MapBuffers(const ProcessData& data, const KHostChannelMap& map, const float** inputs, float** outputs) const noexcept {
  const int32_t channels = plugin_.ChannelsPerBus();
  for (int32_t b = 0; b < inputBuses_; ++b) {
    // An inactive bus, or one the host left out, reads as silence.
    const AudioBusBuffers* bus = b < data.numInputs && data.inputs && inputActive_[b] ? &data.inputs[b] : nullptr;
    map.MapInputs(bus ? bus->channelBuffers32 : nullptr, bus ? bus->numChannels : 0, channels, data.numSamples, inputs + b * channels);
  }
  for (int32_t b = 0; b < outputBuses_; ++b) {
    const AudioBusBuffers* bus = b < data.numOutputs && data.outputs ? &data.outputs[b] : nullptr;
    if (!map.MapOutputs(bus ? bus->channelBuffers32 : nullptr, bus ? bus->numChannels : 0, channels, data.numSamples, outputs + b * channels))
      return false;
  }
  return true;
}

void KBusLayout::MarkSilence(ProcessData& data) noexcept {
  for (int32_t b = 0; b < data.numOutputs && data.outputs; ++b) {
    AudioBusBuffers& bus = data.outputs[b];
    bus.silenceFlags = 0;
    for (int32_t c = 0; c < bus.numChannels && c < 64 && bus.channelBuffers32; ++c) {
      const float* samples = bus.channelBuffers32[c];
      if (samples && std::all_of(samples, samples + data.numSamples, [](float s) { return s == 0.0f; })) bus.silenceFlags |= 1ull << c;
    }
  }
}

}  // namespace KVST3
