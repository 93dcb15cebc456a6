#include "plugins/KLFOPlugin.h"

#include <algorithm>
#include <utility>

void KLFOPlugin::ProcessUpdate() {
  lfos_.Update(*this, controls_);
  const bool restart = std::exchange(restart_, false);
  if (restart) lfos_.Reset();
  UpdateEffect(restart);
}

void KLFOPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  lfos_.FollowHost(*this);
  ProcessEffect(inputs, outputs, std::min(ChannelsPerBus(), KPluginLFOs::kChannels), sampleCount);
}

void KLFOPlugin::ResetState() {
  restart_ = true;
  ResetEffect();
}
