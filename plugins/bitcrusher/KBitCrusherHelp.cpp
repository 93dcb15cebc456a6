#include "plugins/KPluginHelp.h"
#include "plugins/bitcrusher/KBitCrusherPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"bits",
     "<control>Bits</control> is the resolution each sample is rounded to: every bit fewer halves the number of levels and "
     "raises the noise floor by 6 dB. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: <example>12 bits</example> recalls early samplers, <example>4 bits</example> and below turn into buzzing distortion."},
    {"downsample",
     "<control>Downsample</control> holds each sample for this many samples, lowering the sample rate without a filter, so "
     "that high frequencies fold back as metallic tones. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value> (off).<p>Tip: small factors of <example>2 to 4</example> on drums give the crunch of early "
     "samplers."},
    {"mix",
     "<control>Dry/wet</control> blends the crushed signal with the original. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: a little crushed signal under the original adds grit while the sound stays clear."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the mix. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: low bit depths are loud and harsh; lower the output to judge the effect fairly."},
};

constexpr KPluginHelp kHelp{
    "KBitCrusherPlugin",
    "BitCrusher",
    "The <name>BitCrusher</name> makes a signal sound like early digital gear: it lowers the resolution of each sample and "
    "the rate at which samples are taken, deliberately keeping the noise and aliasing that careful converters remove.",
    kParameters,
};
}  // namespace

const KPluginHelp& KBitCrusherHelp() { return kHelp; }
