#include "dsp/KStereoMatrix.h"

#include <algorithm>

// Gliding, then the rest of the block at rest.
void KStereoMatrix::Process(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  const int32_t gliding = std::min(glide_.left, n);
  const double* step = glide_.step;
  double a = glide_.value[0], b = glide_.value[1], c = glide_.value[2], d = glide_.value[3];
  if (channels == 1) {
    const float* in = inputs[0];
    float* out = outputs[0];
    for (int32_t i = 0; i < gliding; ++i) out[i] = static_cast<float>(in[i] * (a += step[0]));
    glide_.value[0] = a;
    glide_.Passed(gliding);
    a = glide_.value[0];
    for (int32_t i = gliding; i < n; ++i) out[i] = static_cast<float>(in[i] * a);
    return;
  }
  const float* inL = inputs[0];
  const float* inR = inputs[1];
  float* outL = outputs[0];
  float* outR = outputs[1];
  for (int32_t i = 0; i < gliding; ++i) {
    a += step[0], b += step[1], c += step[2], d += step[3];
    const double l = inL[i], r = inR[i];
    outL[i] = static_cast<float>(a * l + b * r);
    outR[i] = static_cast<float>(c * l + d * r);
  }
  const double reached[4] = {a, b, c, d};
  std::copy_n(reached, 4, glide_.value);
  glide_.Passed(gliding);
  a = glide_.value[0], b = glide_.value[1], c = glide_.value[2], d = glide_.value[3];
  for (int32_t i = gliding; i < n; ++i) {
    const double l = inL[i], r = inR[i];
    outL[i] = static_cast<float>(a * l + b * r);
    outR[i] = static_cast<float>(c * l + d * r);
  }
}
