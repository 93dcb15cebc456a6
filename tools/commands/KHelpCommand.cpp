#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include "plugins/KPluginHelpPage.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

extern const char kHelpUsage[] =
    "usage: torvane help PLUGIN [--html FILE] [--png FILE [--scale S]]\n"
    "  The plug-in's help, for every parameter: what it does, its range and a tip. Printed as text;\n"
    "  with --html written as one web page with its own style sheet, with --png drawn as the help\n"
    "  window shows it (480 units wide, at scale S, default 1).\n";

namespace {
constexpr int32_t kPictureWidth = 480;

void Write(const std::string& path, const std::string& bytes) {
  std::ofstream file(path, std::ios::binary);
  file << bytes;
  if (!file.flush()) KCliFail("Could not write '" + path + "'.");
}
}  // namespace

int KRunHelp(std::span<char* const> words) {
  const KCliArguments arguments(words, "help", {"html", "png", "scale"}, {});
  if (arguments.Positional().size() != 1) KCliFail("'help' takes one plug-in name.");
  KCliPlugin session(arguments.Positional()[0]);
  const KPluginHelpPage page(session.Plugin());
  const auto html = arguments.Last("html"), png = arguments.Last("png");
  if (html) Write(*html, page.Html());
  if (png) {
    const double scale = arguments.Has("scale") ? std::atof(arguments.Last("scale")->c_str()) : 1.0;
    if (!(scale >= 0.5 && scale <= 4)) KCliFail("The scale must lie between 0.5 and 4.");
    Write(*png, page.PicturePNG(kPictureWidth, scale));
  }
  if (!html && !png) std::fputs(page.PlainText().c_str(), stdout);
  return 0;
}
