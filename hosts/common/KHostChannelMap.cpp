#include "hosts/common/KHostChannelMap.h"

#include <algorithm>

KHostChannelMap::KHostChannelMap() noexcept = default;
KHostChannelMap::~KHostChannelMap() = default;

void KHostChannelMap::Prepare(int32_t maxBlock) {
  if (maxBlock <= capacity_) return;
  const auto length = static_cast<size_t>(maxBlock);
  silence_.reset(new float[length]());
  discard_.reset(new float[length]);
  capacity_ = maxBlock;
}

void KHostChannelMap::MapInputs(const float* const* host, int32_t hostCount, int32_t channels, int32_t samples,
                                const float** to) const noexcept {
  const float* silence = samples <= capacity_ ? silence_.get() : nullptr;
  for (int32_t c = 0; c < channels; ++c) {
    const float* buffer = host && hostCount > 0 ? host[std::min(c, hostCount - 1)] : nullptr;
    to[c] = buffer ? buffer : silence;
  }
}

bool KHostChannelMap::MapOutputs(float* const* host, int32_t hostCount, int32_t channels, int32_t samples, float** to) const noexcept {
  float* discard = samples <= capacity_ ? discard_.get() : nullptr;
  for (int32_t c = 0; c < channels; ++c) {
    float* buffer = host && c < hostCount ? host[c] : nullptr;
    to[c] = buffer ? buffer : discard;
    if (!to[c]) return false;
  }
  return true;
}
