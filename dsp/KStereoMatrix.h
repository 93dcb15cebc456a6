#pragma once

#include <cstdint>

#include "dsp/KGlide.h"

// A 2×2 matrix from the input channels to the output channels whose entries glide to each new
// setting, so that no change clicks: left = m[0]·L + m[1]·R, right = m[2]·L + m[3]·R. With one
// channel only m[0] applies. Gains, balance, width, mid/side coding and channel swaps are all
// matrices.
class KStereoMatrix {
public:
  // Heads for `m` over `samples`; `jump` lands at once.
  void Aim(const double (&m)[4], int32_t samples, bool jump) noexcept { glide_.Aim(m, samples, jump); }
  // Each entry takes its step before the sample that uses it; `inputs` and `outputs` may be the
  // same buffers.
  void Process(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;

private:
  KGlide<4> glide_;
};
