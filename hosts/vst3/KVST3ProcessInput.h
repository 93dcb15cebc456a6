#pragma once

#include <cstdint>

#include "hosts/vst3/KVST3Processing.h"

class KAudioPlugin;
struct KTransport;

namespace KVST3 {

class KParameterTable;

// What the host's processing call brings, handed to the plug-in. All of it runs on the audio
// thread: nothing allocates, nothing waits.

// The transport snapshot from the host's process context, as far as its state flags allow (the
// bar start only with kBarPositionValid), under the rules every host format shares
// (KAcceptTransport).
void KReadTransport(const ProcessContext* context, bool offline, KTransport& transport) noexcept;

// The block's parameter changes. Up to kEveryPointLimit queues, every point counts: a plug-in
// parameter moves through its points as a sample-accurate ramp (KHostRamp); bypass takes the last point; program and MIDI
// controller points become MIDI messages at their offsets. With more queues (or a block without
// samples) only each queue's last point is read.
inline constexpr int32_t kEveryPointLimit = 100;
void KApplyParameterChanges(IParameterChanges* changes, int32_t blockLength, KAudioPlugin& plugin, KParameterTable& table) noexcept;

// Note on, note off and polyphonic pressure of the "Midi In" bus as MIDI messages at their
// offsets; other event kinds have no MIDI message of their own and are dropped.
void KDeliverEvents(IEventList* events, KAudioPlugin& plugin) noexcept;

}  // namespace KVST3
