#pragma once

#include <span>

// The commands of `torvane`; each takes the words after its name and answers the exit code.
// Failures throw KException with a sentence for the user.
struct KCommand {
  const char* name;
  const char* usage;  // the --help text
  int (*run)(std::span<char* const> words);
};

std::span<const KCommand> KCommands();

int KRunList(std::span<char* const> words);
int KRunInfo(std::span<char* const> words);
int KRunRender(std::span<char* const> words);
int KRunState(std::span<char* const> words);
int KRunPresets(std::span<char* const> words);
int KRunPipeline(std::span<char* const> words);
extern const char kHelpUsage[];
int KRunHelp(std::span<char* const> words);
extern const char kSnapshotUsage[];
int KRunSnapshot(std::span<char* const> words);
