#pragma once

#include "hosts/vst2/KVST2Interface.h"

struct KTransport;

namespace KVST2 {

// What the host is asked for with audioMasterGetTime: the transport and automation state bits
// and the positions, tempo, bars, cycle and signature (0x3EC7).
inline constexpr int32_t kTimeFilter = kVstTransportChanged | kVstTransportPlaying | kVstTransportCycleActive | kVstAutomationWriting |
                                       kVstAutomationReading | kVstPpqPosValid | kVstTempoValid | kVstBarsValid | kVstCyclePosValid |
                                       kVstTimeSigValid;

// The plug-in's transport from the host's time information (null: the host gave none), by the
// rules every host format shares.
void KReadTransport(const VstTimeInfo* info, bool offline, KTransport& transport) noexcept;

}  // namespace KVST2
