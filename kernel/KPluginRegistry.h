#pragma once

#include <span>

#include "kernel/KExport.h"
#include "kernel/KFactoryPreset.h"
#include "kernel/KHashIndex.h"
#include "kernel/KStringList.h"

class KAudioPlugin;
class KModule;
struct KPluginRecord;

// Creates one instance; `context` is the module of the requested name (may be null).
using KPluginFactory = KAudioPlugin* (*)(KModule* context, const KPluginRecord* record);

// Implemented by the plug-in core, so that the registry needs no more than this declaration:
// gives a new instance the name it was asked for, its module (its presets live in the
// module's data folder) and the sounds it ships with, and answers it; deletes it and rethrows
// when that fails.
KAudioPlugin* KAdoptNewPlugin(KAudioPlugin* plugin, const KString& name, KModule* module, std::span<const KFactoryPreset> presets);

struct KPluginRecord {
  KPluginFactory factory;
  KString category;  // empty in the main registry
  KString key;
  std::span<const KFactoryPreset> presets = {};  // its factory presets, in the order offered
};

// A table from identifier to factory: hash index for exact names, records in registration
// order for the prefix scan, and the keys in that order for callers that list them.
class TORVANE_API KPluginRegistry {
public:
  KPluginRegistry() = default;
  KPluginRegistry(const KPluginRegistry&) = delete;
  KPluginRegistry& operator=(const KPluginRegistry&) = delete;
  ~KPluginRegistry();

  // A key registered twice keeps its first record.
  void Register(const KString& key, KPluginFactory factory, const KString& category, std::span<const KFactoryPreset> presets = {});

  // Exact name; then, for a name starting with "K", the name without it; then the first record
  // in registration order whose key and the name agree on their common length. Null if none.
  const KPluginRecord* Find(const KString& name) const;
  const KPluginRecord* FindExact(const KString& name) const noexcept;

  // Runs the factory of the record found for `name` and gives the instance that name.
  // Throws KException "Plugin <name> hasn't been found." when there is none.
  KAudioPlugin* Create(const KString& name, KModule* context) const;

  int32_t Count() const noexcept { return records_.Count(); }
  const KPluginRecord& Record(int32_t index) const noexcept { return *records_[index]; }
  const KStringList& Keys() const noexcept { return keys_; }

private:
  KStringHashIndex<KPluginRecord*> index_;
  KArray<KPluginRecord*> records_;
  KStringList keys_;
};
