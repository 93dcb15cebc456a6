#pragma once

#include <cmath>

// Gains are held in decibels and computed with as linear factors; every conversion in the
// product goes through these two, so that a setting means the same factor everywhere.
inline double KDecibelsToLinear(double decibels) noexcept { return std::exp(0.11512925464970228 * decibels); }
inline double KLinearToDecibels(double factor) noexcept { return 8.685889638065037 * std::log(factor); }

// The one-pole smoothing coefficient of a time constant at a sample rate: exp(−1/(rate · seconds)),
// and 0 (instant) when rate · seconds is too small to divide by.
inline double KSmoothingCoefficient(double rate, double seconds) noexcept {
  const double span = rate * seconds;
  return std::abs(span) < 1e-10 ? 0.0 : std::exp(-1.0 / span);
}
