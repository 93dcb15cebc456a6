#pragma once

#include <optional>
#include <string>
#include <string_view>

// Whole-file storage of the text files in the user's data folders (presets, configuration).
// Paths are UTF-8 in std::string, as the platform layer takes them; a KString name becomes
// part of a path through ToUtf8. Failures throw KException with a sentence naming the file.
class KFileStore {
public:
  // The whole text; "The file '{0}' does not exist." when it is missing.
  static std::string ReadText(const std::string& path);
  // The whole text, or nothing when the file is missing (a settings file not yet written).
  static std::optional<std::string> ReadTextIfExists(const std::string& path);
  // Replaces the file as a whole: a reader, or a crash, sees the old text or the new one and
  // never part of either; a failed write leaves the old file as it was. The folder must exist.
  // Concurrent writers of one file do not interleave: the last one to finish wins.
  static void WriteTextAtomically(const std::string& path, std::string_view text);
};
