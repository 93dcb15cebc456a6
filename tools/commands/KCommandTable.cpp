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
     "  Every parameter (key, name, default and range in its unit, list entries, automatable), the\n"
     "  buses and channels, the latency at 48 kHz, and MIDI input and output.\n",
     KRunInfo},
    {"render",
     "usage: torvane render PLUGIN [options] [+ PLUGIN [options]]... [INPUT] OUTPUT\n"
     "       torvane render PLUGIN [options] INPUT... --output-dir DIR\n"
     "  Processes INPUT (any file libsndfile reads, '-' for standard input; without it a built-in\n"
     "  demo) into OUTPUT ('-' for standard output), through every plug-in given, in series.\n"
     "  Options of the plug-in they follow:\n"
     "  --set KEY=VALUE         a value in working units or as display text with its unit (repeatable)\n"
     "  --preset FILE|NAME      a state document as 'torvane state' prints it, or a saved preset\n"
     "  --automate KEY=T:V,...  break points in seconds and working units, sample-accurate\n"
     "  --sidechain FILE        input of the plug-in's side-chain bus\n"
     "  Options of the whole render:\n"
     "  -t, --type TYPE         wav, flac, aiff, caf, w64, au or ogg (default: OUTPUT's extension)\n"
     "  --format FORMAT         s16, s24, s32, f32 or f64 (default: the input's where the type holds it)\n"
     "  --dither tpdf|none      dither when reducing to 16 or 24 bits (default tpdf)\n"
     "  --clipping warn|fail    what samples clipped at full scale do (default warn)\n"
     "  --block N|random        host block size (default 512); random: 1 to 512, fixed seed\n"
     "  --tail SECONDS          silence processed after the input\n"
     "  --output-dir DIR        render each INPUT into DIR under its own name\n"
     "  -q, --quiet             no summary on standard error\n",
     KRunRender},
    {"state",
     "usage: torvane state PLUGIN [--set KEY=VALUE]... [--preset FILE|NAME]\n"
     "  Prints the plug-in's state document (UTF-8 XML) with the settings given, in order.\n",
     KRunState},
    {"presets",
     "usage: torvane presets PLUGIN [list | save NAME | load NAME | delete NAME] [--set ...] [--preset FILE|NAME]\n"
     "  The user's presets of the plug-in: list them (the default; the file they are kept in goes\n"
     "  to standard error), save the settings given under NAME, print a preset's state document,\n"
     "  or delete it.\n",
     KRunPresets},
    {"pipeline",
     "usage: torvane pipeline PLUGIN [--set KEY=VALUE]... [--preset FILE|NAME] [--bypass] [+ PLUGIN ...]...\n"
     "  Prints an effect pipeline file (.tvpipe) that runs the effect modules given, in series,\n"
     "  each with its settings. 'render KEffectPipeline --preset FILE' plays it.\n",
     KRunPipeline},
    {"help", kHelpUsage, KRunHelp},
    {"snapshot", kSnapshotUsage, KRunSnapshot},
};
}  // namespace

std::span<const KCommand> KCommands() { return kCommands; }
