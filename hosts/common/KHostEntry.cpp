#include "hosts/common/KHostEntry.h"

#include "core/KAudioPlugin.h"
#include "kernel/KFormat.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"

std::unique_ptr<KAudioPlugin> KHostCreatePlugin(const char* pluginName, const char* subName) {
  KString name = KString::Widen(pluginName ? pluginName : "");
  name.Append(KString::Widen(subName ? subName : ""));
  // Through the registry itself: a name it does not know is a KException.
  KModule* module = KModuleMap::Instance().Acquire(name);
  KRegistries& registries = KRegistries::Instance();
  registries.EnsureBuilt();
  return std::unique_ptr<KAudioPlugin>(registries.Main().Create(name, module));
}

void KShowEntryFailure(const char* caption, const char* entry) noexcept {
  try {
    KShowUserMessage(KFormatText("{0}\n\nSYSTEM EXCEPTION! {1}", KString::Widen(caption), KString::Widen(entry)));
  } catch (...) {
    // No memory left even for the message: the null answer has to say it.
  }
}
