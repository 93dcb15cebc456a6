#pragma once

#include <mutex>
#include <string>

#include "kernel/KHashIndex.h"

// Data shared by every instance created under one name (its data folders, for example).
class KModule {
public:
  explicit KModule(const KString& name) : name_(name) {}
  const KString& Name() const noexcept { return name_; }

  // The user's data folder of this plug-in, "<user data home>/Torvane/<name>/" (see
  // KPlatform::UserDataHome), created when missing. Characters that no file system of ours
  // allows in a folder name (control characters and <>:"/\|?*) become "_", and a name of dots
  // alone (or none) gets a "_" in front. Not cached, so the folder is recreated if removed
  // while the plug-in runs. Throws KException when the folder cannot be found or created.
  std::string GetDataPath_User() const;
  // The folder shared by every plug-in of the family, "<user data home>/Torvane/", created
  // when missing.
  static std::string GetDataPath_Shared();

private:
  KString name_;
};

// The process-wide map from name to module, under its own mutex. Modules live until unload.
class KModuleMap {
public:
  KModuleMap() = default;
  KModuleMap(const KModuleMap&) = delete;
  KModuleMap& operator=(const KModuleMap&) = delete;
  ~KModuleMap();

  static KModuleMap& Instance();

  // The module of `name`, made on first use.
  KModule* Acquire(const KString& name);
  // The module of `name`, or null when none was made.
  KModule* Find(const KString& name) const;
  int32_t Count() const;

private:
  mutable std::mutex mutex_;
  KStringHashIndex<KModule*> modules_{16};
  KArray<KModule*> owned_;
};
