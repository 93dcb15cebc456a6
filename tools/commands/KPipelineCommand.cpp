#include <cstdio>
#include <vector>

#include "core/KPipelineFile.h"
#include "core/KXMLWriter.h"
#include "kernel/KRegistries.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

namespace {
// The effect-module key of a plug-in given by its registry key: the module made by the same
// factory.
KString ModuleKey(KAudioPlugin& plugin) {
  const KPluginRegistry& main = KRegistries::Instance().Main();
  const KPluginRegistry& modules = KRegistries::Instance().Modules();
  const KPluginRecord* record = main.FindExact(plugin.Identifier());
  for (int32_t m = 0; record && m < modules.Count(); ++m)
    if (modules.Record(m).factory == record->factory) return modules.Record(m).key;
  KCliFail(plugin.Identifier().ToUtf8() + " is no effect module; 'torvane list --modules' shows them.");
}
}  // namespace

int KRunPipeline(std::span<char* const> words) {
  std::vector<KPipelineModule> modules;
  for (std::span<char* const> part : KSplitChain(words)) {
    const KCliArguments arguments(part, "pipeline", {"set", "preset"}, {"bypass"});
    if (arguments.Positional().size() != 1) KCliFail("'pipeline' takes PLUGIN [options] [+ PLUGIN [options]]...: one plug-in name each.");
    KCliPlugin session(arguments.Positional()[0]);
    session.ApplySettings(arguments);
    KPipelineModule module{ModuleKey(session.Plugin()), static_cast<int32_t>(modules.size()), arguments.Has("bypass"), Element()};
    session.Plugin().StoreState(module.state);
    modules.push_back(std::move(module));
  }
  std::fputs(KXMLWriter::Write(KPipelineFile::Write(modules)).c_str(), stdout);
  return 0;
}
