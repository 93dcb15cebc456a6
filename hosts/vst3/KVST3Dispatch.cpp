#include "hosts/vst3/KVST3Dispatch.h"

#include <cstring>
#include <memory>
#include <string_view>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/vst3/KAudioPluginVST3Adapter.h"
#include "hosts/vst3/KVST3ClassId.h"
#include "kernel/KCatalogue.h"

KVST3::FUnknown* KVST3DispatchCreateInstance(KVST3::FUnknown*, const char* pluginName, const char* subName) {
  return KHostEntryGuarded<KVST3::FUnknown>("VST3 Plugin main", KVST3::kDispatchName, [&]() -> KVST3::FUnknown* {
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(pluginName, subName);
    if (!plugin) return nullptr;
    return static_cast<KVST3::IComponent*>(new KAudioPluginVST3Adapter(std::move(plugin)));
  });
}

namespace {
// A text into a fixed field, cut to fit and terminated.
template <size_t N>
void CopyText(const char* text, char (&field)[N]) noexcept {
  std::strncpy(field, text ? text : "", N - 1);
  field[N - 1] = 0;
}
}  // namespace

bool KVST3DispatchDescribe(const char* bundleName, KVST3::KClassDescription* out) {
  try {
    if (!bundleName || !out) return false;
    for (const KPluginDescription& plugin : KProductCatalogue().plugins) {
      if (!plugin.key || KPluginIds::BundleName(plugin.key) != std::string_view(bundleName)) continue;
      CopyText(plugin.key, out->key);
      CopyText(plugin.name, out->name);
      CopyText(plugin.vst3SubCategories, out->subCategories);
      CopyText(plugin.vendor, out->vendor);
      CopyText(plugin.version, out->version);
      KVST3::KClassIdOf(plugin.identity ? plugin.identity : "").CopyTo(out->classId);
      return true;
    }
  } catch (...) {
    // out of memory while naming a bundle: no description
  }
  return false;
}
