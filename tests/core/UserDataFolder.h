#pragma once

#include <cstdlib>
#include <optional>
#include <string>

#include "kernel/platform/KPlatform.h"

// The variable that names where the user's data lives, and its setting.
namespace KUserDataVariable {
#ifdef _WIN32
inline constexpr const char* kName = "APPDATA";
inline void Set(const char* value) { _putenv_s(kName, value); }
inline void Unset() { _putenv_s(kName, ""); }  // an empty value removes it
#else
inline constexpr const char* kName = "XDG_DATA_HOME";
inline void Set(const char* value) { setenv(kName, value, 1); }
inline void Unset() { unsetenv(kName); }
#endif
}  // namespace KUserDataVariable

// While it lives, the user's data (presets among it) goes to a fresh folder of its own, which it
// removes, with the setting it replaced restored, when it goes: test programs that run side by
// side never share presets.
class KUserDataFolder {
public:
  KUserDataFolder() {
    if (const char* old = std::getenv(KUserDataVariable::kName)) saved_ = old;
    KUserDataVariable::Set(folder_.c_str());
  }
  KUserDataFolder(const KUserDataFolder&) = delete;
  KUserDataFolder& operator=(const KUserDataFolder&) = delete;
  ~KUserDataFolder() {
    saved_ ? KUserDataVariable::Set(saved_->c_str()) : KUserDataVariable::Unset();
    KPlatform::RemoveFolderTree(folder_);
  }

private:
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  std::optional<std::string> saved_;
};
