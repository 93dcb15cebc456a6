#include "plugins/KPluginHelp.h"
#include "plugins/gate/KGatePlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"threshold",
     "<control>Threshold</control> is the level above which the signal passes untouched. Below it the gate closes or the "
     "expander turns the signal down. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: set it just above the noise or spill you want to remove, and below the quietest note you want to keep."},
    {"ratio",
     "<control>Ratio</control> is how steeply the signal is turned down below the threshold: at <value>2 : 1</value> every "
     "decibel below it becomes two, at the top of the range the gate shuts at once. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: low ratios of <example>2 : 1 to 4 : 1</example> make a "
     "gentle expander that lowers noise without audible switching."},
    {"range",
     "<control>Range</control> is the most the signal is turned down when the gate is closed. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: a range of <example>-10 to -20 dB</example> lowers spill "
     "without the unnatural silence of a fully closed gate."},
    {"attack",
     "<control>Attack</control> is how quickly the gate opens when the signal rises above the threshold. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>Tip: very short times keep the click of a "
     "drum hit; slightly longer ones avoid clicks on smooth sounds."},
    {"hold",
     "<control>Hold</control> keeps the gate open for this long after the signal has fallen below the threshold, so that it "
     "does not chatter on low notes or short gaps. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: if the gate flutters on a decaying note, lengthen the hold before you lengthen the release."},
    {"release",
     "<control>Release</control> is how quickly the gate closes after the hold. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: follow the natural decay of the instrument; too short cuts "
     "off its tail."},
    {"linkchannels",
     "<control>Link channels</control> opens and closes every channel together, so that the stereo image stays still. "
     "Default <value>{2}</value>.<p>Tip: switch it off only for two unrelated mono sources on one stereo track."},
};

constexpr KPluginHelp kHelp{
    "KGatePlugin",
    "Gate",
    "The <name>Gate</name> removes noise, hum and spill between the notes: it lets the signal pass while it is louder than "
    "the threshold and turns it down while it is quieter, either all at once as a gate or gradually as an expander.",
    kParameters,
};
}  // namespace

const KPluginHelp& KGateHelp() { return kHelp; }
