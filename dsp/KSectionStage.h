#pragma once

#include "dsp/KFilterSection.h"

// One sample through a filter section in transposed direct form II, for owners that run a
// section or two by hand inside a loop of their own; `z` holds the section's two delays.
inline double KSectionStage(const KFilterSection& s, double x, double* z) noexcept {
  const double y = s.b0 * x + z[0];
  z[0] = s.b1 * x + s.minusA1 * y + z[1];
  z[1] = s.b2 * x + s.minusA2 * y;
  return y;
}
