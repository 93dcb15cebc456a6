#include "kernel/KEntryPoints.h"

#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"

namespace {
// Both entries start here: the name's module, then the registries.
KModule* PrepareModule(KRegistries& registries, const KString& name) {
  KModule* module = KModuleMap::Instance().Acquire(name);
  registries.EnsureBuilt();
  return module;
}
}  // namespace

KAudioPlugin* KCreatePlugin(KRegistries& registries, const KString& name) noexcept {
  try {
    KModule* module = PrepareModule(registries, name);
    return registries.Main().Create(name, module);
  } catch (const KException& failure) {
    try {
      KShowUserMessage(KFormatText("Could not create plugin {0}.\n\nError: {1}", name, failure.Message()));
    } catch (...) {
      // Out of memory while building the message: the null answer still tells the caller.
    }
  } catch (...) {
    // Not a message for the user (a programming or memory failure): answer null.
  }
  return nullptr;
}

KAudioPlugin* CreateTorvanePlugin(KString name) {
  try {
    return KCreatePlugin(KRegistries::Instance(), name);
  } catch (...) {
    return nullptr;  // the product's registries could not even be allocated
  }
}

const KStringList& GetTorvanePluginList() {
  try {
    KRegistries& registries = KRegistries::Instance();
    PrepareModule(registries, {});
    return registries.Main().Keys();
  } catch (...) {
    static const KStringList empty;
    return empty;
  }
}
