#include "plugins/KPluginHelp.h"
#include "plugins/tremolo/KTremoloPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how often the level rises and falls, in cycles per second, while "
     "<reference>Sync</reference> is <value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>."
     "<p>Tip: 4 to 7 Hz give the vintage amplifier sound."},
    {"sync",
     "<control>Sync</control> ties one pulse to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: sixteenth notes with a square shape make a rhythmic chop."},
    {"shape",
     "<control>Shape</control> is the pulse's form: <value>Sine</value> for the smooth throb of an amplifier, "
     "<value>Square</value> to chop, the random shapes for a restless flutter. Default <value>{2}</value>."
     "<p>Tip: a square with a little smoothing sounds like a fast gate."},
    {"depth",
     "<control>Depth</control> is how far the level falls at the bottom of each pulse: <value>100 %</value> falls to "
     "silence. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: around 50 % pulses gently; 100 % chops completely."},
    {"spread",
     "<control>Stereo phase</control> sets the right channel's pulse behind the left's: <value>180°</value> swings the sound "
     "from side to side. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: <value>180°</value> turns the tremolo into an auto-pan."},
    {"smoothing",
     "<control>Smoothing</control> rounds off the edges of the square and stepped shapes so that they do not click. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: 1 to 3 ms keep a square chop free of clicks and still crisp."},
};

constexpr KPluginHelp kHelp{
    "KTremoloPlugin",
    "Tremolo",
    "The <name>Tremolo</name> pulses the level of the sound, from the gentle throb of a vintage amplifier to a hard, "
    "tempo-synced chop.",
    kParameters,
};
}  // namespace

const KPluginHelp& KTremoloHelp() { return kHelp; }
