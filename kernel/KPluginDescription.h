#pragma once

#include <span>

#include "kernel/KFactoryPreset.h"
#include "kernel/KPluginRegistry.h"

struct KPluginHelp;
struct KEditorDescription;

// Everything hosts and the catalogue know of one plug-in, kept beside its class as data. The
// identifiers host formats save projects under are derived from `identity` and `vst2Id` by the
// rules of KPluginIdentifiers.h; neither field changes once the plug-in has been released.
// KCatalogueProblems (KCatalogue.h) names every field left out and every clash.
struct KPluginDescription {
  static constexpr const char* kVendor = "Torvane";

  const char* key;                          // registry key, the class name with its prefix: "KCompressorPlugin"
  KPluginFactory factory;                   // makes one instance
  const char* moduleKey;                    // key in the effect-module registry; null: no module
  const char* category;                     // one of KRegistries::kCategories when moduleKey is set
  const char* name = nullptr;               // what hosts list: "Compressor"
  const char* vst3SubCategories = nullptr;  // "Fx|Dynamics"
  const char* vst2Id = nullptr;             // four printable ASCII characters, unique in the catalogue
  const char* identity = nullptr;           // the key at first release; stays when the key is renamed
  const KPluginHelp& (*help)() = nullptr;   // what the plug-in and each parameter are for (plugins/KPluginHelp.h)
  KEditorDescription (*editor)() = nullptr;  // its editor's sections and graph (ui/editor/KEditorDescription.h);
                                             // null: every parameter in one generated section
  std::span<const KFactoryPreset> presets = {};  // the sounds it ships with, in the order offered
  const char* vendor = kVendor;
  const char* version = TORVANE_VERSION;
};
