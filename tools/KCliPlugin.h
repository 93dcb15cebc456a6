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
  // Creates the plug-in; when the kernel cannot, it has already told the user why, and this
  // throws an empty KException (main adds nothing to the kernel's own message).
  explicit KCliPlugin(const std::string& name);
  ~KCliPlugin();

  KAudioPlugin& Plugin() noexcept { return *plugin_; }
  KAudioPluginInterface& Host() noexcept { return *host_; }

  // "KEY=VALUE": VALUE in the parameter's working units (a plain number) or as its display
  // text ("Soft", "off", "5 ms"). Takes effect at once, without a glide.
  void Set(const std::string& assignment);
  // A state document (as `torvane state` prints it) from a file; the reader's message when
  // the text is malformed, and the plug-in unchanged then.
  void LoadPreset(const std::string& path);
  // The --set and --preset options, in the order given, so that a later one overrides.
  void ApplySettings(const class KCliArguments& arguments);
  // The state document as `torvane state` prints it.
  std::string StateText();

  // The parameter with this key, or an error naming the close matches.
  KAudioPluginBase::Parameter& Find(const std::string& key);
  // A working value given on the command line, checked against the parameter's range.
  static double WorkingValue(const KAudioPluginBase::Parameter& parameter, const std::string& text);

private:
  std::unique_ptr<KAudioPlugin> plugin_;
  std::unique_ptr<KCliHost> host_;
};
