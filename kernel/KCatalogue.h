#pragma once

#include <span>

#include "kernel/KPluginRegistry.h"

// One plug-in of the catalogue: its key in the main registry and, when it also serves as an
// effect module, its short module key and category.
struct KCatalogueEntry {
  const char* key;
  KPluginFactory factory;
  const char* moduleKey;  // null: not an effect module
  const char* category;   // one of KRegistries::kCategories when moduleKey is set
};

// What the registry builder registers, in this fixed order.
struct KCatalogue {
  std::span<const KCatalogueEntry> plugins;
  // Plug-ins that host effect pipelines: listed once more, beside their registry records, for
  // the browser that offers "Effect pipeline file"s.
  std::span<const char* const> pipelineHosts;
};

// The product's catalogue (plugins/).
const KCatalogue& KProductCatalogue();
