#include "kernel/KUserMessage.h"

#include <atomic>
#include <vector>

#include "kernel/platform/KPlatform.h"

namespace {
std::atomic<KUserMessageHook> gMessageHook{nullptr};
}

void KShowUserMessage(const KString& text) noexcept {
  if (KUserMessageHook hook = gMessageHook.load(std::memory_order_acquire)) {
    hook(text);
    return;
  }
  try {
    std::vector<char16_t> units(static_cast<size_t>(text.Length()) + 1);
    text.CopyUtf16(units.data());
    KPlatform::ShowMessageBox(units.data(), static_cast<size_t>(text.Length()));
  } catch (...) {
    // Out of memory while reporting a failure: the message is lost, the caller goes on.
  }
}

KUserMessageHook KSetUserMessageHook(KUserMessageHook hook) noexcept {
  return gMessageHook.exchange(hook, std::memory_order_acq_rel);
}
