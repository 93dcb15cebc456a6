#include "hosts/vst3/KVST3MIDIOutput.h"

namespace KVST3 {
namespace {
float Unit(uint8_t value) noexcept { return static_cast<float>(value & 127) / 127.0f; }
int8_t Byte(uint8_t value) noexcept { return static_cast<int8_t>(value & 127); }
}  // namespace

void KFlushMIDI(KHostMIDIList& pending, IEventList* events) noexcept {
  pending.Drain([events](const KHostMIDIList::Message& message) {
    Event event;
    if (events && KEventOf(message, event)) events->AddEvent(event);
  });
}

bool KEventOf(const KHostMIDIList::Message& message, Event& event) noexcept {
  const KMIDIBytes& bytes = message.bytes;
  const uint8_t status = bytes[0] & 0xF0;
  if (status < 0x80 || status == 0xF0) return false;
  event = Event{};
  event.sampleOffset = message.sampleOffset;
  const auto channel = static_cast<int16_t>(bytes[0] & 0x0F);
  if (status == 0x90 && (bytes[2] & 127) > 0) {
    event.type = Event::kNoteOnEvent;
    event.noteOn = {channel, Byte(bytes[1]), 0.0f, Unit(bytes[2]), 0, -1};
  } else if (status == 0x80 || status == 0x90) {
    event.type = Event::kNoteOffEvent;
    event.noteOff = {channel, Byte(bytes[1]), Unit(bytes[2]), -1, 0.0f};
  } else {
    event.type = Event::kLegacyMIDICCOutEvent;
    LegacyMIDICCOutEvent& out = event.midiCCOut;
    out.channel = static_cast<int8_t>(channel);
    switch (status) {
      case 0xA0: out = {LegacyMIDICCOutEvent::kPolyPressure, out.channel, Byte(bytes[1]), Byte(bytes[2])}; break;
      case 0xB0: out = {static_cast<uint8_t>(bytes[1] & 127), out.channel, Byte(bytes[2]), 0}; break;
      case 0xC0: out = {LegacyMIDICCOutEvent::kProgramChange, out.channel, Byte(bytes[1]), 0}; break;
      case 0xD0: out = {LegacyMIDICCOutEvent::kAfterTouch, out.channel, Byte(bytes[1]), 0}; break;
      default: out = {LegacyMIDICCOutEvent::kPitchBend, out.channel, Byte(bytes[1]), Byte(bytes[2])}; break;
    }
  }
  return true;
}

}  // namespace KVST3
