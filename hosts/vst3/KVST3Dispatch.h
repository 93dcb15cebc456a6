#pragma once

#include "hosts/vst3/KVST3Base.h"
#include "kernel/KExport.h"

// The kernel's VST 3 entry, which each plug-in's loader resolves by this name: makes the
// plug-in named `pluginName` followed by `subName` (each byte of both one character) and
// answers it as a VST 3 object holding one reference, or null. `context` is not used.
extern "C" TORVANE_API KVST3::FUnknown* KVST3DispatchCreateInstance(KVST3::FUnknown* context, const char* pluginName,
                                                                   const char* subName);

namespace KVST3 {
inline constexpr const char* kDispatchName = "KVST3DispatchCreateInstance";
using DispatchFunction = FUnknown* (*)(FUnknown* context, const char* pluginName, const char* subName);
}  // namespace KVST3
