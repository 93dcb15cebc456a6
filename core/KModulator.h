#pragma once

#include <cstdint>
#include <memory>

#include "kernel/KExport.h"

class Element;
class KAudioPlugin;

// Moves parameters while the audio plays: an LFO, say. A modulator adds to a parameter's
// normalised value for its working value only (KParameterValue::SetModulation), so hosts, states
// and editors go on seeing the value set.
//
// Made on the user-interface thread from the state document's "LFOs" section by the maker the
// plug-in library registers (the core knows no oscillator), and handed to the audio thread
// without a lock. There, before every piece of a host block, it adds that piece's modulation
// ramps (KAudioPluginBase::AddRamp with modulation set), which the processing cycle applies
// sample-accurately like automation.
class TORVANE_API KModulator {
public:
  virtual ~KModulator() = default;
  // Audio thread, never allocating: the ramps of the next `length` samples.
  virtual void Modulate(KAudioPlugin& plugin, int32_t length) noexcept = 0;
  // Audio thread: back to the start, as the plug-in was reset.
  virtual void Reset() noexcept {}
};

// Makes the modulator a section asks for, or null for one that asks for none.
using KModulatorMaker = std::unique_ptr<KModulator> (*)(KAudioPlugin& plugin, const Element& lfos);
TORVANE_API void KSetModulatorMaker(KModulatorMaker maker) noexcept;
KModulatorMaker KGetModulatorMaker() noexcept;
