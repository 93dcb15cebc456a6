#include "plugins/KPluginHelp.h"
#include "plugins/midside/KMidSidePlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"midgain",
     "<control>Mid gain</control> raises or lowers what both sides have in common: the centre of the stereo image. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: a decibel or two less mid makes room for a vocal you add later."},
    {"sidegain",
     "<control>Side gain</control> raises or lowers what differs between the sides: the width and the room. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: more side gain widens a mix, but check it in mono: the side disappears there."},
    {"listen",
     "<control>Listen</control> lets you hear <value>Both</value>, the <value>Mid</value> alone or the <value>Side</value> alone "
     "(played in the centre). Default <value>{2}</value>.<p>"
     "Tip: listen to the side alone to hear the reverb and the stereo effects of a mix."},
    {"mode",
     "<control>Mode</control>: <value>Stereo</value> takes and gives left and right; <value>Encode</value> gives mid on the left "
     "channel and side on the right, so that the next plug-ins treat them apart; <value>Decode</value> takes such a signal and "
     "gives left and right again. Default <value>{2}</value>.<p>"
     "Tip: put an equalizer between an encoding and a decoding instance to equalize the centre and the sides differently."},
};

constexpr KPluginHelp kHelp{
    "KMidSidePlugin",
    "Mid/side",
    "The <name>Mid/side</name> processor splits a stereo signal into its centre (mid) and its width (side), sets their levels "
    "apart and lets you hear either alone. It can also code a signal into mid and side for other plug-ins, and decode it again.",
    kParameters,
};
}  // namespace

const KPluginHelp& KMidSideHelp() { return kHelp; }
