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
  owned_.Reserve(owned_.Count() + 1);  // no failure after the index holds the pointer
  modules_.Insert(name, module.get());
  owned_.Append(module.get());
  return module.release();
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
