#include "plugins/KPluginHelp.h"
#include "plugins/phaser/KPhaserPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how fast the notches sweep, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: slow rates suit pads and electric pianos; faster ones guitars."},
    {"sync",
     "<control>Sync</control> ties one sweep to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: a whole note keeps the swirl in time with chords."},
    {"shape",
     "<control>Shape</control> is the path of the sweep between the two frequencies. Default <value>{2}</value>."
     "<p>Tip: <value>Sine</value> gives the smooth swirl of the classic stomp box."},
    {"stages",
     "<control>Stages</control> is the number of allpass stages: every two make one notch, so more stages give a denser, "
     "more pronounced sweep. Default <value>{2}</value>."
     "<p>Tip: four stages sound vocal and funky, twelve deep and dramatic."},
    {"low",
     "<control>Low frequency</control> is where the sweep turns at the bottom. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: keep it above 200 Hz to leave the bass steady."},
    {"high",
     "<control>High frequency</control> is where the sweep turns at the top. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: a wide range from low to high gives the most movement."},
    {"feedback",
     "<control>Feedback</control> sends the chain's output back to its input and sharpens the notches into resonant peaks. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: high feedback with few stages gives a throaty, resonant sweep."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sweep behind the left's. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: <value>90°</value> makes the phaser swirl around the listener."},
    {"mix",
     "<control>Dry/wet</control> blends the chain with the original; the notches are deepest at <value>50 %</value>. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: turning it past <value>50 %</value> makes the notches shallower again."},
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
