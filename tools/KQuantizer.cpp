#include "tools/KQuantizer.h"

#include <cmath>

KQuantizer::KQuantizer(int bits, bool dither) noexcept
    : scale_(std::ldexp(1.0, bits - 1)), ditherDepth_(dither && bits < 32 ? 1.0 : 0.0), shift_(32 - bits) {}

void KQuantizer::Convert(const float* in, int32_t* out, int64_t count) noexcept {
  const double top = scale_ - 1.0, bottom = -scale_;
  for (int64_t i = 0; i < count; ++i) {
    const double noise = ditherDepth_ * (Uniform() - Uniform());
    double step = std::nearbyint(static_cast<double>(in[i]) * scale_ + noise);
    if (!(step >= bottom && step <= top)) {  // NaN is no sample: silence
      ++clipped_;
      step = step > top ? top : (step < bottom ? bottom : 0.0);
    }
    out[i] = static_cast<int32_t>(static_cast<uint32_t>(static_cast<int64_t>(step)) << shift_);
  }
}
