#include "plugins/KPluginHelp.h"
#include "plugins/equalizer/KEqualizerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"band#enable",
     "<control>Band {3} enable</control> switches this band on or off. A band switched off passes the sound untouched and costs "
     "nothing. Default <value>{2}</value>.<p>Tip: toggle a band to hear exactly what it adds."},
    {"band#type",
     "<control>Band {3} type</control> chooses the filter of this band: <value>Peak</value> boosts or cuts around the frequency, the "
     "<value>shelves</value> everything below or above it, the <value>passes</value> remove what lies outside, "
     "<value>Notch</value> cuts one narrow frequency away. Default <value>{2}</value>.<p>Tip: use a low shelf for warmth and a high-pass to clear rumble, rather than many peaks."},
    {"band#freq",
     "<control>Band {3} frequency</control> is the centre or corner frequency of this band. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: boost a narrow band strongly and sweep it to find a problem frequency, then turn the boost into a cut."},
    {"band#gain",
     "<control>Band {3} gain</control> boosts or cuts this band (for the peak and shelf types). Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: cutting what is in the way usually sounds more natural than boosting what you miss."},
    {"band#q",
     "<control>Band {3} Q</control> is the bandwidth of this band: low values act broadly and gently, high values narrowly and "
     "precisely. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: broad boosts (<example>Q below 1</example>) and narrow cuts (<example>Q above 4</example>) tend to sound best."},
    {"outputgain",
     "<control>Output gain</control> sets the level after all bands. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: after boosting, bring the output down until bypassing the plug-in does not change the loudness."},
};

constexpr KPluginHelp kHelp{
    "KEqualizerPlugin",
    "Equalizer",
    "The <name>Equalizer</name> shapes the tone of a track with eight bands in series, each a filter of its own type, "
    "<reference>frequency</reference>, <reference>gain</reference> and <reference>Q</reference>. Every change glides, so bands can "
    "be swept and automated without clicks, and a band left flat costs nothing.",
    kParameters,
};
}  // namespace

const KPluginHelp& KEqualizerHelp() { return kHelp; }
