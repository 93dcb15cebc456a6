#include <algorithm>
#include <memory>

#include "core/KParameter.h"
#include "plugins/KPluginEditors.h"
#include "plugins/limiter/KLimiterPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Limiting", "inputgain ceiling", 2},
    {"Timing", "release lookahead linkchannels", 2},
};

// Input level against output level in dB at rest: the input gain, then nothing above the ceiling.
std::unique_ptr<KControl> TransferGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  KTransferGraph::Callbacks callbacks;
  callbacks.law = [&plugin](double inputDb) {
    return std::min(inputDb + plugin.GetParameter(KLimiterPlugin::kInputGain).Working(),
                    plugin.GetParameter(KLimiterPlugin::kCeiling).Working());
  };
  return std::make_unique<KTransferGraph>(bounds, std::move(callbacks));
}

}  // namespace

KEditorDescription KLimiterEditor() {
  KEditorDescription description = KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &TransferGraph);
  description.gainReduction = [](const KAudioPlugin& plugin) {
    return double(static_cast<const KLimiterPlugin&>(plugin).GainReductionDecibels());
  };
  return description;
}
