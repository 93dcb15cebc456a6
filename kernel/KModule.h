#pragma once

#include <mutex>

#include "kernel/KHashIndex.h"

// Data shared by every instance created under one name (its data folders, for example).
class KModule {
public:
  explicit KModule(const KString& name) : name_(name) {}
  const KString& Name() const noexcept { return name_; }

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
