#pragma once

#include "hosts/vst3/KVST3Base.h"
#include "kernel/KExport.h"

// The kernel's VST 3 entry, which each plug-in's loader resolves by this name: makes the
// plug-in named `pluginName` followed by `subName` (each byte of both one character) and
// answers it as a VST 3 object holding one reference, or null. `context` is not used.
extern "C" TORVANE_API KVST3::FUnknown* KVST3DispatchCreateInstance(KVST3::FUnknown* context, const char* pluginName,
                                                                   const char* subName);

namespace KVST3 {
// What a bundle's loader tells its host about its one plug-in: copied out of the kernel, so that
// it stays valid however often the kernel is unloaded and loaded again.
struct KClassDescription {
  char key[64];            // the registry key the loader creates instances under
  char name[64];           // what hosts list
  char subCategories[128];
  char vendor[64];
  char version[64];
  char classId[16];
};
}  // namespace KVST3

// The kernel's description of the plug-in whose bundle is named `bundleName` (the loader's own
// file name without ".so"; KPluginIds::BundleName). False, and `out` untouched, when the
// catalogue has no such plug-in.
extern "C" TORVANE_API bool KVST3DispatchDescribe(const char* bundleName, KVST3::KClassDescription* out);

namespace KVST3 {
inline constexpr const char* kDispatchName = "KVST3DispatchCreateInstance";
using DispatchFunction = FUnknown* (*)(FUnknown* context, const char* pluginName, const char* subName);
inline constexpr const char* kDescribeName = "KVST3DispatchDescribe";
using DescribeFunction = bool (*)(const char* bundleName, KClassDescription* out);
}  // namespace KVST3
