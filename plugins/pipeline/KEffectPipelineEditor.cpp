#include <string>
#include <vector>

#include "plugins/KPluginEditors.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/pipeline/KPipelineChainPanel.h"

namespace {
// The chain across the top; below it one section per slot: its bypass, then the first twelve
// parameters it carries, in the module's order, two slots side by side. A module's further
// parameters are there for the host's automation.
struct SlotSections {
  std::vector<std::string> titles, keys;
  std::vector<KEditorSection> sections;
  SlotSections() {
    for (int32_t slot = 1; slot <= KEffectPipeline::kSlots; ++slot) {
      const std::string number = std::to_string(slot);
      titles.push_back("Slot " + number);
      std::string keyList = "slot" + number + "bypass";
      for (int32_t p = 1; p <= KEffectPipeline::kSlotParameters; ++p) keyList += " slot" + number + "param" + std::to_string(p);
      keys.push_back(keyList);
    }
    for (size_t i = 0; i < titles.size(); ++i) sections.push_back({titles[i].c_str(), keys[i].c_str(), 6});
  }
};

KString Help(KAudioPlugin& plugin, const KString& key) {
  const KString button = KEffectPipelineButtonHelp(key);
  return button.IsEmpty() ? KPluginEditorHelp(plugin, key) : button;
}
}  // namespace

KEditorDescription KEffectPipelineEditor() {
  static const SlotSections sections;
  KEditorDescription description = KEditorDescription::Of(
      sections.sections, KEditorDescription::kGraphTop, [](const KRect& bounds, KAudioPlugin& plugin, KEditorHost* host) -> std::unique_ptr<KControl> {
        return std::make_unique<KPipelineChainPanel>(bounds, dynamic_cast<KEffectPipeline&>(plugin), host);
      });
  description.help = &Help;
  return description;
}
