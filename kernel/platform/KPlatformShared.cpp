#include "kernel/platform/KPlatformShared.h"

#include <atomic>

#include "kernel/platform/KPlatform.h"

namespace {
std::atomic<int> gInjectedWriteFailures{0};
std::atomic<uint32_t> gTemporaryCounter{0};
}  // namespace

void KPlatform::InjectAtomicWriteFailures(int count) noexcept { gInjectedWriteFailures.store(count); }

bool KPlatformShared::ConsumeInjectedFailure() noexcept {
  int left = gInjectedWriteFailures.load();
  while (left > 0 && !gInjectedWriteFailures.compare_exchange_weak(left, left - 1)) {
  }
  return left > 0;
}

uint32_t KPlatformShared::NextTemporaryNumber() noexcept { return gTemporaryCounter.fetch_add(1); }

std::string KPlatformShared::TemporarySiblingName(const std::string& path, unsigned long process) {
  const size_t start = KPlatform::FileNameStart(path);
  return path.substr(0, start) + "." + path.substr(start) + "." + std::to_string(process) + "-" +
         std::to_string(NextTemporaryNumber()) + ".tmp";
}
