#include "core/KMIDIProcessor.h"

#include "kernel/KException.h"
#include "kernel/KGuard.h"

namespace {
constexpr uint8_t kSustainController = 64;
constexpr uint8_t kAllSoundOffController = 120;
constexpr uint8_t kAllNotesOffController = 123;

using Handler = void (KMIDIProcessorBase::*)(const KMIDIEvent&);

// A KException ends only the event that raised it; anything else is traced under the
// handler's operation name.
void Deliver(KMIDIProcessorBase& receiver, Handler handler, const char* operation, const KMIDIEvent& event) noexcept {
  KGuard(operation, [&] {
    try {
      (receiver.*handler)(event);
    } catch (const KException&) {
    }
  });
}

void DeliverNote(KMIDIProcessorBase& receiver, const KMIDIEvent& event) noexcept {
  Deliver(receiver, &KMIDIProcessorBase::ProcessNotePerformCore, "KMIDIProcessorBase::ProcessNotePerformCore", event);
}

// Pressure keeps its offset by one: 127 gives 126/127.
double Pressure(uint8_t v) noexcept { return v == 0 ? 0.0 : (v - 1) / 127.0; }

// Both 0 and 1 give 0.0, 127 gives 1.0.
double SevenBitController(uint8_t v) noexcept { return v == 0 ? 0.0 : (v - 1) / 126.0; }
}  // namespace

KMIDIProcessorBase::~KMIDIProcessorBase() = default;
void KMIDIProcessorBase::ProcessNotePerformCore(const KMIDIEvent&) {}
void KMIDIProcessorBase::ProcessAllNotesOff(const KMIDIEvent&) {}
void KMIDIProcessorBase::ProcessSustain(const KMIDIEvent&) {}
void KMIDIProcessorBase::ProcessMIDIController(const KMIDIEvent&) {}

int32_t KMIDIProcessor::ProcessMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept {
  int32_t handled = 0;
  KGuard("KMIDIProcessor::ProcessMIDIEvent", [&] { handled = Decode(sampleOffset, bytes); });
  return handled;
}

void KMIDIProcessor::ProcessMIDIQueue(KMIDIQueue& queue, int32_t end) noexcept {
  queue.Drain(end, [this](int32_t timeStamp, KMIDIBytes bytes) { ProcessMIDIEvent(timeStamp, bytes); });
}

int32_t KMIDIProcessor::Decode(int32_t sampleOffset, KMIDIBytes bytes) {
  const uint8_t status = bytes[0] & 0xF0;
  // System messages are not channel events; program changes are left to the plug-in.
  if (status < 0x80 || status > 0xE0 || status == 0xC0) return 0;

  KMIDIEvent event;
  event.sampleOffset = sampleOffset;
  event.musicalTime = transport_.songPosition + sampleOffset * transport_.tempo / (sampleRate_ * 60.0);
  event.channel = bytes[0] & 0x0F;
  event.number = bytes[1] & 127;
  const uint8_t data2 = bytes[2] & 127;
  switch (status) {
    case 0x80:
    case 0x90:
      event.kind = status == 0x90 && data2 > 0 ? KMIDIEvent::kNoteOn : KMIDIEvent::kNoteOff;
      event.value = data2 / 127.0;
      DeliverNote(*this, event);
      break;
    case 0xA0:
      event.kind = KMIDIEvent::kPressure;
      event.value = Pressure(data2);
      DeliverNote(*this, event);
      break;
    case 0xB0:
      DecodeController(event, data2);
      break;
    case 0xD0:
      event.kind = KMIDIEvent::kPressure;
      event.value = Pressure(event.number);
      event.number = KMIDIEvent::kChannelPressure;
      DeliverNote(*this, event);
      break;
    default:  // 0xE0 pitch bend, centred on 8192
      event.kind = KMIDIEvent::kController;
      event.number = KMIDIEvent::kPitchBend;
      event.value = (((bytes[2] * 128) | bytes[1]) - 8192) / 8192.0;
      Deliver(*this, &KMIDIProcessorBase::ProcessMIDIController, "KMIDIProcessorBase::ProcessMIDIController", event);
      break;
  }
  return 1;
}

// Controllers 0-31 may be followed by their fine partner 32-63; the pair then reaches the
// handler under the coarse number, so that an assignment to it gets the full resolution.
void KMIDIProcessor::DecodeController(KMIDIEvent& event, uint8_t value) {
  const uint8_t number = event.number;
  event.kind = KMIDIEvent::kController;
  event.value = SevenBitController(value);
  if (number < 32) {
    pendingMSBNumber_ = static_cast<int8_t>(number);
    pendingMSBValue_ = value;
  } else if (number < 64 && pendingMSBNumber_ == number - 32) {
    const int32_t raw = pendingMSBValue_ * 128 + value;
    event.number = static_cast<uint8_t>(pendingMSBNumber_);
    event.value = raw > 0 ? (raw - 1) / 16382.0 : 0.0;
    pendingMSBNumber_ = -1;
  }

  // The pedal and the channel-mode messages go to their own handler only, so that a controller
  // assignment never mistakes them for a continuous control.
  switch (number) {
    case kSustainController:
      Deliver(*this, &KMIDIProcessorBase::ProcessSustain, "KMIDIProcessorBase::ProcessSustain", event);
      break;
    case kAllSoundOffController:
    case kAllNotesOffController:
      Deliver(*this, &KMIDIProcessorBase::ProcessAllNotesOff, "KMIDIProcessorBase::ProcessAllNotesOff", event);
      break;
    default:
      Deliver(*this, &KMIDIProcessorBase::ProcessMIDIController, "KMIDIProcessorBase::ProcessMIDIController", event);
      break;
  }
}
