#include "plugins/KPluginHelp.h"
#include "plugins/dynamiceq/KDynamicEqualizerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"band#enable",
     "<control>Band {3} on</control> switches this band in or out; switched off, it leaves the sound untouched. Default "
     "<value>{2}</value>.<p>Tip: switch a band off and on to hear what it does."},
    {"band#type",
     "<control>Band {3} type</control>: a <value>Bell</value> acts around its frequency, a <value>Low shelf</value> on "
     "everything below it, a <value>High shelf</value> on everything above it. Default <value>{2}</value>.<p>Tip: shelves "
     "suit broad tone control, bells a single problem frequency."},
    {"band#freq",
     "<control>Band {3} frequency</control> is where this band acts, and what its detector listens to. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: boost the band steeply for a moment "
     "and sweep it to find the frequency that bothers you, then set the gain back."},
    {"band#q",
     "<control>Band {3} Q</control> is how narrow this band is, for the equalizer and its detector alike: high values act "
     "on a narrow range of frequencies. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: narrow bands for resonances, wide ones for tone."},
    {"band#gain",
     "<control>Band {3} gain</control> is the boost or cut that this band always applies, like a plain equalizer. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: leave it at 0 dB to make the band "
     "purely dynamic."},
    {"band#threshold",
     "<control>Band {3} threshold</control> is the level the band's own frequencies must exceed before its gain starts "
     "to move. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: set it so that only the "
     "offending notes cross it."},
    {"band#range",
     "<control>Band {3} range</control> is how far the gain may move while the band is loud: negative values cut, "
     "positive values boost, one decibel for each decibel over the threshold. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: a cut of <example>-4 to -8 dB</example> at the harsh "
     "frequencies of a voice tames them only when they flare up."},
    {"attack",
     "<control>Attack</control> is how quickly the bands react when their frequencies get loud. Range <range>{0}</range> "
     "to <range>{1}</range>, default <value>{2}</value>.<p>Tip: short attacks catch sibilance, longer ones let the "
     "start of each note through."},
    {"release",
     "<control>Release</control> is how quickly the bands return to their static gain. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: a release near the length of a syllable sounds most natural "
     "on vocals."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the equalizer. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: make up for cuts here so that the bypass compares at equal loudness."},
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
