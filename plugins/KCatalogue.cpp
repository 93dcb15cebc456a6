#include "kernel/KCatalogue.h"

// The catalogue: one line per plug-in, naming the description its folder defines beside its class
// (kernel/KPluginDescription.h). Nothing else lists the plug-ins: the registries, the VST 3
// bundles and the README's table all follow this list. Its order is the order in which hosts
// and the command line list the plug-ins: add new plug-ins at the end.
#define TORVANE_CATALOGUE(PLUGIN) \
  PLUGIN(kUtilityDescription)     \
  PLUGIN(kCompressorDescription)  \
  PLUGIN(kEqualizerDescription)   \
  PLUGIN(kSampleWarmerDescription) \
  PLUGIN(kLimiterDescription) \
  PLUGIN(kGateDescription) \
  PLUGIN(kBitCrusherDescription) \
  PLUGIN(kTransientShaperDescription) \
  PLUGIN(kMultibandCompressorDescription) \
  PLUGIN(kDynamicEqualizerDescription) \
  PLUGIN(kWaveshaperDescription) \
  /* new plug-ins above this line */

#define TORVANE_DECLARE(description) extern const KPluginDescription description;
#define TORVANE_LIST(description) description,
TORVANE_CATALOGUE(TORVANE_DECLARE)

const KCatalogue& KProductCatalogue() {
  // Copied on first use, after every description has been initialised.
  static const KPluginDescription plugins[] = {TORVANE_CATALOGUE(TORVANE_LIST)};
  static const KCatalogue catalogue{plugins, {}};
  return catalogue;
}
