#include "kernel/KTrace.h"

#include <atomic>

#include "kernel/platform/KPlatform.h"

namespace {
std::atomic<KTraceHook> gTraceHook{nullptr};

#if TORVANE_DIAGNOSTICS
const bool gTraceOpened = KPlatform::OpenTraceDestination();
#endif
}  // namespace

void KTrace(const KString& line) noexcept {
  if (KTraceHook hook = gTraceHook.load(std::memory_order_acquire)) {
    hook(line);
    return;
  }
#if TORVANE_DIAGNOSTICS
  if (!gTraceOpened) return;
  char buffer[1024];
  const size_t n = line.VisitUnits(
      [&](const auto* units, int32_t length) { return KUtf8::EncodeInto(units, length, buffer, sizeof(buffer)); });
  KPlatform::WriteTraceLine(buffer, n);
#endif
}

KTraceHook KSetTraceHook(KTraceHook hook) noexcept { return gTraceHook.exchange(hook, std::memory_order_acq_rel); }
