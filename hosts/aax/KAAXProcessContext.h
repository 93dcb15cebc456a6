#pragma once

#include <cstdint>

#include "hosts/aax/KAAXBase.h"

class KAudioPluginAAXAdapter;

// What the host hands KAAXProcessCallback for one instance and one buffer: the plug-in's
// channels (inputs may be null for silence; outputs one per output channel), the buffer length,
// the MIDI nodes (null when the host gives none), the transport and the adapter the host was
// given at instance creation.
struct KAAXProcessContext {
  const float* const* inputs;
  float* const* outputs;
  const int32_t* bufferSize;
  const KAAX::MidiStream* midiInput;
  KAAX::MidiStream* midiOutput;
  const KAAX::ITransport* transport;
  KAudioPluginAAXAdapter* adapter;
};
