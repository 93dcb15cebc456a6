#include <string>
#include <vector>

#include "plugins/KPluginEditors.h"
#include "plugins/pipeline/KEffectPipeline.h"

namespace {
// One section per slot: its bypass, then the parameters it carries, in the module's order.
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
    for (size_t i = 0; i < titles.size(); ++i) sections.push_back({titles[i].c_str(), keys[i].c_str(), 12});
  }
};
}  // namespace

KEditorDescription KEffectPipelineEditor() {
  static const SlotSections sections;
  return KEditorDescription::Of(sections.sections);
}
