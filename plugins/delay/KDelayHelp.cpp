#include "plugins/KPluginHelp.h"
#include "plugins/delay/KDelayPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"time",
     "<control>Time</control> is the distance between the sound and its first repeat, and between the repeats, while "
     "<reference>Sync</reference> is <value>Free</value>. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: turning it while the repeats ring bends their pitch like a tape machine."},
    {"sync",
     "<control>Sync</control> sets the time as a note value at the host's tempo, straight, dotted or triplet; "
     "<value>Free</value> uses <reference>Time</reference>. Default <value>{2}</value>.<p>"
     "Tip: a dotted eighth against straight eighths gives the classic rolling guitar echo."},
    {"feedback",
     "<control>Feedback</control> is how much of each repeat is sent round again: <value>0 %</value> gives a single echo, high "
     "values long trails. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: above 80 % the repeats build into long trails; watch the level."},
    {"lowcut",
     "<control>Low cut</control> thins every repeat below this frequency, so trails do not muddy the low end. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: raise it to 200 to 400 Hz so that repeats of a bass-heavy source stay clear."},
    {"highcut",
     "<control>High cut</control> darkens every repeat above this frequency, as analogue and tape echoes do. Range "
     "<range>{0}</range> to <range>{1}</range>, default <value>{2}</value>."
     "<p>Tip: 2 to 4 kHz gives the warm sound of tape and bucket-brigade echoes."},
    {"pingpong",
     "<control>Ping-pong</control> sends the repeats from one side to the other: the first comes from the left, the next from "
     "the right. Needs a stereo track. Default <value>{2}</value>."
     "<p>Tip: pair it with a synced eighth note for a wide, rhythmic bounce."},
    {"mix",
     "<control>Dry/wet</control> blends the repeats with the original: <value>0 %</value> is only the original, "
     "<value>100 %</value> only the repeats (for a send). Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>."
     "<p>Tip: keep it low, 15 to 25 %, so the echoes sit behind the sound."},
};

constexpr KPluginHelp kHelp{
    "KDelayPlugin",
    "Delay",
    "The <name>Delay</name> repeats the sound after a time you set in milliseconds or as a note value at the song's tempo. "
    "Each repeat passes a low cut and a high cut on its way round, so the trail grows darker and thinner as it fades; in "
    "ping-pong the repeats bounce between left and right.",
    kParameters,
};
}  // namespace

const KPluginHelp& KDelayHelp() { return kHelp; }
