#include "hosts/common/KHostRamp.h"

#include <span>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

void KHostRamp::Add(int32_t offset, double normalized) noexcept {
  if (count_ == 0 && offset > 0) points_[count_++] = {0, plugin_.GetParameter(parameter_).Normalized()};
  if (count_ > 0 && offset < points_[count_ - 1].time) offset = points_[count_ - 1].time;
  points_[count_ < ParameterRamp::kMaxPoints ? count_++ : count_ - 1] = {offset, normalized};
}

void KHostRamp::Commit() noexcept {
  if (count_ > 0) plugin_.AddRamp(parameter_, std::span(points_, static_cast<size_t>(count_)), true);
  count_ = 0;
}
