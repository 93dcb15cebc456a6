#include <string>
#include <vector>

#include "plugins/KPluginHelp.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/pipeline/KPipelineChainPanel.h"
#include "ui/KHelpTexts.h"

namespace {
// One entry per slot for its parameters, so that each text names its control as the host does
// ("Slot 2 parameter 5"); the number of the parameter is what the "#" matched. The entries take
// no values of their parameters, so the help page gives each once, for the whole slot.
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
                      "them, shown and typed in the module's own units. Every parameter of the module has one, for the host's "
                      "automation; the editor shows the first twelve. A slot keeps its module from being added until it is "
                      "removed, so automation written for it stays with the module when the chain is reordered. Without a "
                      "module parameter behind it, it reads <value>-</value> and does nothing.<p>Tip: the module's own help "
                      "names each of its parameters.");
    }
    for (size_t i = 0; i < keys.size(); ++i) entries.push_back({keys[i].c_str(), texts[i].c_str()});
  }
};
}  // namespace

namespace {
// The buttons of the list of modules.
constexpr KParameterHelp kButtons[] = {
    {KPipelineChainPanel::kAddKey,
     "<control>Add module...</control> opens the list of effect modules, by category from Dynamics to Stereo; the one you "
     "click joins the end of the chain in the first free slot, at its default settings. The pipeline holds at most six "
     "modules; with six, the button rests.<p>Tip: move the new module up when it should act "
     "earlier in the chain."},
    {KPipelineChainPanel::kBypassKey,
     "<control>Active</control> or <control>Bypassed</control> shows whether the module works on the signal; a click switches "
     "it. Bypassed, it lets the signal pass unchanged and undelayed while the other modules go on working. It is the slot's "
     "bypass, which the host can automate."},
    {KPipelineChainPanel::kUpKey,
     "<control>Move up</control> lets the module act one place earlier in the chain. It keeps its slot, so its automation "
     "stays with it. The first module cannot move up."},
    {KPipelineChainPanel::kDownKey,
     "<control>Move down</control> lets the module act one place later in the chain. It keeps its slot, so its automation "
     "stays with it. The last module cannot move down."},
    {KPipelineChainPanel::kRemoveKey,
     "<control>Remove</control> takes the module out of the chain and frees its slot, whose parameters return to "
     "<value>-</value>; the next module added takes the first free slot.<p>Tip: Undo brings the module back with its settings."},
};
}  // namespace

KString KEffectPipelineButtonHelp(const KString& key) {
  for (const KParameterHelp& button : kButtons)
    if (key == KString::Static(button.key)) return KHelpTexts::ControlHelp(KString::FromUtf8(button.text), {});
  return {};
}

const KPluginHelp& KEffectPipelineHelp() {
  static const PipelineHelp texts;
  static const KPluginHelp help{
      "KEffectPipeline",
      "Effect Pipeline",
      "The <name>Effect Pipeline</name> runs up to six effect modules in series, in the order you choose: add, remove, move "
      "and bypass each one on its own in the list of modules at the top. Each module has a slot of host parameters, one for "
      "each of its own parameters, and keeps it until it is removed, so that automation follows it wherever it moves; the "
      "editor shows the first twelve of each slot. The chain is kept with your project and can be saved as an effect pipeline file "
      "to use it on another track. The latency the pipeline reports is that of its modules together.",
      texts.entries,
  };
  return help;
}
