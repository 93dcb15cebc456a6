#include "dsp/KFilterSection.h"

#include <algorithm>
#include <cmath>
#include <complex>

#include "kernel/KException.h"

namespace {

// First-order sections, already normalised, in the record's order.
struct Normalised {
  double b0, minusA1, b1, minusA2, b2;
};

// Second-order sections before the division by a0.
struct Raw {
  double b0, b1, b2, a0, a1, a2;
};

// What the second-order formulas are computed from.
struct Prototype {
  double c;      // cos w
  double alpha;  // sin w / (2Q)
  double a;      // 10^(gain/40)
  double w;
  double q;
};

// ---- First order, from w alone.

// Gain at DC and the zero of the fixed-zero pair; their product (1 + zero) is 1.
constexpr double kFixedZeroGain = 0.8848307453347383;
constexpr double kFixedZero = 0.13015964383300485;
constexpr double kFixedZeroComplement = 0.11516925466526173;  // 1 − kFixedZeroGain

Normalised OnePoleLowPass(double w) {
  const double p = std::exp(-w);
  return {1.0 - p, p, 0.0, 0.0, 0.0};
}

Normalised OnePoleHighPass(double w) {
  const double p = std::exp(-w);
  const double b0 = 0.5 * p + 0.5;
  return {b0, p, -b0, 0.0, 0.0};
}

Normalised FirstOrderAllPass(double w) {
  const double p = std::exp(-w);
  return {p, p, -1.0, 0.0, 0.0};
}

Normalised FixedZeroLowPass(double w) {
  const double p = std::exp(-w);
  return {kFixedZeroGain * (1.0 - p), p, kFixedZero * kFixedZeroGain * (1.0 - p), 0.0, 0.0};
}

Normalised FixedZeroHighPass(double w) {
  const double p = std::exp(-w);
  const double lowPassB1 = kFixedZero * kFixedZeroGain * (1.0 - p);
  return {kFixedZeroGain * p + kFixedZeroComplement, p, -(p + lowPassB1), 0.0, 0.0};
}

// The bilinear pair, with tan(w/2) written as sin w/(1 + cos w).
Normalised BilinearLowPass(double w) {
  const double s = std::sin(w), c = std::cos(w);
  const double k = 1.0 / (1.0 + s + c);
  return {k * s, k * (1.0 - s + c), k * s, 0.0, 0.0};
}

Normalised BilinearHighPass(double w) {
  const double s = std::sin(w), c = std::cos(w);
  const double k = 1.0 / (1.0 + s + c);
  const double pole = k * (1.0 - s + c);
  return {1.0 - k * s, pole, -(pole + k * s), 0.0, 0.0};
}

// ---- Second order: the bilinear cookbook sections and the matched peak.

Raw Peak(const Prototype& p) {
  return {1.0 + p.alpha * p.a, -2.0 * p.c, 1.0 - p.alpha * p.a, 1.0 + p.alpha / p.a, -2.0 * p.c, 1.0 - p.alpha / p.a};
}

// A peak whose gain at the Nyquist frequency equals the analog bell's, so that it does not
// cramp near the top of the band. The small e keeps every ratio finite when gains coincide.
Raw MatchedPeak(const Prototype& p) {
  if (std::abs(p.a - 1.0) <= 1e-5) return Peak(p);
  constexpr double kPiSquared = 9.869604401089358;
  constexpr double e = 1e-8;
  const double g = p.a * p.a;
  const double w0 = p.w, q = p.q;
  const double w02 = w0 * w0, q2 = q * q;
  const double offset = w02 - kPiSquared;
  const double d = offset * offset;
  const double gn2 = (d + w02 * kPiSquared * g / q2) / (d + w02 * kPiSquared / (q2 * g));
  const double gn = std::sqrt(gn2);
  const double pp = gn * g;  // P
  const double s = g * g;    // S
  const double d1 = std::abs(s - 1.0) + e;
  const double d2 = std::abs(pp - 1.0) + e;
  const double d3 = std::abs(s - gn2) + e;
  const double d4 = std::abs(pp - gn2) + e;
  const double halfTan = std::tan(w0 / 2.0);
  const double w2 = halfTan * halfTan * std::sqrt(d3 / d1);
  const double r = std::sqrt((pp - s) / (1.0 - pp));
  const double t = std::tan(w0 * 0.5 * r / (p.a * q));
  const double v = std::sqrt(d2 / d4) * w2 * t + t;
  const double bigE = 2.0 * w2 * (std::abs(s - gn) + e - std::sqrt(d3 * d1));
  const double f = 1.0 / (std::abs(s - pp) + e);
  const double x = d4 * (v * v) + (std::sqrt(d2 * d4) - (std::abs(pp - gn) + e)) * (2.0 * w2);
  const double b = std::sqrt((s * x + pp * bigE) * f);
  const double aa = std::sqrt((x + bigE) * f);
  return {gn + w2 + b, -2.0 * (gn - w2), gn + w2 - b, 1.0 + w2 + aa, 2.0 * w2 - 2.0, 1.0 + w2 - aa};
}

Raw LowShelf(const Prototype& p) {
  const double a = p.a, c = p.c, root = 2.0 * std::sqrt(a) * p.alpha;
  return {a * ((a + 1.0) - (a - 1.0) * c + root),
          2.0 * a * ((a - 1.0) - (a + 1.0) * c),
          a * ((a + 1.0) - (a - 1.0) * c - root),
          (a + 1.0) + (a - 1.0) * c + root,
          -2.0 * ((a - 1.0) + (a + 1.0) * c),
          (a + 1.0) + (a - 1.0) * c - root};
}

Raw HighShelf(const Prototype& p) {
  const double a = p.a, c = p.c, root = 2.0 * std::sqrt(a) * p.alpha;
  return {a * ((a + 1.0) + (a - 1.0) * c + root),
          -2.0 * a * ((a - 1.0) + (a + 1.0) * c),
          a * ((a + 1.0) + (a - 1.0) * c - root),
          (a + 1.0) - (a - 1.0) * c + root,
          2.0 * ((a - 1.0) - (a + 1.0) * c),
          (a + 1.0) - (a - 1.0) * c - root};
}

// The remaining types share the denominator 1 + α, −2c, 1 − α.
Raw OverPoles(const Prototype& p, double b0, double b1, double b2) {
  return {b0, b1, b2, 1.0 + p.alpha, -2.0 * p.c, 1.0 - p.alpha};
}

Raw LowPass(const Prototype& p) { return OverPoles(p, (1.0 - p.c) / 2.0, 1.0 - p.c, (1.0 - p.c) / 2.0); }
Raw HighPass(const Prototype& p) { return OverPoles(p, (1.0 + p.c) / 2.0, -(1.0 + p.c), (1.0 + p.c) / 2.0); }
Raw BandPass(const Prototype& p) { return OverPoles(p, p.alpha, 0.0, -p.alpha); }
Raw Notch(const Prototype& p) { return OverPoles(p, 1.0, -2.0 * p.c, 1.0); }
Raw AllPass(const Prototype& p) { return OverPoles(p, 1.0 - p.alpha, -2.0 * p.c, 1.0 + p.alpha); }

// Each type is computed by exactly one of a first-order or a second-order formula.
struct Formula {
  Normalised (*firstOrder)(double w);
  Raw (*secondOrder)(const Prototype& p);
};
constexpr Formula kFormulas[KFilterSection::kTypeCount] = {
    {nullptr, Peak},
    {nullptr, MatchedPeak},
    {nullptr, LowShelf},
    {nullptr, HighShelf},
    {nullptr, LowPass},
    {nullptr, HighPass},
    {OnePoleLowPass, nullptr},
    {OnePoleHighPass, nullptr},
    {nullptr, BandPass},
    {nullptr, Notch},
    {nullptr, AllPass},
    {FirstOrderAllPass, nullptr},
    {FixedZeroLowPass, nullptr},
    {FixedZeroHighPass, nullptr},
    {BilinearLowPass, nullptr},
    {BilinearHighPass, nullptr},
};

}  // namespace

void KFilterSection::Design(int32_t code, double gainDb, double frequencyHz, double sampleRateHz, double q) {
  type = code;
  frequency = frequencyHz;
  sampleRate = sampleRateHz;
  quality = q;
  w = 6.283185307179586 * frequencyHz / sampleRateHz;
  changed = 1;
  const Formula formula = code >= 0 && code < kTypeCount ? kFormulas[code] : Formula{nullptr, nullptr};
  if (formula.firstOrder != nullptr) {
    const Normalised n = formula.firstOrder(w);
    b0 = n.b0;
    minusA1 = n.minusA1;
    b1 = n.b1;
    minusA2 = n.minusA2;
    b2 = n.b2;
    return;
  }

  cosW = std::cos(w);
  alpha = std::sin(w) / (q + q);
  gain = gainDb;
  const double a = std::exp(0.05756462732485114 * gainDb);
  if (formula.secondOrder == nullptr) throw KException("Invalid filter type.");
  const Raw r = formula.secondOrder({cosW, alpha, a, w, q});
  b0 = r.b0 / r.a0;
  minusA1 = -r.a1 / r.a0;
  b1 = r.b1 / r.a0;
  minusA2 = -r.a2 / r.a0;
  b2 = r.b2 / r.a0;
}

double KFilterSection::Decibels(double hz) const noexcept {
  const std::complex<double> z = std::polar(1.0, -6.283185307179586 * hz / sampleRate);  // z^-1
  const std::complex<double> numerator = b0 + b1 * z + b2 * z * z;
  const std::complex<double> denominator = 1.0 - minusA1 * z - minusA2 * z * z;
  return 20.0 * std::log10(std::max(std::abs(numerator / denominator), 1e-9));
}
