#include "plugins/KPluginHelp.h"
#include "plugins/transient/KTransientShaperPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"attack",
     "<control>Attack</control> makes the start of every note or hit louder (positive) or softer (negative), however loud "
     "the note is. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: raise it on drums "
     "that sound dull in the mix; lower it to tame a harsh pick or slap."},
    {"sustain",
     "<control>Sustain</control> makes what rings on after the start louder (positive) or softer (negative): the body of a "
     "note, the room around a drum. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: "
     "negative values dry up a roomy recording."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the shaping. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: more attack raises the peaks; lower the output to compare at equal loudness."},
};

constexpr KPluginHelp kHelp{
    "KTransientShaperPlugin",
    "TransientShaper",
    "The <name>TransientShaper</name> changes the envelope of a sound: it follows where notes begin and where they ring on, "
    "and turns the beginnings and the rest up or down independently, with no threshold to set.",
    kParameters,
};
}  // namespace

const KPluginHelp& KTransientShaperHelp() { return kHelp; }
