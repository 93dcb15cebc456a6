#include "hosts/vst2/KVST2Dispatch.h"

#include <memory>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/vst2/KAudioPluginVSTAdapter.h"

KVST2::AEffect* KVST2DispatchCreateInstance(const char* pluginName, const char* subName, uint32_t uniqueId, KVST2::HostCallback host) {
  return KHostEntryGuarded<KVST2::AEffect>("VST Plugin main", KVST2::kDispatchName, [&]() -> KVST2::AEffect* {
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(pluginName, subName);
    if (!plugin) return nullptr;
    // The host owns the instance from here; its effClose deletes it.
    return (new KAudioPluginVSTAdapter(host, std::move(plugin), static_cast<int32_t>(uniqueId)))->Effect();
  });
}
