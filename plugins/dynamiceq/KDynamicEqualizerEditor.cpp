#include <memory>
#include <vector>

#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/dynamiceq/KDynamicEqualizerPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

using P = KDynamicEqualizerPlugin;

constexpr KEditorSection kSections[] = {
    {"Band 1", "band1type band1freq band1q band1gain band1threshold band1range band1enable", 3},
    {"Band 2", "band2type band2freq band2q band2gain band2threshold band2range band2enable", 3},
    {"Band 3", "band3type band3freq band3q band3gain band3threshold band3range band3enable", 3},
    {"Band 4", "band4type band4freq band4q band4gain band4threshold band4range band4enable", 3},
    {"Detector", "attack release outputgain", 3},
};

// The static response of the bands that are on, with a node per band for its frequency and gain.
std::unique_ptr<KControl> ResponseGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost* host) {
  auto& equalizer = static_cast<P&>(plugin);
  auto response = [&equalizer](double hz) {
    double db = equalizer.GetParameter(P::kOutputGain).Working();
    for (int32_t b = 0; b < P::kBandCount; ++b)
      if (equalizer.GetParameter(P::Index(b, P::kEnable)).Working() >= 0.5) db += equalizer.BandDesign(b, 0.0).Decibels(hz);
    return db;
  };
  std::vector<KResponseGraph::Node> nodes;
  for (int32_t b = 0; b < P::kBandCount; ++b) {
    const int32_t enable = P::Index(b, P::kEnable);
    nodes.push_back({KParameterLink(plugin, P::Index(b, P::kFrequency), host), KParameterLink(plugin, P::Index(b, P::kGain), host),
                     [&plugin, enable] { return plugin.GetParameter(enable).Working() >= 0.5; }});
  }
  return std::make_unique<KResponseGraph>(bounds, response, std::move(nodes));
}

}  // namespace

KEditorDescription KDynamicEqualizerEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &ResponseGraph); }
