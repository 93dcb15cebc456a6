#include "plugins/KPluginHelp.h"
#include "plugins/loudnessmeter/KLoudnessMeterPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"target",
     "<control>Target loudness</control> is the integrated loudness you mix towards, shown beside the readings above the graph. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: broadcast asks for <example>-23 LUFS</example>; streaming services play back at about <example>-14 LUFS</example>."},
    {"history",
     "<control>Graph shows</control> chooses the reading the graph draws over the last 30 seconds: <value>Momentary</value> "
     "(400 ms, follows every phrase) or <value>Short-term</value> (3 s, follows the passages). Default <value>{2}</value>.<p>"
     "Tip: watch short-term loudness to balance the sections of a song against each other."},
};

constexpr KPluginHelp kHelp{
    "KLoudnessMeterPlugin",
    "Loudness meter",
    "The <name>Loudness meter</name> measures loudness the way broadcasters and streaming services do, in LUFS: "
    "<reference>Momentary</reference> over 400 ms, <reference>Short-term</reference> over 3 s and the integrated loudness of "
    "everything played since the start, leaving out pauses and quiet passages. The sound passes unchanged.",
    kParameters,
};
}  // namespace

const KPluginHelp& KLoudnessMeterHelp() { return kHelp; }
