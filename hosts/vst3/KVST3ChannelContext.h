#pragma once

#include "core/KAudioPlugin.h"
#include "hosts/vst3/KVST3Base.h"

namespace KVST3 {

// The host's description of the plug-in's channel (the attribute list of the channel context
// listener) laid over `context`: a key the list lacks leaves its field as it was. The location
// comes as the published integer code, named "pre-fader", "post-fader" or "panner" here (any
// other code as its number), or as text from a host that sends text.
void KReadChannelContext(IAttributeList& list, KChannelContext& context);

}  // namespace KVST3
