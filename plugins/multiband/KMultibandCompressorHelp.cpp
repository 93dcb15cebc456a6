#include "plugins/KPluginHelp.h"
#include "plugins/multiband/KMultibandCompressorPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"bands",
     "<control>Bands</control> is how many frequency bands the signal is split into, each compressed on its own. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: two bands are enough to control a "
     "boomy bass or sharp sibilance; use more only when several ranges need different treatment."},
    {"crossover#",
     "<control>Crossover {3}</control> is the frequency where one band ends and the next begins. The bands overlap "
     "smoothly and add up to the original sound when nothing is compressed. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: place crossovers between instruments, for example below "
     "the vocal's body or below the cymbals."},
    {"band#threshold",
     "<control>Band {3} threshold</control> is the level above which this band is compressed. Range <range>{0}</range> "
     "to <range>{1}</range>, default <value>{2}</value>.<p>Tip: lower it until the band's gain reduction shows on its "
     "loudest notes only."},
    {"band#ratio",
     "<control>Band {3} ratio</control> is how strongly this band is compressed above its threshold: at "
     "<value>4 : 1</value> four decibels over the threshold become one; <value>1 : 1</value> leaves the band alone. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: gentle ratios on a whole mix, "
     "steep ones to catch a single problem such as sibilance."},
    {"band#attack",
     "<control>Band {3} attack</control> is how quickly this band is turned down when it gets loud. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: low bands need longer attacks than "
     "high ones, or their waves get distorted."},
    {"band#release",
     "<control>Band {3} release</control> is how quickly this band recovers. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: release the low band slowly and the high bands quickly, so "
     "that none of them pumps."},
    {"band#gain",
     "<control>Band {3} gain</control> raises or lowers this band after its compression, to make up what was taken away "
     "or to balance the bands. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: with "
     "the ratio at 1 : 1 the band gains work as a smooth, phase-coherent equalizer."},
    {"outputgain",
     "<control>Output gain</control> sets the level of the bands added together. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: match the bypassed level before you judge the compression."},
};

constexpr KPluginHelp kHelp{
    "KMultibandCompressorPlugin",
    "MultibandCompressor",
    "The <name>MultibandCompressor</name> splits the sound into up to four frequency bands and compresses each on its own, "
    "so that a booming bass note no longer pushes the vocal down, and sharp highs can be tamed without dulling the rest.",
    kParameters,
};
}  // namespace

const KPluginHelp& KMultibandCompressorHelp() { return kHelp; }
