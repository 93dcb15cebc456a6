#include "plugins/KPluginHelp.h"
#include "plugins/autopan/KAutoPanPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how often the sound travels from side to side and back, in cycles per second, while "
     "<reference>Sync</reference> is <value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>."},
    {"sync",
     "<control>Sync</control> ties one journey to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."},
    {"shape",
     "<control>Shape</control> is the path: <value>Sine</value> glides, <value>Square</value> jumps between the sides, "
     "<value>Sample &amp; hold</value> lands on a new random place each cycle. Default <value>{2}</value>."},
    {"width",
     "<control>Width</control> is how far the sound travels: <value>100 %</value> reaches each side fully. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"smoothing",
     "<control>Smoothing</control> softens the jumps of the square and stepped shapes into quick glides. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
};

constexpr KPluginHelp kHelp{
    "KAutoPanPlugin",
    "AutoPan",
    "The <name>AutoPan</name> moves the sound between the left and right speakers, smoothly or in steps, freely or in time "
    "with the song. It works on stereo tracks; a mono track passes unchanged.",
    kParameters,
};
}  // namespace

const KPluginHelp& KAutoPanHelp() { return kHelp; }
