#include "plugins/KPluginHelp.h"
#include "plugins/reverb/KReverbPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"predelay",
     "<control>Pre-delay</control> holds the reverberation back after the sound, as the first reflections of a large room "
     "arrive late. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: 20 to 40 ms keep a vocal clear in front of a long reverb."},
    {"decay",
     "<control>Decay</control> is the time the reverberation takes to fall by 60 dB, at low and middle frequencies (damping "
     "shortens the highs). Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: under a second for rooms, two to four for halls, longer for ambience."},
    {"size",
     "<control>Size</control> scales the space: small values give a dense, boxy room, large ones a spacious hall with slower "
     "build-up. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>. Not automatable: a change "
     "restarts the echoes."
     "<p>Tip: match size and decay: a small size with a long decay sounds unnatural."},
    {"damping",
     "<control>Damping</control> makes the highs die away sooner than the lows, as soft furnishings and air do. "
     "<value>0 %</value> keeps a bright, metallic tail. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>."
     "<p>Tip: raise it for a warm, natural room; lower it for a bright plate."},
    {"width",
     "<control>Width</control> spreads the reverberation across the stereo field: <value>0 %</value> is mono, "
     "<value>100 %</value> fully wide. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: narrow the reverb of a mono source that must stay centred."},
    {"mix",
     "<control>Dry/wet</control> blends the reverberation with the original; use <value>100 %</value> on a send. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: on an insert, 15 to 30 % is usually plenty."},
};

constexpr KPluginHelp kHelp{
    "KReverbPlugin",
    "Reverb",
    "The <name>Reverb</name> places the sound in a room, from a small booth to an endless hall. Its tail decays evenly for "
    "exactly the time you set, with the highs fading sooner as damping rises, and spreads wide across the stereo field.",
    kParameters,
};
}  // namespace

const KPluginHelp& KReverbHelp() { return kHelp; }
