#include "plugins/KPluginHelp.h"
#include "plugins/flanger/KFlangerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how fast the comb sweeps, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: very slow rates of 0.05 to 0.2 Hz give the classic jet sweep."},
    {"sync",
     "<control>Sync</control> ties one sweep to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: a two-bar sweep on a drum bus moves with the arrangement."},
    {"shape",
     "<control>Shape</control> is the path of the sweep: <value>Triangle</value> moves evenly up and down, "
     "<value>Sine</value> lingers at the ends, the random shapes wander. Default <value>{2}</value>."
     "<p>Tip: <value>Triangle</value> gives the even up-and-down of the tape original."},
    {"depth",
     "<control>Depth</control> is how far the delay sweeps above <reference>Delay</reference>, and so how far the notches "
     "travel. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: small depths shimmer; large ones sweep the whole spectrum."},
    {"delay",
     "<control>Delay</control> is the shortest delay of the sweep: the shorter, the higher and further apart the notches. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: below 1 ms the comb sits high and sounds airy; near 5 ms it turns metallic."},
    {"feedback",
     "<control>Feedback</control> sends the delayed sound round again and turns the notches into ringing peaks; negative "
     "values give a hollower tone. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: negative values sound hollow and nasal, positive ones ring and whistle."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sweep behind the left's. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: <value>180°</value> makes the sweep travel across the stereo field."},
    {"mix",
     "<control>Dry/wet</control> blends the delayed sound with the original; the deepest notches are at "
     "<value>50 %</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: the effect is strongest at <value>50 %</value>; less gives a subtle shimmer."},
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
