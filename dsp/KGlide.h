#pragma once

#include <algorithm>
#include <cstdint>

// N values that travel together in straight lines to their targets over a set number of
// samples, so that no change of a setting clicks: gains, matrix entries, filter coefficients.
// A step is taken before the sample that uses it, so the glide's last sample reaches the target
// (within the steps' rounding, which the landing then drops). Per-sample loops read `value` and `step`, move their own copies and hand the
// count back through Passed.
template <int N>
struct KGlide {
  double value[N] = {};
  double target[N] = {};
  double step[N] = {};
  int32_t left = 0;  // samples until every value reaches its target

  // Heads for `to` over `samples` (at least 1) from wherever the values are; `jump` lands at
  // once. Aiming again at the targets already held lets a glide go on as it was.
  void Aim(const double* to, int32_t samples, bool jump) noexcept {
    if (jump) {
      std::copy_n(to, N, target);
      Land();
      return;
    }
    if (std::equal(to, to + N, target)) return;
    std::copy_n(to, N, target);
    left = std::max(1, samples);
    for (int k = 0; k < N; ++k) step[k] = (target[k] - value[k]) / left;
  }

  // Counts off samples that a loop has run through; at the glide's end the values land exactly,
  // free of the steps' rounding.
  void Passed(int32_t samples) noexcept {
    left = samples < left ? left - samples : 0;
    if (left == 0) Land();
  }

  // Writes lane `k`'s values of the next `count` samples and moves it along; call Passed(count)
  // once every lane has been filled.
  void Fill(int k, double* values, int32_t count) noexcept {
    const int32_t gliding = std::min(left, count);
    double v = value[k];
    for (int32_t i = 0; i < gliding; ++i) values[i] = v += step[k];
    value[k] = v;
    std::fill(values + gliding, values + count, gliding == left ? target[k] : v);
  }

  void Land() noexcept {
    std::copy_n(target, N, value);
    std::fill_n(step, N, 0.0);
    left = 0;
  }
};
