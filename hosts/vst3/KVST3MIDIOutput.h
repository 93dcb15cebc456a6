#pragma once

#include "hosts/common/KHostMIDIList.h"
#include "hosts/vst3/KVST3Processing.h"

namespace KVST3 {

// MIDI the plug-in produced during the block, to the host's "Midi Out" bus: every message of
// `pending` as an event of bus 0, in order (the list and its lock are the hosts' shared one).
void KFlushMIDI(KHostMIDIList& pending, IEventList* events) noexcept;

// The event a short MIDI message becomes; false for a message that is no channel message.
bool KEventOf(const KHostMIDIList::Message& message, Event& event) noexcept;

}  // namespace KVST3
