#pragma once

#include <cstdlib>
#include <optional>
#include <string>

#include "kernel/platform/KPlatform.h"

#ifdef _WIN32
// Windows finds the user's data through the shell, which no variable redirects; the Windows tests
// run in a Wine prefix of their own, whose user data the test script clears before every run.
class KUserDataFolder {
public:
  KUserDataFolder() {}  // user-provided: a guard that is named but never read is no unused variable
};
#else
// While it lives, the user's data (presets among it) goes to a fresh folder of its own
// (XDG_DATA_HOME), which it removes, with the setting it replaced restored, when it goes.
class KUserDataFolder {
public:
  KUserDataFolder() {
    if (const char* old = std::getenv("XDG_DATA_HOME")) saved_ = old;
    setenv("XDG_DATA_HOME", folder_.c_str(), 1);
  }
  KUserDataFolder(const KUserDataFolder&) = delete;
  KUserDataFolder& operator=(const KUserDataFolder&) = delete;
  ~KUserDataFolder() {
    saved_ ? setenv("XDG_DATA_HOME", saved_->c_str(), 1) : unsetenv("XDG_DATA_HOME");
    KPlatform::RemoveFolderTree(folder_);
  }

private:
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  std::optional<std::string> saved_;
};
#endif
