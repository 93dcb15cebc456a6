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
// What a module's loader needs of its one plug-in: copied out of the kernel.
struct KModuleDescription {
  char key[64];  // the registry key the loader creates instances under
  int32_t uniqueId;
};
}  // namespace KVST2

// The kernel's description of the plug-in whose module is named `moduleName` (the loader's own
// file name without ".so"; KPluginIds::BundleName). False, and `out` untouched, when the
// catalogue has no such plug-in.
extern "C" TORVANE_API bool KVST2DispatchDescribe(const char* moduleName, KVST2::KModuleDescription* out);

namespace KVST2 {
inline constexpr const char* kDispatchName = "KVST2DispatchCreateInstance";
using DispatchFunction = AEffect* (*)(const char* pluginName, const char* subName, uint32_t uniqueId, HostCallback host);
inline constexpr const char* kDescribeName = "KVST2DispatchDescribe";
using DescribeFunction = bool (*)(const char* moduleName, KModuleDescription* out);
}  // namespace KVST2
