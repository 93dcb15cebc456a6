#pragma once

#include "kernel/KExport.h"
#include "kernel/KStringList.h"

class KAudioPlugin;
class KRegistries;

// Creates the plug-in known by `name` (exact key, key without its "K", or nearest common
// prefix). On failure shows "Could not create plugin <name>." with the reason and answers
// null; no exception ever leaves it.
TORVANE_API KAudioPlugin* CreateTorvanePlugin(KString name);

// The keys of every plug-in, in registration order. The list lives as long as the library.
TORVANE_API const KStringList& GetTorvanePluginList();

// What CreateTorvanePlugin does, over the given registries (internal: not exported).
KAudioPlugin* KCreatePlugin(KRegistries& registries, const KString& name) noexcept;
