#include "plugins/KPluginHelp.h"
#include "plugins/utility/KUtilityPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"gain",
     "<control>Gain</control> changes the level of the signal. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: put the plug-in last on a track to trim its level without touching the fader automation."},
    {"balance",
     "<control>Balance</control> turns one side down to move the stereo image left or right; the centre leaves both sides as they "
     "are. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: small moves are enough to make room for another instrument on the other side."},
    {"width",
     "<control>Width</control> narrows or widens the stereo image: <value>0 %</value> is mono, <value>100 %</value> leaves it "
     "unchanged, higher values exaggerate the difference between the sides. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: narrow the bass and the kick towards mono and widen pads, and the mix gets depth without losing punch."},
    {"invertleft",
     "<control>Invert left</control> turns the left channel's waveform upside down (polarity). Default <value>{2}</value>.<p>"
     "Tip: if two microphones on one source sound thin together, try inverting one of them."},
    {"invertright",
     "<control>Invert right</control> turns the right channel's waveform upside down (polarity). Default <value>{2}</value>.<p>"
     "Tip: with both sides inverted the sound is unchanged on its own but cancels against the original: a quick null test."},
    {"swap",
     "<control>Swap channels</control> exchanges left and right. Default <value>{2}</value>.<p>"
     "Tip: handy when a recording was made with the cables crossed."},
    {"mono",
     "<control>Mono</control> sums both channels and sends the sum to both sides. Default <value>{2}</value>.<p>"
     "Tip: check your mix in mono now and then; what disappears here will disappear on a phone speaker too."},
    {"mute",
     "<control>Mute</control> silences the output without a click. Default <value>{2}</value>.<p>"
     "Tip: automate it for clean drop-outs in an arrangement."},
};

constexpr KPluginHelp kHelp{
    "KUtilityPlugin",
    "Utility",
    "The <name>Utility</name> does the small jobs every track needs: level, balance, stereo width, polarity, channel swap, mono and "
    "mute. Every change glides over a few milliseconds, so nothing clicks, even under automation.",
    kParameters,
};
}  // namespace

const KPluginHelp& KUtilityHelp() { return kHelp; }
