#include <cstdio>

#include "kernel/KEntryPoints.h"
#include "kernel/KRegistries.h"
#include "tools/KCliArguments.h"
#include "tools/commands/KCommands.h"

int KRunList(std::span<char* const> words) {
  const KCliArguments arguments(words, "list", {}, {"modules"});
  if (!arguments.Positional().empty()) KCliFail("'list' takes no arguments.");
  const KStringList& keys = GetTorvanePluginList();  // builds the registries
  if (!arguments.Has("modules")) {
    for (const KString& key : keys) std::printf("%s\n", key.ToUtf8().c_str());
    return 0;
  }
  const KPluginRegistry& modules = KRegistries::Instance().Modules();
  for (int32_t i = 0; i < modules.Count(); ++i)
    std::printf("%s\t%s\n", modules.Record(i).category.ToUtf8().c_str(), modules.Record(i).key.ToUtf8().c_str());
  return 0;
}
