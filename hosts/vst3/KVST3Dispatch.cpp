#include "hosts/vst3/KVST3Dispatch.h"

#include <memory>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/vst3/KAudioPluginVST3Adapter.h"

KVST3::FUnknown* KVST3DispatchCreateInstance(KVST3::FUnknown*, const char* pluginName, const char* subName) {
  return KHostEntryGuarded<KVST3::FUnknown>("VST3 Plugin main", KVST3::kDispatchName, [&]() -> KVST3::FUnknown* {
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(pluginName, subName);
    if (!plugin) return nullptr;
    return static_cast<KVST3::IComponent*>(new KAudioPluginVST3Adapter(std::move(plugin)));
  });
}
