#include "plugins/KPluginHelp.h"
#include "plugins/convolutionreverb/KConvolutionReverbPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"impulse",
     "<control>Space</control> picks one of the built-in spaces: <value>Small room</value> (short and close), <value>Hall</value> "
     "(long and dark) or <value>Plate</value> (dense and bright). An impulse response loaded from a file plays instead of them. "
     "Default <value>{2}</value>.<p>Tip: a small room behind a dry vocal adds presence without sounding like reverb."},
    {"mix",
     "<control>Mix</control> sets how much of the output is reverberation: <value>0 %</value> is the dry signal only, "
     "<value>100 %</value> the reverberation only. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: on an effect send, set it to <example>100 %</example> and control the amount with the send."},
    {"wetlevel",
     "<control>Wet level</control> raises or lowers the reverberation alone, on top of the mix. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: impulse responses from files differ widely in level; even them out here."},
    {"width",
     "<control>Width</control> narrows or widens the reverberation: <value>0 %</value> is mono, <value>100 %</value> as recorded, "
     "more exaggerates the difference between the sides. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: a narrower reverb keeps a mono source in the centre of the mix."},
};

constexpr KPluginHelp kHelp{
    "KConvolutionReverbPlugin",
    "Convolution reverb",
    "The <name>Convolution reverb</name> places the sound in a real or synthetic space by convolving it with the space's impulse "
    "response, its answer to a single click. Load a WAV or FLAC recording of a room, a hall or a vintage unit, or use one of the "
    "built-in spaces. It adds no latency.",
    kParameters,
};
}  // namespace

const KPluginHelp& KConvolutionReverbHelp() { return kHelp; }
