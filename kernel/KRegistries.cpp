#include "kernel/KRegistries.h"

#include <cstring>

KRegistries& KRegistries::Instance() {
  static KRegistries registries(KProductCatalogue());
  return registries;
}

void KRegistries::EnsureBuilt() {
  if (built_.load(std::memory_order_acquire)) return;
  std::lock_guard<std::mutex> lock(mutex_);
  if (built_.load(std::memory_order_relaxed)) return;
  Build();
  built_.store(true, std::memory_order_release);
}

void KRegistries::Build() {
  for (const KPluginDescription& entry : catalogue_.plugins) main_.Register(KString::Static(entry.key), entry.factory, {}, entry.presets);
  for (const char* category : kCategories) {
    for (const KPluginDescription& entry : catalogue_.plugins) {
      if (entry.moduleKey && std::strcmp(entry.category, category) == 0)
        modules_.Register(KString::Static(entry.moduleKey), entry.factory, KString::Static(category), entry.presets);
    }
  }
  fileTypes_.Append(KFileType{"Effect pipeline file", "tvpipe"});
  for (const char* name : catalogue_.pipelineHosts) pipelineHosts_.Append(KString::Static(name));
}
