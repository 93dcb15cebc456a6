#include "core/KChannelMode.h"

#include <utility>

namespace {
void ToMidSide(const float* left, const float* right, float* mid, float* side, int32_t n) noexcept {
  for (int32_t i = 0; i < n; ++i) {
    const double l = left[i], r = right[i];
    mid[i] = static_cast<float>((l + r) * 0.5);
    side[i] = static_cast<float>((l - r) * 0.5);
  }
}
}  // namespace

void KChannelMode::RouteInputs(int32_t mode, const float*& first, const float*& second, float* scratch0,
                               float* scratch1, int32_t n) noexcept {
  switch (mode) {
    case kRight: std::swap(first, second); return;
    case kMono:
    case kMonoStereo:
    case kMonoZeroStereo:
      ToMidSide(first, second, scratch0, scratch1, n);
      first = scratch0, second = scratch1;
      return;
    case kStereo:
    case kStereoZeroMono:
      ToMidSide(first, second, scratch0, scratch1, n);
      first = scratch1, second = scratch0;
      return;
    case kLeftRightNegated:
      for (int32_t i = 0; i < n; ++i) scratch1[i] = -second[i];
      second = scratch1;
      return;
    case kRightZeroLeft: std::swap(first, second); [[fallthrough]];
    case kLeftZeroRight:
      for (int32_t i = 0; i < n; ++i) scratch1[i] = 0.0f;
      second = scratch1;
      return;
    default: return;
  }
}

void KChannelMode::RestoreOutputs(int32_t mode, float* left, float* right, int32_t n) noexcept {
  switch (mode) {
    case kMono:
    case kMonoStereo:
    case kMonoZeroStereo:
    case kStereo:
    case kStereoZeroMono:
      // With the outputs exchanged for kStereo, mid still sits in the left slot here.
      for (int32_t i = 0; i < n; ++i) {
        const double mid = left[i], side = right[i];
        left[i] = static_cast<float>(mid + side);
        right[i] = static_cast<float>(mid - side);
      }
      return;
    case kLeftRightNegated:
      for (int32_t i = 0; i < n; ++i) right[i] = -right[i];
      return;
    default: return;
  }
}
