#include "plugins/KPluginHelp.h"
#include "plugins/stereoimager/KStereoImagerPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"width",
     "<control>Width</control> sets the stereo width above the <reference>Crossover</reference>: <value>0 %</value> is mono, "
     "<value>100 %</value> leaves it as it is, more exaggerates the difference between the sides. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: widen pads and overheads, and they leave the centre to the vocal."},
    {"lowwidth",
     "<control>Low width</control> sets the width below the <reference>Crossover</reference>. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: at <example>0 %</example> the bass is mono, which keeps it solid on club systems and vinyl."},
    {"crossover",
     "<control>Crossover</control> is the frequency that divides the low width from the width above it. Range <range>{0}</range> "
     "to <range>{1}</range>, default <value>{2}</value>.<p>Tip: <example>100 to 200 Hz</example> takes in bass and kick drum."},
};

constexpr KPluginHelp kHelp{
    "KStereoImagerPlugin",
    "Stereo imager",
    "The <name>Stereo imager</name> narrows or widens the stereo image, with a width of its own for the lows below the "
    "<reference>Crossover</reference>. It changes only the difference between the sides, so the mix sounds the same in mono.",
    kParameters,
};
}  // namespace

const KPluginHelp& KStereoImagerHelp() { return kHelp; }
