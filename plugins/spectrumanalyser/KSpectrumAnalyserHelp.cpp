#include "plugins/KPluginHelp.h"
#include "plugins/spectrumanalyser/KSpectrumAnalyserPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"resolution",
     "<control>Resolution</control> is how many samples each picture of the spectrum is computed from. More samples separate "
     "close frequencies better, fewer follow quick changes better. Default <value>{2}</value>.<p>"
     "Tip: use <example>8192</example> to find the exact pitch of a bass note, <example>1024</example> to watch drums."},
    {"slope",
     "<control>Slope</control> tilts the picture about 1 kHz, lifting the highs and lowering the lows by this much per octave. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: at about <example>3 dB/oct</example> a well-balanced mix looks roughly level."},
    {"release",
     "<control>Release</control> is how long a peak takes to fall 60 dB in the picture once the sound has gone. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: a long release shows which frequencies dominate over a whole phrase."},
    {"floor",
     "<control>Floor</control> is the lowest level the picture shows; quieter parts of the spectrum rest on it. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: raise it to hide the noise floor of a recording and see the music more clearly."},
};

constexpr KPluginHelp kHelp{
    "KSpectrumAnalyserPlugin",
    "Spectrum analyser",
    "The <name>Spectrum analyser</name> shows how the sound's energy is spread over the frequencies, from 20 Hz to 20 kHz, "
    "updated continuously. The sound passes unchanged.",
    kParameters,
};
}  // namespace

const KPluginHelp& KSpectrumAnalyserHelp() { return kHelp; }
