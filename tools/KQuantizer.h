#pragma once

#include <cstdint>

// Float samples to integers of 16, 24 or 32 bits, full scale 1.0, as libsndfile takes them
// (left-aligned in 32 bits). Values are rounded to the nearest step; when reducing to 16 or 24
// bits, triangular (TPDF) dither of one step either side is added first, so that the error is
// white noise independent of the signal and its mean is zero: a constant of half a step comes
// out as half a step on average, and quiet signals fade into the noise instead of breaking
// into square waves. Samples beyond full scale are held at it and counted.
class KQuantizer {
public:
  KQuantizer(int bits, bool dither) noexcept;

  void Convert(const float* in, int32_t* out, int64_t count) noexcept;
  int64_t ClippedSamples() const noexcept { return clipped_; }

private:
  // Uniform in [0, 1): the upper bits of a 64-bit linear congruential generator, fixed seed so
  // that a render is the same every time.
  double Uniform() noexcept {
    state_ = state_ * 6364136223846793005ull + 1442695040888963407ull;
    return static_cast<double>(state_ >> 11) * 0x1.0p-53;
  }

  double scale_;      // steps per unit of full scale
  double ditherDepth_;  // 1 step with dither, 0 without
  int shift_;         // from the integer's own width to 32 bits
  uint64_t state_ = 0x9E3779B97F4A7C15ull;
  int64_t clipped_ = 0;
};
