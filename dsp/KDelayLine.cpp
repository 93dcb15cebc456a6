#include "dsp/KDelayLine.h"

#include <algorithm>

void KDelayLine::Prepare(int32_t longest) {
  longest = std::max(longest, 2);
  // Three more places than the longest delay: the interpolator's farthest point and the one
  // about to be written must not meet.
  int32_t size = 4;
  while (size < longest + 3) size *= 2;
  buffer_.assign(static_cast<size_t>(size), 0.0);
  mask_ = size - 1;
  write_ = 0;
  longest_ = longest;
}

void KDelayLine::Clear() noexcept { std::fill(buffer_.begin(), buffer_.end(), 0.0); }

void KDelayLine::Run(const double* in, const double* delays, double* out, int32_t n) noexcept {
  for (int32_t i = 0; i < n; ++i) {
    const double x = in[i];
    out[i] = Read(delays[i]);
    Write(x);
  }
}
