// torvane: the command-line host. It reaches the kernel library only through its exported
// entry points, as every host does, and drives plug-ins as a host of its own kind.
#include <cstdio>
#include <cstring>
#include <span>
#include <string_view>

#include "kernel/KException.h"
#include "tools/commands/KCommands.h"

namespace {

void PrintUsage() {
  std::printf("usage: torvane COMMAND [ARGUMENTS]\n\ncommands:\n");
  for (const KCommand& command : KCommands()) std::printf("  %s\n", command.name);
  std::printf("\n'torvane COMMAND --help' describes a command.\n");
}

bool AsksForHelp(std::span<char* const> words) {
  for (const char* word : words)
    if (std::strcmp(word, "--help") == 0 || std::strcmp(word, "-h") == 0) return true;
  return false;
}

}  // namespace

int main(int argc, char** argv) {
  const std::span<char* const> words(argv + 1, static_cast<size_t>(argc - 1));
  if (words.empty() || std::string_view(words[0]) == "--help" || std::string_view(words[0]) == "-h") {
    PrintUsage();
    return words.empty() ? 2 : 0;
  }
  for (const KCommand& command : KCommands()) {
    if (words[0] != std::string_view(command.name)) continue;
    if (AsksForHelp(words.subspan(1))) {
      std::printf("%s", command.usage);
      return 0;
    }
    try {
      return command.run(words.subspan(1));
    } catch (const KException& failure) {
      // An empty message: the kernel has told the user already (an unknown plug-in).
      if (!failure.Message().IsEmpty()) std::fprintf(stderr, "torvane: %s\n", failure.Message().ToUtf8().c_str());
      return 1;
    }
  }
  std::fprintf(stderr, "torvane: unknown command '%s'; 'torvane --help' lists the commands.\n", words[0]);
  return 2;
}
