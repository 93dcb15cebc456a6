#include "plugins/KPluginHelp.h"
#include "plugins/flanger/KFlangerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how fast the comb sweeps, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"sync",
     "<control>Sync</control> ties one sweep to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."},
    {"shape",
     "<control>Shape</control> is the path of the sweep: <value>Triangle</value> moves evenly up and down, "
     "<value>Sine</value> lingers at the ends, the random shapes wander. Default <value>{2}</value>."},
    {"depth",
     "<control>Depth</control> is how far the delay sweeps above <reference>Delay</reference>, and so how far the notches "
     "travel. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"delay",
     "<control>Delay</control> is the shortest delay of the sweep: the shorter, the higher and further apart the notches. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"feedback",
     "<control>Feedback</control> sends the delayed sound round again and turns the notches into ringing peaks; negative "
     "values give a hollower tone. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sweep behind the left's. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."},
    {"mix",
     "<control>Dry/wet</control> blends the delayed sound with the original; the deepest notches are at "
     "<value>50 %</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
};

constexpr KPluginHelp kHelp{
    "KFlangerPlugin",
    "Flanger",
    "The <name>Flanger</name> mixes the sound with a copy delayed by a few milliseconds that sweeps to and fro, so a comb of "
    "notches glides through the spectrum: the whoosh of a jet, or with feedback a metallic ring.",
    kParameters,
};
}  // namespace

const KPluginHelp& KFlangerHelp() { return kHelp; }
