#include <cstdlib>
#include <fstream>
#include <string>

#include "kernel/KException.h"
#include "plugins/KPluginEditors.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

extern const char kSnapshotUsage[] =
    "usage: torvane snapshot PLUGIN OUT.png [--set KEY=VALUE]... [--preset FILE] [--scale S] [--drawer software|opengl]\n"
    "  The plug-in's editor as a host would show it, drawn without a host into a PNG file, at\n"
    "  scale S (1, 1.5 or 2; default 1) by the software drawer (default) or the OpenGL drawer.\n";

int KRunSnapshot(std::span<char* const> words) {
  const KCliArguments arguments(words, "snapshot", {"set", "preset", "scale", "drawer"}, {});
  if (arguments.Positional().size() != 2) KCliFail("'snapshot' takes a plug-in name and an output file.");
  const double scale = arguments.Has("scale") ? std::atof(arguments.Last("scale")->c_str()) : 1.0;
  if (scale != 1 && scale != 1.5 && scale != 2) KCliFail("The scale must be 1, 1.5 or 2.");
  const std::string drawer = arguments.Last("drawer").value_or("software");
  if (drawer != "software" && drawer != "opengl") KCliFail("The drawer must be 'software' or 'opengl'.");

  KCliPlugin session(arguments.Positional()[0]);
  session.ApplySettings(arguments);
  std::string png;
  try {
    png = KPluginEditorSnapshotPNG(session.Plugin(), scale, drawer == "opengl");
  } catch (const KException& failure) {
    KCliFail(failure.Message().ToUtf8());
  }
  std::ofstream file(arguments.Positional()[1], std::ios::binary);
  file << png;
  if (!file.flush()) KCliFail("Could not write '" + arguments.Positional()[1] + "'.");
  return 0;
}
