#include "plugins/KPluginHelp.h"
#include "plugins/limiter/KLimiterPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"inputgain",
     "<control>Input gain</control> drives the signal into the limiter. Every decibel added above the ceiling is taken away "
     "again as gain reduction, so the track gets louder while its peaks stay put. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: watch the gain reduction meter; a few decibels on the loudest "
     "hits is transparent, constant reduction is not."},
    {"ceiling",
     "<control>Ceiling</control> is the highest level any output sample reaches. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: leave <example>-1 dB</example> of room when the mix will be "
     "converted to a lossy format later."},
    {"release",
     "<control>Release</control> is how quickly the gain recovers after a peak. Short times keep the level up but can "
     "distort low notes; long times are smooth but pump. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: on a full mix, start around <example>100 ms</example> and shorten it until the level "
     "stays up without the bass getting rough."},
    {"lookahead",
     "<control>Lookahead</control> is how far ahead the limiter sees the peaks coming, so that it can lower the gain smoothly "
     "before they arrive. The output is delayed by the same time, which the host compensates. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: shorter lookahead reacts harder and suits drums; longer is "
     "cleaner on full mixes."},
    {"linkchannels",
     "<control>Link channels</control> applies the same gain to every channel, so the stereo image stays where it is. Off, "
     "each channel is limited on its own. Default <value>{2}</value>.<p>Tip: leave it on for stereo mixes; switch it off "
     "for two unrelated mono signals on one track."},
};

constexpr KPluginHelp kHelp{
    "KLimiterPlugin",
    "Limiter",
    "The <name>Limiter</name> keeps every sample of its output at or below the ceiling. It looks ahead into the signal and "
    "lowers the gain smoothly before each peak arrives, so that it needs no clipping; what stays below the ceiling passes "
    "unchanged.",
    kParameters,
};
}  // namespace

const KPluginHelp& KLimiterHelp() { return kHelp; }
