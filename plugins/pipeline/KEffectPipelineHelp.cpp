#include <string>
#include <vector>

#include "plugins/KPluginHelp.h"
#include "plugins/pipeline/KEffectPipeline.h"

namespace {
// One entry per slot for its parameters, so that each text names its control as the host does
// ("Slot 2 parameter 5"); the number of the parameter is what the "#" matched.
struct PipelineHelp {
  std::vector<std::string> keys, texts;
  std::vector<KParameterHelp> entries;
  PipelineHelp() {
    keys.push_back("slot#bypass");
    texts.push_back(
        "<control>Slot {3} bypass</control> lets the signal pass the module of this slot unchanged and undelayed, while the "
        "other modules go on working. Default <value>{2}</value>.<p>Tip: bypass one module after the other to hear what each "
        "adds to the chain.");
    for (int32_t slot = 1; slot <= KEffectPipeline::kSlots; ++slot) {
      const std::string number = std::to_string(slot);
      keys.push_back("slot" + number + "param#");
      texts.push_back("<control>Slot " + number +
                      " parameter {3}</control> is that parameter of the module in this slot, in the order the module lists "
                      "them, shown and typed in the module's own units. A slot keeps its module from being added until it is "
                      "removed, so automation written for it stays with the module when the chain is reordered. Without a "
                      "module parameter behind it, it reads <value>-</value> and does nothing.<p>Tip: the module's own help "
                      "names each of its parameters.");
    }
    for (size_t i = 0; i < keys.size(); ++i) entries.push_back({keys[i].c_str(), texts[i].c_str()});
  }
};
}  // namespace

const KPluginHelp& KEffectPipelineHelp() {
  static const PipelineHelp texts;
  static const KPluginHelp help{
      "KEffectPipeline",
      "Effect Pipeline",
      "The <name>Effect Pipeline</name> runs up to six effect modules in series, in the order you choose: add, remove, move "
      "and bypass each one on its own. Each slot shows the first twelve parameters of its module for automation; the module "
      "keeps the rest in its own settings. The chain is kept with your project and can be saved as an effect pipeline file "
      "to use it on another track. The latency the pipeline reports is that of its modules together.",
      texts.entries,
  };
  return help;
}
