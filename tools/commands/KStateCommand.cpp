#include <cstdio>

#include "core/KPresetStore.h"
#include "kernel/KException.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

int KRunState(std::span<char* const> words) {
  const KCliArguments arguments(words, "state", {"set", "preset"}, {});
  if (arguments.Positional().size() != 1) KCliFail("'state' takes one plug-in name.");
  KCliPlugin session(arguments.Positional()[0]);
  session.ApplySettings(arguments);
  std::fputs(session.StateText().c_str(), stdout);
  return 0;
}

int KRunPresets(std::span<char* const> words) {
  const KCliArguments arguments(words, "presets", {"set", "preset"}, {});
  const auto& positional = arguments.Positional();
  if (positional.empty()) KCliFail("'presets' takes a plug-in name.");
  const std::string action = positional.size() > 1 ? positional[1] : "list";
  const bool named = action == "save" || action == "load" || action == "delete";
  if (action != "list" && !named) KCliFail("Unknown presets action '" + action + "': use list, save, load or delete.");
  if (positional.size() != (named ? 3u : (positional.size() > 1 ? 2u : 1u))) KCliFail("'presets " + action + "' takes " + (named ? "one name." : "no name."));
  KCliPlugin session(positional[0]);
  KAudioPlugin& plugin = session.Plugin();
  try {
    if (action == "list") {
      for (const KString& name : plugin.ListPresets()) std::printf("%s\n", name.ToUtf8().c_str());
      // The names alone on standard output, for scripts; which are whose, and where the user's
      // live, for the user.
      std::fprintf(stderr, "The first %d are factory presets, which load like the others but cannot be changed.\n",
                   static_cast<int>(plugin.FactoryPresetCount()));
      std::fprintf(stderr, "Presets of %s are kept in %s\n", plugin.Identifier().ToUtf8().c_str(),
                   KPresetStore(plugin.Module()).PresetsPath().c_str());
    } else if (action == "save") {
      session.ApplySettings(arguments);
      plugin.SavePreset(KString::FromUtf8(positional[2]));
    } else if (action == "load") {
      plugin.LoadPreset(KString::FromUtf8(positional[2]));
      std::fputs(session.StateText().c_str(), stdout);
    } else {
      plugin.DeletePreset(KString::FromUtf8(positional[2]));
    }
  } catch (const KException& failure) {
    KCliFail(failure.Message().ToUtf8());  // the preset store's sentence, as it stands
  }
  return 0;
}
