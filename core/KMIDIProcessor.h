#pragma once

#include <cstdint>

#include "core/KMIDIQueue.h"
#include "core/KTransport.h"
#include "kernel/KExport.h"

// One decoded MIDI message, as the handlers of KMIDIProcessorBase receive it.
struct KMIDIEvent {
  enum Kind : uint8_t { kNoteOff = 0, kNoteOn = 1, kPressure = 2, kController = 3 };
  static constexpr uint8_t kChannelPressure = 255;  // number of a pressure event for the whole channel
  static constexpr uint8_t kPitchBend = 128;        // number under which pitch bend reaches the controllers

  int32_t sampleOffset = 0;  // the message's time stamp in the plug-in's block
  double musicalTime = 0.0;  // quarter notes
  uint8_t channel = 0;       // 0 to 15
  uint8_t number = 0;        // note, controller, kChannelPressure or kPitchBend
  uint8_t kind = kNoteOff;
  double value = 0.0;        // normalised: 0..1, pitch bend -1..8191/8192
};

// The receiving side of MIDI input: a plug-in overrides the handlers it needs (the defaults
// ignore the event). They run on the audio thread, inside the processing cycle; a KException
// thrown by one ends only that event.
class TORVANE_API KMIDIProcessorBase {
public:
  KMIDIProcessorBase() noexcept = default;
  KMIDIProcessorBase(const KMIDIProcessorBase&) = delete;
  KMIDIProcessorBase& operator=(const KMIDIProcessorBase&) = delete;
  virtual ~KMIDIProcessorBase();

  // Note on and off, polyphonic pressure (number = the note) and channel pressure (number =
  // kChannelPressure).
  virtual void ProcessNotePerformCore(const KMIDIEvent& event);
  // Controller 120 (all sound off) or 123 (all notes off); the number tells which.
  virtual void ProcessAllNotesOff(const KMIDIEvent& event);
  // Controller 64, valued like any 7-bit controller: the pedal is down from 0.5 up (MIDI 64).
  virtual void ProcessSustain(const KMIDIEvent& event);
  // Every other controller, and pitch bend as number kPitchBend.
  virtual void ProcessMIDIController(const KMIDIEvent& event);
};

// Decodes queued MIDI messages into events for the handlers. Musical times are taken from the
// transport of the current block, which the owner keeps up to date and which must outlive the
// processor.
class TORVANE_API KMIDIProcessor : public KMIDIProcessorBase {
public:
  explicit KMIDIProcessor(const KTransport& transport) noexcept : transport_(transport) {}

  // The plug-in's sample rate in Hz, above zero.
  void SetSampleRate(double sampleRate) noexcept { sampleRate_ = sampleRate; }

  // Decodes one channel message and hands it to its handler. Answers 1 when it did, 0 for a
  // message it ignores (system messages, program changes).
  int32_t ProcessMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept;

  // Decodes the queued messages stamped before `end` that were not decoded yet, earliest first.
  // The processing cycle calls it with the end of each sub-block; it does not allocate.
  void ProcessMIDIQueue(KMIDIQueue& queue, int32_t end) noexcept;

private:
  int32_t Decode(int32_t sampleOffset, KMIDIBytes bytes);
  void DecodeController(KMIDIEvent& event, uint8_t value);

  const KTransport& transport_;
  double sampleRate_ = 44100.0;
  // The last most significant controller (0-31) waiting for its least significant partner.
  int8_t pendingMSBNumber_ = -1;
  uint8_t pendingMSBValue_ = 0;
};
