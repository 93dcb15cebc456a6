#include <algorithm>
#include <cmath>
#include <memory>
#include <vector>

#include "core/KParameter.h"
#include "dsp/KFilterSection.h"
#include "plugins/KPluginEditors.h"
#include "plugins/equalizer/KEqualizerPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Band 1", "band1type band1freq band1gain band1q band1enable", 1},
    {"Band 2", "band2type band2freq band2gain band2q band2enable", 1},
    {"Band 3", "band3type band3freq band3gain band3q band3enable", 1},
    {"Band 4", "band4type band4freq band4gain band4q band4enable", 1},
    {"Band 5", "band5type band5freq band5gain band5q band5enable", 1},
    {"Band 6", "band6type band6freq band6gain band6q band6enable", 1},
    {"Band 7", "band7type band7freq band7gain band7q band7enable", 1},
    {"Band 8", "band8type band8freq band8gain band8q band8enable", 1},
    {"Output", "outputgain", 1},
};

// The graph's rate: high enough that the bands' shapes read as they sound at common rates.
constexpr double kGraphRate = 48000.0;

// The summed response of the enabled bands, designed again only when a band's settings moved.
class EditorResponse {
public:
  explicit EditorResponse(KAudioPlugin& plugin) : plugin_(plugin) {}

  double Decibels(double hz) {
    Refresh();
    double db = 0;
    for (const KFilterSection& s : sections_) db += s.Decibels(hz);
    return db + plugin_.GetParameter(KEqualizerPlugin::kOutputGain).Working();
  }

private:
  void Refresh() {
    std::vector<double> key;
    for (int32_t i = 0; i < KEqualizerPlugin::kOutputGain; ++i) key.push_back(plugin_.GetParameter(i).Normalized());
    if (key == key_) return;
    key_ = key;
    sections_.clear();
    for (int32_t band = 0; band < KEqualizerPlugin::kBandCount; ++band) {
      const auto value = [&](KEqualizerPlugin::BandField f) { return plugin_.GetParameter(KEqualizerPlugin::Index(band, f)).Working(); };
      if (value(KEqualizerPlugin::kEnable) < 0.5) continue;
      KFilterSection section;
      section.Design(static_cast<int32_t>(value(KEqualizerPlugin::kType)), value(KEqualizerPlugin::kGain),
                     std::min(value(KEqualizerPlugin::kFrequency), 0.499 * kGraphRate), kGraphRate, value(KEqualizerPlugin::kQ));
      sections_.push_back(section);
    }
  }

  KAudioPlugin& plugin_;
  std::vector<double> key_;
  std::vector<KFilterSection> sections_;
};

std::unique_ptr<KControl> ResponseGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost* host) {
  auto response = std::make_shared<EditorResponse>(plugin);
  std::vector<KResponseGraph::Node> nodes;
  for (int32_t band = 0; band < KEqualizerPlugin::kBandCount; ++band) {
    const int32_t enable = KEqualizerPlugin::Index(band, KEqualizerPlugin::kEnable);
    nodes.push_back({KParameterLink(plugin, KEqualizerPlugin::Index(band, KEqualizerPlugin::kFrequency), host),
                     KParameterLink(plugin, KEqualizerPlugin::Index(band, KEqualizerPlugin::kGain), host),
                     [&plugin, enable] { return plugin.GetParameter(enable).Working() >= 0.5; }});
  }
  return std::make_unique<KResponseGraph>(bounds, [response](double hz) { return response->Decibels(hz); }, std::move(nodes));
}

}  // namespace

KEditorDescription KEqualizerEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &ResponseGraph); }
