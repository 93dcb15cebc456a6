#include "plugins/KPluginHelp.h"
#include "plugins/autofilter/KAutoFilterPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"type",
     "<control>Type</control> is the filter: <value>Low pass</value> keeps the lows, <value>High pass</value> the highs, "
     "<value>Band pass</value> a band about the cutoff (a wah), <value>Notch</value> removes that band. Default "
     "<value>{2}</value>."
     "<p>Tip: start with <value>Band pass</value> and a resonance of about 5 for a wah."},
    {"cutoff",
     "<control>Cutoff</control> is the filter's frequency at the middle of the sweep. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: set it with the depth at 0, where you hear the filter standing still, then add depth."},
    {"resonance",
     "<control>Resonance</control> lifts the frequencies at the cutoff and narrows the band: high values whistle as the "
     "sweep moves. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: keep it below 2 on full mixes; push it on a single synth line."},
    {"depth",
     "<control>Depth</control> is how many octaves the cutoff moves above and below its setting. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: one octave is a gentle movement, three or four a dramatic sweep."},
    {"rate",
     "<control>Rate</control> is how fast the cutoff sweeps, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: slow rates of 0.1 to 0.5 Hz make long builds; several hertz make a wobble."},
    {"sync",
     "<control>Sync</control> ties one sweep to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: a sixteenth note with <value>Sample &amp; hold</value> gives rhythmic, stepped filtering."},
    {"shape",
     "<control>Shape</control> is the path of the sweep; <value>Sample &amp; hold</value> jumps to a new cutoff every "
     "cycle. Default <value>{2}</value>."
     "<p>Tip: <value>Triangle</value> sweeps evenly; <value>Saw up</value> opens and snaps shut."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sweep behind the left's. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: <value>180°</value> moves the sides against each other for a wide, swirling filter."},
};

constexpr KPluginHelp kHelp{
    "KAutoFilterPlugin",
    "AutoFilter",
    "The <name>AutoFilter</name> sweeps a resonant filter up and down with an LFO, freely or in time with the song: from a "
    "slow opening to wah-wah and stepped, random cutoffs.",
    kParameters,
};
}  // namespace

const KPluginHelp& KAutoFilterHelp() { return kHelp; }
