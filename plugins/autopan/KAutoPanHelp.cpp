#include "plugins/KPluginHelp.h"
#include "plugins/autopan/KAutoPanPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"rate",
     "<control>Rate</control> is how often the sound travels from side to side and back, in cycles per second, while "
     "<reference>Sync</reference> is <value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>."
     "<p>Tip: below 1 Hz the movement reads as space; above 4 Hz it turns into a stereo tremolo."},
    {"sync",
     "<control>Sync</control> ties one journey to a note value at the host's tempo; <value>Free</value> uses "
     "<reference>Rate</reference>. Default <value>{2}</value>."
     "<p>Tip: a half or whole note keeps pads moving without drawing attention."},
    {"shape",
     "<control>Shape</control> is the path: <value>Sine</value> glides, <value>Square</value> jumps between the sides, "
     "<value>Sample &amp; hold</value> lands on a new random place each cycle. Default <value>{2}</value>."
     "<p>Tip: use smoothing with the square so the jumps do not click."},
    {"width",
     "<control>Width</control> is how far the sound travels: <value>100 %</value> reaches each side fully. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: around 30 to 50 % keeps the sound anchored while it breathes."},
    {"smoothing",
     "<control>Smoothing</control> softens the jumps of the square and stepped shapes into quick glides. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: a few milliseconds are enough to remove clicks; more turns jumps into glides."},
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
