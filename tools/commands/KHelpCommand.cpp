#include <cstdio>
#include <fstream>
#include <string>

#include "plugins/KPluginHelpPage.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

extern const char kHelpUsage[] =
    "usage: torvane help PLUGIN [--html FILE]\n"
    "  The plug-in's help, for every parameter: what it does, its range and a tip. Printed as text,\n"
    "  or with --html written as one web page with its own style sheet.\n";

namespace {
void Write(const std::string& path, const std::string& bytes) {
  std::ofstream file(path, std::ios::binary);
  file << bytes;
  if (!file.flush()) KCliFail("Could not write '" + path + "'.");
}
}  // namespace

int KRunHelp(std::span<char* const> words) {
  const KCliArguments arguments(words, "help", {"html"}, {});
  if (arguments.Positional().size() != 1) KCliFail("'help' takes one plug-in name.");
  KCliPlugin session(arguments.Positional()[0]);
  const KPluginHelpPage page(session.Plugin());
  if (const auto html = arguments.Last("html")) Write(*html, page.Html());
  else std::fputs(page.PlainText().c_str(), stdout);
  return 0;
}
