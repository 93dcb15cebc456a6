#include "plugins/KPluginHelp.h"
#include "plugins/dynamiceq/KDynamicEqualizerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"band#enable", "<control>Band {3} on</control> switches band {3} in or out. Default <value>{2}</value>."},
    {"band#type",
     "<control>Band {3} type</control>: a <value>Bell</value> acts around its frequency, a <value>Low shelf</value> on "
     "everything below it, a <value>High shelf</value> on everything above it. Default <value>{2}</value>."},
    {"band#freq",
     "<control>Band {3} frequency</control> is where band {3} acts, and what its detector listens to. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"band#q",
     "<control>Band {3} Q</control> is how narrow band {3} is, for the equalizer and its detector alike: high values act on "
     "a narrow range of frequencies. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"band#gain",
     "<control>Band {3} gain</control> is the boost or cut that band {3} always applies, like a plain equalizer. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"band#threshold",
     "<control>Band {3} threshold</control> is the level the band's own frequencies must exceed before its gain starts to "
     "move. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."},
    {"band#range",
     "<control>Band {3} range</control> is how far the gain may move while the band is loud: negative values cut, positive "
     "values boost, one decibel for each decibel over the threshold. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: a cut of <example>-4 to -8 dB</example> at the harsh frequencies of a voice "
     "tames them only when they flare up."},
    {"attack",
     "<control>Attack</control> is how quickly the bands react when their frequencies get loud. Range <range>{0}</range> "
     "to <range>{1}</range>, default <value>{2}</value>."},
    {"release",
     "<control>Release</control> is how quickly the bands return to their static gain. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the equalizer. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>."},
};

constexpr KPluginHelp kHelp{
    "KDynamicEqualizerPlugin",
    "DynamicEqualizer",
    "The <name>DynamicEqualizer</name> is an equalizer whose bands react to the music: each band listens to its own "
    "frequencies and cuts or boosts them only while they are louder than its threshold, so a harsh note or a booming bass "
    "note is tamed while the rest of the performance stays as it is.",
    kParameters,
};
}  // namespace

const KPluginHelp& KDynamicEqualizerHelp() { return kHelp; }
