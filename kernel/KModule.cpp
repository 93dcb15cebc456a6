#include "kernel/KModule.h"

#include <memory>

KModuleMap::~KModuleMap() {
  for (KModule* module : owned_) delete module;
}

KModuleMap& KModuleMap::Instance() {
  static KModuleMap map;
  return map;
}

KModule* KModuleMap::Acquire(const KString& name) {
  std::lock_guard<std::mutex> lock(mutex_);
  if (KModule* const* found = modules_.Find(name)) return *found;
  auto module = std::make_unique<KModule>(name);
  owned_.Append(module.get());
  // owned_ deletes the module from here on, so a failure to index it cannot leave a dangling
  // pointer in the index.
  KModule* made = module.release();
  modules_.Insert(name, made);
  return made;
}

KModule* KModuleMap::Find(const KString& name) const {
  std::lock_guard<std::mutex> lock(mutex_);
  KModule* const* found = modules_.Find(name);
  return found ? *found : nullptr;
}

int32_t KModuleMap::Count() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return modules_.Count();
}
