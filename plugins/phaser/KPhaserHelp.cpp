#include "plugins/KPluginHelp.h"
#include "plugins/phaser/KPhaserPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how fast the notches sweep, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"sync",
     "<control>Sync</control> ties one sweep to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."},
    {"shape",
     "<control>Shape</control> is the path of the sweep between the two frequencies. Default <value>{2}</value>."},
    {"stages",
     "<control>Stages</control> is the number of allpass stages: every two make one notch, so more stages give a denser, "
     "more pronounced sweep. Default <value>{2}</value>."},
    {"low",
     "<control>Low frequency</control> is where the sweep turns at the bottom. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."},
    {"high",
     "<control>High frequency</control> is where the sweep turns at the top. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."},
    {"feedback",
     "<control>Feedback</control> sends the chain's output back to its input and sharpens the notches into resonant peaks. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sweep behind the left's. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."},
    {"mix",
     "<control>Dry/wet</control> blends the chain with the original; the notches are deepest at <value>50 %</value>. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
};

constexpr KPluginHelp kHelp{
    "KPhaserPlugin",
    "Phaser",
    "The <name>Phaser</name> sweeps a set of soft notches up and down the spectrum, the swirl of the classic stomp box, from a "
    "gentle movement to a deep, resonant whoosh.",
    kParameters,
};
}  // namespace

const KPluginHelp& KPhaserHelp() { return kHelp; }
