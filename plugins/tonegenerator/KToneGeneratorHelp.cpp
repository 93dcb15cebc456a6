#include "plugins/KPluginHelp.h"
#include "plugins/tonegenerator/KToneGeneratorPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"play",
     "<control>Play</control> starts and stops the tone. While it is off the input passes unchanged. Default <value>{2}</value>.<p>"
     "Tip: automate it to send test tones at exact places in a project."},
    {"waveform",
     "<control>Waveform</control>: a pure <value>Sine</value>, the softer <value>Triangle</value>, the hollow <value>Square</value>, "
     "the bright <value>Sawtooth</value>, or <value>White noise</value> with equal energy at every frequency. Default "
     "<value>{2}</value>.<p>Tip: noise through a spectrum analyser shows what a chain of plug-ins does to every frequency at once."},
    {"frequency",
     "<control>Frequency</control> is the pitch of the tone (noise has none). Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: sweep it slowly through the bass to find where a room booms."},
    {"level",
     "<control>Level</control> is the tone's peak level. Range <range>{0}</range> to <range>{1}</range>, default "
     "<value>{2}</value>.<p>Tip: a sine at <example>-18 dB</example> is a common line-up level; start low when speakers are on."},
    {"output",
     "<control>Output</control>: <value>Add to input</value> mixes the tone with the track, <value>Replace input</value> mutes the "
     "track while the tone plays. Default <value>{2}</value>.<p>"
     "Tip: replace the input to measure a chain of plug-ins with the tone alone."},
};

constexpr KPluginHelp kHelp{
    "KToneGeneratorPlugin",
    "Tone generator",
    "The <name>Tone generator</name> plays a test tone or noise at a set frequency and level, for lining up levels and checking "
    "speakers, rooms and plug-in chains. Switched off, it passes the sound unchanged.",
    kParameters,
};
}  // namespace

const KPluginHelp& KToneGeneratorHelp() { return kHelp; }
