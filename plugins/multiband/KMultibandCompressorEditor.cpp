#include "plugins/KPluginEditors.h"
#include "plugins/multiband/KMultibandCompressorPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Bands", "bands crossover1 crossover2 crossover3 outputgain", 5},
    {"Band 1", "band1threshold band1ratio band1attack band1release band1gain", 5},
    {"Band 2", "band2threshold band2ratio band2attack band2release band2gain", 5},
    {"Band 3", "band3threshold band3ratio band3attack band3release band3gain", 5},
    {"Band 4", "band4threshold band4ratio band4attack band4release band4gain", 5},
};
}  // namespace

KEditorDescription KMultibandCompressorEditor() {
  KEditorDescription description = KEditorDescription::Of(kSections);
  description.gainReduction = [](const KAudioPlugin& plugin) {
    return double(static_cast<const KMultibandCompressorPlugin&>(plugin).GainReductionDecibels());
  };
  return description;
}
