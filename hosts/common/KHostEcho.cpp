#include "hosts/common/KHostEcho.h"

#include "core/KAudioPluginBase.h"
#include "core/KParameter.h"

void KTakeHostValue(KAudioPluginBase& plugin, int32_t parameter, double normalized) noexcept {
  if (parameter < 0 || parameter >= plugin.ParameterCount()) return;
  if (plugin.AutomationSending().load(std::memory_order_acquire) > 0) return;
  plugin.GetParameter(parameter).SetNormalized(normalized);
}
