#include "hosts/lv2/KLV2Dispatch.h"

#include <lv2/state/state.h>
#include <lv2/urid/urid.h>

#include <cstring>
#include <deque>
#include <mutex>
#include <string>

#include "hosts/common/KHostEntry.h"
#include "hosts/common/KHostGuard.h"
#include "hosts/lv2/KAudioPluginLV2Adapter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace KLV2 {

namespace {
constexpr const char* kCaption = "LV2 Plugin main";

// A descriptor with the registry key its instances are made from.
struct KEntry {
  LV2_Descriptor descriptor;
  std::string uri;
  std::string key;
};

std::mutex gEntriesLock;
std::deque<KEntry> gEntries;  // never shrinks: hosts keep descriptor pointers

const KEntry* EntryOf(const LV2_Descriptor* descriptor) {
  std::lock_guard<std::mutex> lock(gEntriesLock);
  for (const KEntry& entry : gEntries)
    if (&entry.descriptor == descriptor) return &entry;
  return nullptr;
}

KAudioPluginLV2Adapter* Adapter(LV2_Handle instance) { return static_cast<KAudioPluginLV2Adapter*>(instance); }

const LV2_URID_Map* MapOf(const LV2_Feature* const* features) {
  for (; features && *features; ++features)
    if (std::strcmp((*features)->URI, LV2_URID__map) == 0) return static_cast<const LV2_URID_Map*>((*features)->data);
  return nullptr;
}

LV2_Handle Instantiate(const LV2_Descriptor* descriptor, double rate, const char*, const LV2_Feature* const* features) {
  return KHostEntryGuarded<void>(kCaption, "KAudioPluginLV2Adapter::instantiate", [&]() -> void* {
    const KEntry* entry = EntryOf(descriptor);
    if (!entry) return nullptr;
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(entry->key.c_str(), "");
    // The bundle describes the plug-in's first choice of channels.
    if (!plugin || !plugin->SetChannelsPerBus(KAudioPlugin::kChannelCounts[0]) || !plugin->SetSampleRate(rate)) return nullptr;
    const bool needsMap = plugin->GetShape().acceptsMIDI || plugin->GetShape().producesMIDI;
    const LV2_URID_Map* map = MapOf(features);
    if (needsMap && !map) return nullptr;
    return new KAudioPluginLV2Adapter(std::move(plugin), map);
  });
}

void ConnectPort(LV2_Handle instance, uint32_t port, void* data) { Adapter(instance)->ConnectPort(port, data); }
void Activate(LV2_Handle instance) { Adapter(instance)->Activate(); }
void Run(LV2_Handle instance, uint32_t samples) { Adapter(instance)->Run(samples); }
void Deactivate(LV2_Handle) {}

void Cleanup(LV2_Handle instance) {
  KHostGuarded("KAudioPluginLV2Adapter::cleanup", 0, [&] {
    delete Adapter(instance);
    return 0;
  });
}

LV2_State_Status Save(LV2_Handle instance, LV2_State_Store_Function store, LV2_State_Handle handle, uint32_t, const LV2_Feature* const*) {
  return Adapter(instance)->Save(store, handle);
}

LV2_State_Status Restore(LV2_Handle instance, LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle, uint32_t,
                         const LV2_Feature* const*) {
  return Adapter(instance)->Restore(retrieve, handle);
}

constexpr LV2_State_Interface kState = {Save, Restore};

const void* ExtensionData(const char* uri) { return std::strcmp(uri, LV2_STATE__interface) == 0 ? &kState : nullptr; }

const LV2_Descriptor* Find(const char* bundleName) {
  const KPluginDescription* plugin = BundlePlugin(bundleName);
  if (!plugin) return nullptr;
  const std::string uri = KPluginIds::LV2URI(plugin->identity);
  std::lock_guard<std::mutex> lock(gEntriesLock);
  for (const KEntry& entry : gEntries)
    if (entry.uri == uri) return &entry.descriptor;
  KEntry& entry = gEntries.emplace_back(KEntry{{}, uri, plugin->key});
  entry.descriptor = {entry.uri.c_str(), Instantiate, ConnectPort, Activate, Run, Deactivate, Cleanup, ExtensionData};
  return &entry.descriptor;
}
}  // namespace

const KPluginDescription* BundlePlugin(const char* bundleName) {
  for (const KPluginDescription& plugin : KProductCatalogue().plugins)
    if (KPluginIds::BundleName(plugin.key) == bundleName) return &plugin;
  return nullptr;
}

}  // namespace KLV2

const LV2_Descriptor* KLV2DispatchDescriptor(const char* bundleName) {
  return KHostEntryGuarded<const LV2_Descriptor>("LV2 Plugin main", KLV2::kDispatchName,
                                                 [&] { return bundleName ? KLV2::Find(bundleName) : nullptr; });
}
