#pragma once

#include <string>

class KAudioPlugin;

namespace KLV2 {
// The bundle's manifest: the plug-in's URI, its loader binary and the file that describes it,
// and each of `plugin`'s factory presets with the file that holds it (kPresetsFile).
std::string KManifestTurtle(const KAudioPlugin& plugin, const std::string& uri, const std::string& name);
// The plug-in's description: name, features, extension data and every port of KPortLayout
// with its range, unit and properties.
std::string KPluginTurtle(const KAudioPlugin& plugin, const std::string& uri, const std::string& name);

// The factory presets as pset:Preset resources, in the plug-in's order: each with its name, the
// value of every control port once it has loaded, and, for a preset that carries the plug-in's
// own settings, the state the host restores. Loads each preset into `plugin` to read them.
constexpr const char* kPresetsFile = "presets.ttl";
std::string KPresetsTurtle(KAudioPlugin& plugin, const std::string& uri);
// A preset's URI: the plug-in's, a '#' and the preset's name in lower case with '-' between words.
std::string KPresetURI(const std::string& uri, const char* presetName);
}  // namespace KLV2
