#pragma once

#include <string>

class KAudioPlugin;

namespace KLV2 {
// The bundle's manifest: the plug-in's URI, its loader binary and the file that describes it.
std::string KManifestTurtle(const std::string& uri, const std::string& name);
// The plug-in's description: name, features, extension data and every port of KPortLayout
// with its range, unit and properties.
std::string KPluginTurtle(const KAudioPlugin& plugin, const std::string& uri, const std::string& name);
}  // namespace KLV2
