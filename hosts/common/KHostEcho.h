#pragma once

#include <cstdint>

#include "kernel/KExport.h"

class KAudioPluginBase;

// A value the host sets outside processing (VST 2's setParameter, VST 3's setParamNormalized,
// AAX's SetParameterNormalizedValue). While the plug-in is sending a value to the host (its
// automation-sending counter is above 0), what comes back is the host's echo of that send and
// changes nothing; anything else moves the parameter at once. Any thread.
TORVANE_API void KTakeHostValue(KAudioPluginBase& plugin, int32_t parameter, double normalized) noexcept;
