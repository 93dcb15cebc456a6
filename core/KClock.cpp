#include "core/KClock.h"

#include "kernel/platform/KPlatform.h"

namespace {
class KSystemClock final : public KClock {
public:
  uint64_t Milliseconds() const noexcept override { return KPlatform::MillisecondClock(); }
};
}  // namespace

const KClock& KClock::System() noexcept {
  static const KSystemClock clock;
  return clock;
}
