#include "kernel/KCatalogue.h"

#include "plugins/utility/KUtilityPlugin.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/equalizer/KEqualizerPlugin.h"
#include "plugins/warmer/KSampleWarmer.h"

namespace {
// The order of this table is the order in which hosts and the command line list the
// plug-ins: add new plug-ins at the end.
constexpr KCatalogueEntry kPlugins[] = {
    {"KUtilityPlugin", &KUtilityPlugin::Create, "Utility", "Stereo"},
    {"KCompressorPlugin", &KCompressorPlugin::Create, "Compressor", "Dynamics"},
    {"KEqualizerPlugin", &KEqualizerPlugin::Create, "Equalizer", "EQs & Filters"},
    {"KSampleWarmer", &KSampleWarmer::Create, "SampleWarmer", "Distortion"},
};
}  // namespace

const KCatalogue& KProductCatalogue() {
  static const KCatalogue catalogue{kPlugins, {}};
  return catalogue;
}
