#pragma once

#include <memory>
#include <string>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "tools/KCliHost.h"

// One plug-in created through the kernel's exported entry point, with the command line as its
// host, and the settings a user gives on the command line.
class KCliPlugin {
public:
  // `name`: a registry key or a module name (as `torvane list --modules` prints it), in any
  // letter case. An unknown name is an error with the close matches.
  explicit KCliPlugin(const std::string& name);
  ~KCliPlugin();

  KAudioPlugin& Plugin() noexcept { return *plugin_; }
  KAudioPluginInterface& Host() noexcept { return *host_; }

  // "KEY=VALUE": VALUE in the parameter's working units (a plain number) or as its display
  // text ("Soft", "off", "5 ms", "0.5 s"). Takes effect at once, without a glide.
  void Set(const std::string& assignment);
  // A state document (as `torvane state` prints it) from a file, or else the saved preset of
  // that name. A document of another plug-in, or one that cannot be read, is an error, and
  // the plug-in unchanged then.
  void LoadPreset(const std::string& fileOrName);
  // The --set and --preset options, in the order given, so that a later one overrides.
  void ApplySettings(const class KCliArguments& arguments);
  // The state document as `torvane state` prints it.
  std::string StateText();

  // The parameter with this key in any letter case, or an error naming the close matches.
  KAudioPluginBase::Parameter& Find(const std::string& key);
  // A working value given on the command line: a bare number in working units, or display
  // text with or without a unit. Out of range is an error either way, never clamped.
  static double WorkingValue(const KAudioPluginBase::Parameter& parameter, const std::string& text);

  // The registry key of a plug-in named by its key or module name in any letter case.
  static std::string ResolveName(const std::string& name);

private:
  std::unique_ptr<KAudioPlugin> plugin_;
  std::unique_ptr<KCliHost> host_;
};
