#pragma once

#include <lv2/core/lv2.h>

#include "kernel/KExport.h"

// The kernel's LV2 entry, which each bundle's loader resolves by this name: the descriptor of
// the plug-in whose bundle is named `bundleName` ("Compressor" for Compressor.lv2), or null
// when the catalogue holds none of that name. The URI and the bundle name follow
// kernel/KPluginIdentifiers.h. Descriptors live as long as the kernel.
extern "C" TORVANE_API const LV2_Descriptor* KLV2DispatchDescriptor(const char* bundleName);

struct KPluginDescription;

namespace KLV2 {
inline constexpr const char* kDispatchName = "KLV2DispatchDescriptor";
// The catalogue's plug-in of the bundle named `bundleName`, or null (in the kernel only).
const KPluginDescription* BundlePlugin(const char* bundleName);
using DispatchFunction = const LV2_Descriptor* (*)(const char* bundleName);
}  // namespace KLV2
