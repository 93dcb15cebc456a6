#include "kernel/KEntryPoints.h"

#include "core/KAudioPlugin.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"

namespace {
// Both entries start here: the name's module, then the registries.
KModule* PrepareModule(const KString& name) {
  KModule* module = KModuleMap::Instance().Acquire(name);
  KRegistries::Instance().EnsureBuilt();
  return module;
}
}  // namespace

KAudioPlugin* CreateTorvanePlugin(KString name) {
  try {
    KModule* module = PrepareModule(name);
    return KRegistries::Instance().Main().Create(name, module);
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

const KStringList& GetTorvanePluginList() {
  try {
    PrepareModule({});
    return KRegistries::Instance().Main().Keys();
  } catch (...) {
    static const KStringList empty;
    return empty;
  }
}
