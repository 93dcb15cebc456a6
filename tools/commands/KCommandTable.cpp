#include "tools/commands/KCommands.h"

namespace {
constexpr KCommand kCommands[] = {
    {"list",
     "usage: torvane list [--modules]\n"
     "  One plug-in key per line, in registry order. With --modules: \"category<TAB>key\" for\n"
     "  every effect module.\n",
     KRunList},
    {"info",
     "usage: torvane info PLUGIN [--json]\n"
     "  Every parameter (index, key, name, unit, default, range, steps, automatable), the buses\n"
     "  and channels, the latency at 48 kHz, and MIDI input and output.\n",
     KRunInfo},
    {"render",
     "usage: torvane render PLUGIN [INPUT] OUTPUT [options]\n"
     "  Processes INPUT (any file libsndfile reads; without it a built-in demo) into OUTPUT, whose\n"
     "  extension picks the container (.wav, .flac, .aiff, .ogg).\n"
     "  --set KEY=VALUE         a parameter, in working units or as display text (repeatable)\n"
     "  --preset FILE           a state document as 'torvane state' prints it (--set after it overrides)\n"
     "  --automate KEY=T:V,...  break points in seconds and working units, sample-accurate\n"
     "  --block N|random        host block size (default 512); random: 1 to 512, fixed seed\n"
     "  --tail SECONDS          silence processed after the input\n"
     "  --sidechain FILE        input of the plug-in's side-chain bus\n"
     "  --format f32|s24|s16    sample format (default: f32 for WAV and AIFF, s24 for FLAC)\n",
     KRunRender},
    {"state",
     "usage: torvane state PLUGIN [--set KEY=VALUE]... [--preset FILE]\n"
     "  Prints the plug-in's state document (UTF-8 XML) with the settings given, in order.\n",
     KRunState},
    {"presets",
     "usage: torvane presets PLUGIN [list | save NAME | load NAME | delete NAME] [--set ...] [--preset FILE]\n"
     "  The user's presets of the plug-in: list them (the default), save the settings given under\n"
     "  NAME, print a preset's state document, or delete it.\n",
     KRunPresets},
    {"help", kHelpUsage, KRunHelp},
    {"snapshot", kSnapshotUsage, KRunSnapshot},
};
}  // namespace

std::span<const KCommand> KCommands() { return kCommands; }
