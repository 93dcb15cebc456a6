#pragma once

#include <memory>

#include "hosts/common/KHostMIDIList.h"
#include "hosts/vst2/KVST2Interface.h"

namespace KVST2 {

// The host's events into the list that waits for the next processing call: a 32-byte copy of
// each MIDI event, in order; every other kind (system exclusive) is dropped.
void KQueueMIDIInput(const VstEvents& events, KHostMIDIList& pending) noexcept;

// The plug-in's MIDI output as the VstEvents block a host takes with audioMasterProcessEvents.
// The events and the block are made with the object, for as many messages as a list holds, so
// the processing call only fills them in.
class KEventOutput {
public:
  KEventOutput();
  // Empties `pending` into the block; null when there was nothing to send.
  VstEvents* Take(KHostMIDIList& pending) noexcept;

private:
  // The block as a host reads it: the header's two pointers continue into `more`.
  struct Block {
    VstEvents header;
    VstEvent* more[KHostMIDIList::kCapacity - 2];
  };
  static_assert(offsetof(Block, more) == sizeof(VstEvents), "the pointers must run on without a gap");

  std::unique_ptr<VstMidiEvent[]> events_;
  std::unique_ptr<Block> block_;
};

}  // namespace KVST2
