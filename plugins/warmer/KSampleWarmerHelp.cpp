#include "plugins/KPluginHelp.h"
#include "plugins/warmer/KSampleWarmer.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"drive",
     "<control>Drive</control> is how hard the signal is pushed into the saturation curve. Low settings add a little warmth, high "
     "settings audible distortion. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: drive raises the level too; balance it with <reference>Output gain</reference> before you judge the colour."},
    {"shape",
     "<control>Shape</control> chooses the saturation curve: <value>Soft clip</value> rounds off only the peaks, "
     "<value>Tanh</value> saturates smoothly and evenly, <value>Tube</value> saturates one half of the wave sooner, which adds "
     "the even harmonics of valve gear. Default <value>{2}</value>.<p>"
     "Tip: try <value>Tube</value> on bass and vocals for body, <value>Soft clip</value> on drums to catch peaks."},
    {"tone",
     "<control>Tone</control> tilts the sound after the saturation: positive values brighten, negative values darken, "
     "<value>0</value> leaves it as it is. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: a little darkening tames the fizz of heavy drive."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the saturation and the mix. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: match the bypassed level so that you hear colour, not loudness."},
    {"mix",
     "<control>Dry/wet</control> blends the saturated signal with the original: <value>0 %</value> is only the original, "
     "<value>100 %</value> only the saturated sound. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: heavy drive mixed in at <example>20 to 30 %</example> adds density while the transients stay clean."},
};

constexpr KPluginHelp kHelp{
    "KSampleWarmer",
    "SampleWarmer",
    "The <name>SampleWarmer</name> adds the warmth and density of analogue saturation: the signal is driven into one of three "
    "curves at a multiple of the sample rate, so the added harmonics stay clean, then tilted in tone and blended with the "
    "original.",
    kParameters,
};
}  // namespace

const KPluginHelp& KSampleWarmerHelp() { return kHelp; }
