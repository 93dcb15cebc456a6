#include "kernel/KCatalogue.h"

#include "plugins/utility/KUtilityPlugin.h"

namespace {
// The order of this table is the order in which hosts and the command line list the
// plug-ins: add new plug-ins at the end.
constexpr KCatalogueEntry kPlugins[] = {
    {"KUtilityPlugin", &KUtilityPlugin::Create, "Utility", "Stereo"},
};
}  // namespace

const KCatalogue& KProductCatalogue() {
  static const KCatalogue catalogue{kPlugins, {}};
  return catalogue;
}
