#pragma once

#include <cstdint>

#include "hosts/vst2/KVST2Interface.h"
#include "kernel/KExport.h"

// The kernel's VST 2 entry, which each plug-in's loader resolves by this name: makes the
// plug-in named `pluginName` followed by `subName` (each byte of both one character), known to
// the host by `uniqueId`, and answers its AEffect record, or null.
extern "C" TORVANE_API KVST2::AEffect* KVST2DispatchCreateInstance(const char* pluginName, const char* subName, uint32_t uniqueId,
                                                                  KVST2::HostCallback host);

namespace KVST2 {
inline constexpr const char* kDispatchName = "KVST2DispatchCreateInstance";
using DispatchFunction = AEffect* (*)(const char* pluginName, const char* subName, uint32_t uniqueId, HostCallback host);
}  // namespace KVST2
