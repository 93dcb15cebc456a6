#pragma once

// The running state of one filter section for code that steps it a sample at a time: inside a
// feedback loop, or with coefficients that move every sample. Coefficients come in the design
// record's order, b0, −a1, b1, −a2, b2 (`&section.b0` of a KFilterSection, or a
// KSectionRunner::Row); transposed direct form II, in double precision.
struct KSectionState {
  double s1 = 0.0;
  double s2 = 0.0;

  double Step(const double* c, double x) noexcept {
    const double y = c[0] * x + s1;
    s1 = c[2] * x + c[1] * y + s2;
    s2 = c[4] * x + c[3] * y;
    return y;
  }
  void Clear() noexcept { s1 = s2 = 0.0; }
};

// Values below −300 dB become exact zeros. Recirculating paths (feedback delays, reverberators)
// pass their signal through this so that silence comes out as zeros long before a decay would
// reach the smallest double.
inline double KFlushTiny(double v) noexcept { return v > -1e-15 && v < 1e-15 ? 0.0 : v; }
