#pragma once

#include <lv2/ui/ui.h>

#include <string>

#include "kernel/KExport.h"

// The kernel's LV2 UI entry, which each bundle's loader resolves by this name: the X11 UI of the
// plug-in whose bundle is named `bundleName`, or null when the catalogue holds none of that name.
//
// The UI is the plug-in's editor embedded into the host's window (ui:parent), run by the host's
// idle calls (ui:idleInterface) and sized through ui:resize where offered. It works on the
// plug-in instance itself, so it needs the instance-access feature: a host without it (a host
// running UIs in another process) gets no UI from instantiate and shows its generic controls.
// Edits are written to the parameters' control ports, inside ui:touch gestures where offered.
extern "C" TORVANE_API const LV2UI_Descriptor* KLV2DispatchUIDescriptor(const char* bundleName);

namespace KLV2 {
inline constexpr const char* kUIDispatchName = "KLV2DispatchUIDescriptor";
using UIDispatchFunction = const LV2UI_Descriptor* (*)(const char* bundleName);
// The UI's URI beside its plug-in's.
inline std::string UIURI(const std::string& pluginURI) { return pluginURI + "#ui"; }
}  // namespace KLV2
