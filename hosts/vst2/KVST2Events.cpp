#include "hosts/vst2/KVST2Events.h"

#include <cstring>

namespace KVST2 {

void KQueueMIDIInput(const VstEvents& events, KHostMIDIList& pending) noexcept {
  for (int32_t i = 0; i < events.numEvents; ++i) {
    const VstEvent* event = events.events[i];
    if (!event || event->type != kVstMidiType) continue;
    VstMidiEvent midi;
    std::memcpy(&midi, event, sizeof midi);
    uint8_t bytes[4];
    std::memcpy(bytes, midi.midiData, sizeof bytes);
    pending.Append(midi.deltaFrames, bytes);
  }
}

KEventOutput::KEventOutput() : events_(new VstMidiEvent[KHostMIDIList::kCapacity]), block_(new Block{}) {}

VstEvents* KEventOutput::Take(KHostMIDIList& pending) noexcept {
  VstEvent** pointers = block_->header.events;
  int32_t count = 0;
  pending.Drain([&](const KHostMIDIList::Message& message) {
    VstMidiEvent& event = events_[count];
    event = VstMidiEvent{kVstMidiType, static_cast<int32_t>(sizeof(VstMidiEvent)), message.sampleOffset, 0, 0, 0, {}, 0, 0, 0, 0};
    std::memcpy(event.midiData, message.bytes.data(), sizeof event.midiData);
    pointers[count++] = reinterpret_cast<VstEvent*>(&event);
  });
  block_->header.numEvents = count;
  return count > 0 ? &block_->header : nullptr;
}

}  // namespace KVST2
