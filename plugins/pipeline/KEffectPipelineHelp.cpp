#include "plugins/KPluginHelp.h"
#include "plugins/pipeline/KEffectPipeline.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"slot#bypass",
     "<control>Bypass</control> lets the signal pass the module of this slot unchanged and undelayed, while the other modules "
     "go on working. Default <value>{2}</value>.<p>Tip: bypass one module after the other to hear what each adds to the chain."},
    {"slot#param#",
     "A parameter of the module in this slot, in the order the module lists them, shown and typed in the module's own units. "
     "A slot keeps its module from being added until it is removed, so automation written for it stays with the module when "
     "the chain is reordered. Without a module behind it the parameter reads <value>-</value> and does nothing.<p>"
     "Tip: the module's own help names each of its parameters."},
};

constexpr KPluginHelp kHelp{
    "KEffectPipeline",
    "Effect Pipeline",
    "The <name>Effect Pipeline</name> runs up to eight effect modules in series, in the order you choose: add, remove, move "
    "and bypass each one on its own. Every module brings its parameters along, each slot showing the parameters of its "
    "module for automation. The chain is kept with your project, and can be saved as an effect pipeline file to use it on "
    "another track. The latency the pipeline reports is that of its modules together.",
    kParameters,
};
}  // namespace

const KPluginHelp& KEffectPipelineHelp() { return kHelp; }
