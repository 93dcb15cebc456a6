#pragma once

#include <span>
#include <string_view>

#include "kernel/KExport.h"
#include "kernel/KPluginDescription.h"
#include "kernel/KStringList.h"

// What the registry builder registers, in this fixed order.
struct KCatalogue {
  std::span<const KPluginDescription> plugins;
  // Plug-ins that host effect pipelines: listed once more, beside their registry records, for
  // the browser that offers "Effect pipeline file"s.
  std::span<const char* const> pipelineHosts;
};

// The product's catalogue (plugins/KCatalogue.cpp).
TORVANE_API const KCatalogue& KProductCatalogue();

// The description whose key is `key` exactly, or null.
const KPluginDescription* KFindDescription(const KCatalogue& catalogue, std::string_view key) noexcept;

// One sentence per fault of the catalogue's descriptions: a field left out, a VST 2 id that is
// not four printable characters, a category that does not exist, or a key, module key, identity,
// derived identifier or bundle name that two plug-ins share. Empty when every description holds.
TORVANE_API KStringList KCatalogueProblems(const KCatalogue& catalogue);
