#include "hosts/vst2/KVST2Dispatch.h"

#include <cstring>
#include <memory>
#include <string_view>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/vst2/KAudioPluginVSTAdapter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

KVST2::AEffect* KVST2DispatchCreateInstance(const char* pluginName, const char* subName, uint32_t uniqueId, KVST2::HostCallback host) {
  return KHostEntryGuarded<KVST2::AEffect>("VST Plugin main", KVST2::kDispatchName, [&]() -> KVST2::AEffect* {
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(pluginName, subName);
    if (!plugin) return nullptr;
    // The host owns the instance from here; its effClose deletes it.
    return (new KAudioPluginVSTAdapter(host, std::move(plugin), static_cast<int32_t>(uniqueId)))->Effect();
  });
}

bool KVST2DispatchDescribe(const char* moduleName, KVST2::KModuleDescription* out) {
  try {
    if (!moduleName || !out) return false;
    for (const KPluginDescription& plugin : KProductCatalogue().plugins) {
      if (!plugin.key || !plugin.vst2Id || KPluginIds::BundleName(plugin.key) != std::string_view(moduleName)) continue;
      if (std::strlen(plugin.key) >= sizeof out->key) return false;
      std::strcpy(out->key, plugin.key);
      out->uniqueId = KPluginIds::VST2UniqueId(plugin.vst2Id);
      return true;
    }
  } catch (...) {
    // out of memory while naming a module: no description
  }
  return false;
}
