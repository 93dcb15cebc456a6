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

constexpr KButtonHelp kButtons[] = {
    {"impulsefile", "Load impulse response",
     "<control>Load impulse response...</control> opens a chooser of WAV and FLAC files: pick a recording of a room, a hall or a "
     "vintage unit, and it plays instead of the built-in space. The file is read and resampled beside the sound, which goes on "
     "playing the old space until the new one is ready. Its path is saved with the project.<p>"
     "Tip: a response with one channel plays on both sides; one with two keeps its stereo image."},
    {"builtinspace", "Built-in space",
     "<control>Built-in space</control> forgets the loaded file and goes back to the space chosen under <control>Space</control>."},
    {"filechooser", "Choosing a file",
     "The chooser lists the folder named at its top: first <value>..</value>, the way up, then the folders, then the WAV and FLAC "
     "files. Click an entry to select it; double-click it, or press <shortcut>Return</shortcut>, to open a folder or load a file. "
     "<shortcut>Backspace</shortcut> goes up a folder, <shortcut>Escape</shortcut> closes the chooser. Click the path to type "
     "another folder or a file's whole path."},
};

constexpr KPluginHelp kHelp{
    "KConvolutionReverbPlugin",
    "Convolution reverb",
    "The <name>Convolution reverb</name> places the sound in a real or synthetic space by convolving it with the space's impulse "
    "response, its answer to a single click. Load a WAV or FLAC recording of a room, a hall or a vintage unit, or use one of the "
    "built-in spaces. It adds no latency.",
    kParameters,
    kButtons,
};
}  // namespace

const KPluginHelp& KConvolutionReverbHelp() { return kHelp; }
