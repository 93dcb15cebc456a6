#pragma once

#include <cstdint>

#include "hosts/aax/KAAXPluginInformation.h"
#include "kernel/KExport.h"

// The kernel's AAX entries. The ACF library entry points keep the signatures AAX hosts call
// them with; a bundle's loader forwards its own to these. No exception leaves any of them.
extern "C" {
TORVANE_API KAAX::ACFResult ACFStartup(KAAX::IACFUnknown* host);
TORVANE_API KAAX::ACFResult ACFShutdown(KAAX::IACFUnknown* host);
TORVANE_API KAAX::ACFResult ACFGetSDKVersion(uint64_t* version);
// The plug-ins this library registers: inside a bundle the bundle's own plug-in, otherwise the
// whole catalogue. The caller releases the definition.
TORVANE_API KAAX::ACFResult ACFRegisterPlugin(KAAX::IACFUnknown* host, KAAX::IACFPluginDefinition** definition);
// AAX registers everything through the plug-in definition: no component of its own, no class
// factory (instances come from the entries in the plug-in information).
TORVANE_API KAAX::ACFResult ACFRegisterComponent(KAAX::IACFUnknown* host, uint32_t index, void** component);
TORVANE_API KAAX::ACFResult ACFGetClassFactory(KAAX::IACFUnknown* host, const void* classId, const void* interfaceId, void** factory);
// kACFOk when no effect or GUI the library made is alive, else kACFFalse.
TORVANE_API KAAX::ACFResult ACFCanUnloadNow(KAAX::IACFUnknown* host);

// The effect for the plug-in named `pluginName` followed by `subName`, or null.
TORVANE_API KAAX::KEffectParameters* KAAXDispatchCreateInstance(const char* pluginName, const char* subName);
// The GUI of an effect made by KAAXDispatchCreateInstance, or null.
TORVANE_API KAAXGUI* KAAXDispatchCreateGUI(KAAX::KEffectParameters* effect);
// Fills `information` for the plug-in `key`; kSuccess, or an error for a key it does not know.
TORVANE_API KAAX::Result KAAXDispatchGetPluginInformation(const char* key, KAAXPluginInformation* information);
// One buffer for each instance from `instances` up to `end`.
TORVANE_API void KAAXProcessCallback(KAAXProcessContext* const instances[], const void* end);
}
