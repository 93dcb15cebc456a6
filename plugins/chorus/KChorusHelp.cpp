#include "plugins/KPluginHelp.h"
#include "plugins/chorus/KChorusPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how fast the voices sway, in cycles per second, while <reference>Sync</reference> is "
     "<value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: slow rates of 0.3 to 1 Hz sound natural; faster ones turn seasick."},
    {"sync",
     "<control>Sync</control> ties one sway to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: a whole note or longer keeps the movement calm in time with the song."},
    {"depth",
     "<control>Depth</control> is how far the voices' delay swings, and so how much their pitch wavers. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: a few milliseconds thicken; above 6 ms the pitch wobble becomes obvious."},
    {"delay",
     "<control>Delay</control> is how far behind the sound the first voice sits; further voices sit further back. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: short delays sound tight, longer ones like a doubled part."},
    {"voices",
     "<control>Voices</control> is the number of copies that sway against each other: more voices give a thicker ensemble. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: two voices widen a guitar; four make strings and pads lush."},
    {"spread",
     "<control>Stereo spread</control> sets the right channel's sway behind the left's: <value>0°</value> keeps them in step, "
     "<value>180°</value> makes them move against each other for the widest image. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: <value>90°</value> widens without losing the centre; <value>180°</value> is widest."},
    {"mix",
     "<control>Dry/wet</control> blends the voices with the original; <value>100 %</value> leaves only the voices, a "
     "vibrato. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: on a send, set <value>100 %</value> and blend with the send level."},
};

constexpr KPluginHelp kHelp{
    "KChorusPlugin",
    "Chorus",
    "The <name>Chorus</name> thickens and widens a sound with slightly delayed copies whose pitch drifts gently against it, "
    "as several players of one part never quite agree.",
    kParameters,
};
}  // namespace

const KPluginHelp& KChorusHelp() { return kHelp; }
