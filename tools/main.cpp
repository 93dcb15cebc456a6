// torvane: the command-line host. It reaches the kernel library only through its exported
// entry points, as every host does, and drives plug-ins as a host of its own kind.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <span>
#include <string_view>

#include "kernel/KException.h"
#include "tools/commands/KCommands.h"

namespace {

void PrintUsage() {
  std::printf("usage: torvane COMMAND [ARGUMENTS]\n       torvane --version\n\ncommands:\n");
  for (const KCommand& command : KCommands()) std::printf("  %s\n", command.name);
  std::printf("\n'torvane COMMAND --help' describes a command.\n");
}

bool AsksForHelp(std::span<char* const> words) {
  for (const char* word : words)
    if (std::strcmp(word, "--help") == 0 || std::strcmp(word, "-h") == 0) return true;
  return false;
}

// A command whose printed output did not all arrive (a full disk, a closed pipe) has failed.
int FinishOutput(int status) {
  if (std::fflush(stdout) == 0 && !std::ferror(stdout)) return status;
  std::fprintf(stderr, "torvane: Cannot write to standard output: %s.\n", std::strerror(errno));
  return 1;
}

}  // namespace

int main(int argc, char** argv) {
  const std::span<char* const> words(argv + 1, static_cast<size_t>(argc - 1));
  if (words.empty() || std::string_view(words[0]) == "--help" || std::string_view(words[0]) == "-h") {
    PrintUsage();
    return words.empty() ? 2 : 0;
  }
  if (words[0] == std::string_view("--version")) {
    std::printf("torvane %s\n", TORVANE_VERSION);
    return FinishOutput(0);
  }
  for (const KCommand& command : KCommands()) {
    if (words[0] != std::string_view(command.name)) continue;
    if (AsksForHelp(words.subspan(1))) {
      std::printf("%s", command.usage);
      return FinishOutput(0);
    }
    try {
      return FinishOutput(command.run(words.subspan(1)));
    } catch (const KException& failure) {
      // An empty message: the kernel has told the user already.
      if (!failure.Message().IsEmpty()) std::fprintf(stderr, "torvane: %s\n", failure.Message().ToUtf8().c_str());
      return 1;
    }
  }
  std::fprintf(stderr, "torvane: unknown command '%s'; 'torvane --help' lists the commands.\n", words[0]);
  return 2;
}
