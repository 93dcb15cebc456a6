#include "kernel/KPluginRegistry.h"

#include <memory>

#include "kernel/KException.h"

KPluginRegistry::~KPluginRegistry() {
  for (KPluginRecord* record : records_) delete record;
}

void KPluginRegistry::Register(const KString& key, KPluginFactory factory, const KString& category,
                               std::span<const KFactoryPreset> presets) {
  auto record = std::make_unique<KPluginRecord>(KPluginRecord{factory, category, key, presets});
  if (!index_.Insert(key, record.get())) return;
  records_.Append(record.release());
  keys_.Append(key);
}

const KPluginRecord* KPluginRegistry::FindExact(const KString& name) const noexcept {
  KPluginRecord* const* found = index_.Find(name);
  return found ? *found : nullptr;
}

const KPluginRecord* KPluginRegistry::Find(const KString& name) const {
  if (const KPluginRecord* record = FindExact(name)) return record;
  if (name.Length() > 0 && name.CharAt(0) == u'K') {
    KString shortName = name;
    shortName.Erase(0, 1);
    if (const KPluginRecord* record = FindExact(shortName)) return record;
  }
  for (const KPluginRecord* record : records_) {
    const int32_t common = name.Length() < record->key.Length() ? name.Length() : record->key.Length();
    if (name.CompareFirst(record->key, common) == 0) return record;
  }
  return nullptr;
}

KAudioPlugin* KPluginRegistry::Create(const KString& name, KModule* context) const {
  const KPluginRecord* record = Find(name);
  if (!record) {
    KString message = "Plugin ";
    message.Append(name).Append(KString(" hasn't been found."));
    throw KException(message);
  }
  KAudioPlugin* plugin = record->factory(context, record);
  return plugin ? KAdoptNewPlugin(plugin, name, context, record->presets) : nullptr;
}
