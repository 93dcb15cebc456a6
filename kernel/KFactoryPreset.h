#pragma once

#include <span>

// A sound shipped with a plug-in: a name and the parameters that differ from their defaults, by
// key and in working units. Kept as data beside the plug-in's description; every parameter it
// does not name takes its default when it loads (KAudioPlugin::LoadFactoryPreset).
struct KFactoryPreset {
  struct Value {
    const char* key;
    double working;
  };
  const char* name;
  std::span<const Value> values;
  // The plug-in's own settings as XML text, a "PluginSettings" element, for plug-ins whose sound
  // is more than its parameter values (a chain of modules, say); null for the rest.
  const char* settings = nullptr;
};
