#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <cstdint>
#include <numbers>
#include <tuple>

#include "dsp/KFilterSection.h"
#include "kernel/KException.h"

namespace {

using Type = KFilterSection::Type;

constexpr double kRate = 48000.0, kNyquist = kRate / 2, kInvRoot2 = std::numbers::sqrt2 / 2;

KFilterSection Designed(int32_t type, double gainDb, double hz, double q = kInvRoot2, double rate = kRate) {
  KFilterSection s;
  s.Design(type, gainDb, hz, rate, q);
  return s;
}
std::array<double, 5> Coefficients(const KFilterSection& s) { return {s.b0, s.minusA1, s.b1, s.minusA2, s.b2}; }

// The section's transfer function on the unit circle, from its stored coefficients.
std::complex<double> Response(const KFilterSection& s, double hz) {
  const std::complex<double> z1 = std::polar(1.0, -2.0 * std::numbers::pi * hz / s.sampleRate);
  return (s.b0 + z1 * (s.b1 + z1 * s.b2)) / (1.0 - z1 * (s.minusA1 + z1 * s.minusA2));
}
double Magnitude(const KFilterSection& s, double hz) { return std::abs(Response(s, hz)); }
double Db(double linear) { return 20.0 * std::log10(linear); }

// The analog bell that peaks are made from: (s² + s·A/Q + 1)/(s² + s/(A·Q) + 1), A = 10^(dB/40).
double AnalogPeak(double gainDb, double centre, double q, double hz) {
  const double a = std::pow(10.0, gainDb / 40.0);
  const std::complex<double> s(0.0, hz / centre);
  return std::abs((s * s + s * a / q + 1.0) / (s * s + s / (a * q) + 1.0));
}

// Where a magnitude that is monotonic between lo and hi passes `level`, by bisection.
template <class Magnitude>
double Crossing(Magnitude magnitude, double level, double lo, double hi) {
  const bool belowAtLo = magnitude(lo) < level;
  for (int i = 0; i < 200; ++i) {
    const double mid = 0.5 * (lo + hi);
    ((magnitude(mid) < level) == belowAtLo ? lo : hi) = mid;
  }
  return lo;
}

}  // namespace

// At 0 dB every peak and shelf has b = a; the matched peak is the cookbook one while A is
// within 1e-5 of 1 (1e-4 dB puts A − 1 at 5.8e-6, 1e-3 dB at 5.8e-5).
TEST(KFilterSection, UnityGainPeaksAndShelvesAreTransparent) {
  for (int32_t type : {Type::kPeak, Type::kMatchedPeak, Type::kLowShelf, Type::kHighShelf}) {
    for (double hz : {30.0, 1000.0, 15000.0}) {
      const KFilterSection s = Designed(type, 0.0, hz, 2.5);
      EXPECT_EQ(s.b0, 1.0) << type << " at " << hz;
      EXPECT_EQ(s.b1, -s.minusA1) << type << " at " << hz;
      EXPECT_EQ(s.b2, -s.minusA2) << type << " at " << hz;
    }
  }
  const auto matchedIsCookbook = [](double gain) {
    const KFilterSection matched = Designed(Type::kMatchedPeak, gain, 9000, 1.5);
    return Coefficients(matched) == Coefficients(Designed(Type::kPeak, gain, 9000, 1.5));
  };
  EXPECT_TRUE(matchedIsCookbook(0.0) && matchedIsCookbook(1e-4) && matchedIsCookbook(-1e-4));
  EXPECT_FALSE(matchedIsCookbook(1e-3) || matchedIsCookbook(-1e-3));
}

TEST(KFilterSection, FixedZeroPairIsUnityAtDcAndComplementary) {
  for (double hz : {5.0, 440.0, 6000.0, 20000.0}) {
    const KFilterSection low = Designed(Type::kFixedZeroLowPass, 0, hz);
    const KFilterSection high = Designed(Type::kFixedZeroHighPass, 0, hz);
    EXPECT_NEAR((low.b0 + low.b1) / (1.0 - low.minusA1), 1.0, 1e-12) << hz;
    EXPECT_NEAR(-low.b1 / low.b0, -0.13015964383300485, 1e-15) << hz;  // the zero, near Nyquist
    EXPECT_NEAR(Magnitude(high, 0.0), 0.0, 1e-12) << hz;
    for (double at : {1e2, 3e3, kNyquist}) EXPECT_LT(std::abs(Response(low, at) + Response(high, at) - 1.0), 1e-12);
  }
}

TEST(KFilterSection, LowPassAtQuarterRate) {
  const KFilterSection s = Designed(Type::kLowPass, 0.0, kRate / 4, 0.9);
  EXPECT_NEAR(s.cosW, 0.0, 1e-16);  // w is π/2 rounded, so cos w is 6e-17 rather than 0
  EXPECT_DOUBLE_EQ(s.alpha, 1.0 / 1.8);
  EXPECT_DOUBLE_EQ(s.b0, 0.5 / (1.0 + s.alpha));
}

TEST(KFilterSection, InvalidCodeOverwritesEverythingButTheCoefficients) {
  for (int32_t code : {16, 17, -1, 1 << 30}) {
    KFilterSection s = Designed(Type::kLowPass, 0.0, 1000.0);
    s.changed = 0;
    const std::array<double, 5> before = Coefficients(s);
    try {
      s.Design(code, -4.5, 2500.0, 44100.0, 3.0);
      ADD_FAILURE() << "code " << code << " was accepted";
    } catch (const KException& e) {
      EXPECT_EQ(e.Message(), KString("Invalid filter type."));
    }
    EXPECT_EQ(Coefficients(s), before);
    EXPECT_EQ(std::make_tuple(s.type, s.changed, s.gain, s.frequency, s.sampleRate, s.quality),
              std::make_tuple(code, uint8_t{1}, -4.5, 2500.0, 44100.0, 3.0));
    EXPECT_DOUBLE_EQ(s.w, 2.0 * std::numbers::pi * 2500.0 / 44100.0);
    EXPECT_DOUBLE_EQ(s.cosW, std::cos(s.w));
    EXPECT_DOUBLE_EQ(s.alpha, std::sin(s.w) / 6.0);
  }
}

// Gain, cos w and alpha describe the last second-order design only.
TEST(KFilterSection, FirstOrderDesignsKeepTheSecondOrderFields) {
  KFilterSection s = Designed(Type::kHighShelf, 6.0, 3000.0, 0.8);
  const double cosW = s.cosW, alpha = s.alpha;
  for (int32_t type : {6, 7, 11, 12, 13, 14, 15}) {
    s.Design(type, -20.0, 500.0, kRate, 4.0);
    EXPECT_EQ(std::make_tuple(s.type, s.gain, s.cosW, s.alpha, s.b2, s.minusA2),
              std::make_tuple(type, 6.0, cosW, alpha, 0.0, 0.0));
  }
}

// Magnitudes where each type's shape is known exactly: at DC, at its frequency, at Nyquist.
TEST(KFilterSection, ResponsesAtDcCentreAndNyquist) {
  struct Case {
    int32_t type;
    double gainDb, centre, q;
    double at;        // Hz; the centre when negative
    double expected;  // linear magnitude
  };
  const double g12 = std::pow(10.0, 0.6), g6 = std::pow(10.0, 0.3), r2 = kInvRoot2;
  const Case cases[] = {
      {Type::kLowPass, 0, 2000, r2, 0, 1},           {Type::kLowPass, 0, 2000, r2, -1, r2},
      {Type::kLowPass, 0, 2000, 4.0, -1, 4.0},       {Type::kLowPass, 0, 2000, r2, kNyquist, 0},
      {Type::kHighPass, 0, 2000, r2, 0, 0},          {Type::kHighPass, 0, 2000, r2, -1, r2},
      {Type::kHighPass, 0, 2000, r2, kNyquist, 1},   {Type::kBandPass, 0, 5000, 3, -1, 1},
      {Type::kBandPass, 0, 5000, 3, 0, 0},           {Type::kBandPass, 0, 5000, 3, kNyquist, 0},
      {Type::kNotch, 0, 5000, 3, -1, 0},             {Type::kNotch, 0, 5000, 3, 0, 1},
      {Type::kNotch, 0, 5000, 3, kNyquist, 1},       {Type::kPeak, 12, 700, 2, -1, g12},
      {Type::kPeak, -12, 700, 2, -1, 1 / g12},       {Type::kPeak, 12, 700, 2, 0, 1},
      {Type::kMatchedPeak, 12, 700, 2, -1, g12},     {Type::kMatchedPeak, -12, 15000, 0.5, -1, 1 / g12},
      {Type::kMatchedPeak, 12, 700, 2, 0, 1},        {Type::kLowShelf, 6, 300, r2, 0, g6},
      {Type::kLowShelf, 6, 300, r2, -1, std::sqrt(g6)}, {Type::kLowShelf, 6, 300, r2, kNyquist, 1},
      {Type::kHighShelf, -6, 8000, r2, kNyquist, 1 / g6}, {Type::kHighShelf, -6, 8000, r2, 0, 1},
      {Type::kOnePoleLowPass, 0, 1000, 1, 0, 1},     {Type::kOnePoleHighPass, 0, 1000, 1, 0, 0},
      {Type::kOnePoleHighPass, 0, 1000, 1, kNyquist, 1}, {Type::kBilinearLowPass, 0, 1000, 1, 0, 1},
      {Type::kBilinearLowPass, 0, 1000, 1, -1, r2},  {Type::kBilinearLowPass, 0, 1000, 1, kNyquist, 0},
      {Type::kBilinearHighPass, 0, 1000, 1, 0, 0},   {Type::kBilinearHighPass, 0, 1000, 1, -1, r2},
      {Type::kBilinearHighPass, 0, 1000, 1, kNyquist, 1},
  };
  for (const Case& c : cases) {
    const double at = c.at < 0 ? c.centre : c.at;
    EXPECT_NEAR(Magnitude(Designed(c.type, c.gainDb, c.centre, c.q), at), c.expected, 1e-6 * c.expected + 1e-9)
        << "type " << c.type << ", " << c.gainDb << " dB at " << c.centre << " Hz, measured at " << at;
  }
  for (int32_t type : {Type::kAllPass, Type::kFirstOrderAllPass}) {
    const KFilterSection s = Designed(type, 0.0, 1200.0, 3.0);
    for (double hz = 0.0; hz <= kNyquist; hz += 997.0) EXPECT_NEAR(Magnitude(s, hz), 1.0, 1e-12) << type << " " << hz;
  }
  EXPECT_NEAR(std::abs(std::arg(Response(Designed(Type::kAllPass, 0, 1200, 3), 1200))), std::numbers::pi, 1e-9);
}

// Near Nyquist the cookbook bell is squeezed to 0 dB at Nyquist; the matched one follows the
// analog bell from its centre up, and reaches the level √(peak gain · Nyquist gain) at two
// frequencies exactly as far apart as the analog bell's crossings. Far below Nyquist all agree.
TEST(KFilterSection, MatchedPeakFollowsTheAnalogBell) {
  struct Case {
    double gainDb, centre, q, rate, toleranceDb;
  };
  const Case cases[] = {{12, 700, 2, 48000, 0.05},    {12, 5000, 0.7, 48000, 0.5}, {-12, 15000, 0.5, 48000, 0.75},
                        {12, 18000, 1, 44100, 0.75}, {-12, 18000, 2, 44100, 0.75}, {18, 20000, 3, 44100, 0.75}};
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.gainDb << " dB at " << c.centre << " Hz");
    const KFilterSection matched = Designed(Type::kMatchedPeak, c.gainDb, c.centre, c.q, c.rate);
    const KFilterSection cookbook = Designed(Type::kPeak, c.gainDb, c.centre, c.q, c.rate);
    const auto digital = [&](double hz) { return Magnitude(matched, hz); };
    const auto analog = [&](double hz) { return AnalogPeak(c.gainDb, c.centre, c.q, hz); };
    const double nyquist = c.rate / 2;
    double worstCookbook = 0.0;
    for (double hz = c.centre; hz <= nyquist; hz += (nyquist - c.centre) / 8) {
      EXPECT_NEAR(Db(digital(hz)), Db(analog(hz)), c.toleranceDb) << hz;
      worstCookbook = std::max(worstCookbook, std::abs(Db(Magnitude(cookbook, hz) / analog(hz))));
    }
    if (c.centre > 0.3 * c.rate) {
      EXPECT_GT(worstCookbook, 5.0);
    }
    EXPECT_NEAR(Db(digital(nyquist)), Db(analog(nyquist)), 0.01);

    const double level = std::sqrt(std::pow(10.0, c.gainDb / 20.0) * digital(nyquist));
    const double digitalWidth = Crossing(digital, level, c.centre, nyquist) - Crossing(digital, level, 0, c.centre);
    const double analogWidth = Crossing(analog, level, c.centre, 100 * c.centre) - Crossing(analog, level, 0, c.centre);
    EXPECT_NEAR(digitalWidth, analogWidth, 1e-6 * analogWidth);
  }
}
