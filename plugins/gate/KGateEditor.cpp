#include <memory>

#include "plugins/KPluginEditors.h"
#include "plugins/gate/KGatePlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Gate", "threshold ratio range", 3},
    {"Timing", "attack hold release linkchannels", 3},
};

// Input level against output level in dB, once the gate has settled.
std::unique_ptr<KControl> TransferGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& gate = static_cast<KGatePlugin&>(plugin);
  KTransferGraph::Callbacks callbacks;
  callbacks.law = [&gate](double inputDb) { return inputDb + gate.LawDecibels(inputDb); };
  return std::make_unique<KTransferGraph>(bounds, std::move(callbacks));
}

}  // namespace

KEditorDescription KGateEditor() {
  KEditorDescription description = KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &TransferGraph);
  description.gainReduction = [](const KAudioPlugin& plugin) {
    return double(static_cast<const KGatePlugin&>(plugin).GainReductionDecibels());
  };
  return description;
}
