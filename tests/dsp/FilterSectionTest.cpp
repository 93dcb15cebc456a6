#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstdint>
#include <numbers>
#include <tuple>

#include "dsp/KFilterSection.h"
#include "kernel/KException.h"

namespace {

using enum KFilterSection::Type;
constexpr double kRate = 48000.0, kNyquist = kRate / 2, kInvRoot2 = std::numbers::sqrt2 / 2;

KFilterSection Designed(int32_t type, double gainDb, double hz, double q = kInvRoot2, double rate = kRate) {
  KFilterSection s;
  s.Design(type, gainDb, hz, rate, q);
  return s;
}
auto Coefficients(const KFilterSection& s) { return std::make_tuple(s.b0, s.minusA1, s.b1, s.minusA2, s.b2); }

std::complex<double> Response(const KFilterSection& s, double hz) {
  const std::complex<double> z1 = std::polar(1.0, -2.0 * std::numbers::pi * hz / s.sampleRate);
  return (s.b0 + z1 * (s.b1 + z1 * s.b2)) / (1.0 - z1 * (s.minusA1 + z1 * s.minusA2));
}
double Db(double linear) { return 20.0 * std::log10(linear); }

}  // namespace

// b = a at 0 dB; |A − 1| ≤ 1e-5 (1e-4 dB, not 1e-3) gives the cookbook peak; cos w = 0 at fs/4; unknown codes throw late.
TEST(KFilterSection, ExactCoefficientsAndUnknownCodes) {
  for (int32_t type : {kPeak, kMatchedPeak, kLowShelf, kHighShelf}) {
    for (double hz : {30.0, 1000.0, 15000.0}) {
      const KFilterSection s = Designed(type, 0.0, hz, 2.5);
      EXPECT_EQ(std::make_tuple(s.b0, s.b1, s.b2), std::make_tuple(1.0, -s.minusA1, -s.minusA2)) << type << " " << hz;
    }
  }
  for (double dB : {0.0, 1e-4, -1e-4, 1e-3, -1e-3}) {
    EXPECT_EQ(Coefficients(Designed(kMatchedPeak, dB, 9000, 1.5)) == Coefficients(Designed(kPeak, dB, 9000, 1.5)), std::abs(dB) < 5e-4);
  }
  EXPECT_DOUBLE_EQ(Designed(kLowPass, 0.0, kRate / 4, 0.9).b0, 0.5 / (1.0 + 1.0 / 1.8));
  for (int32_t code : {16, -1}) {
    KFilterSection s = Designed(kHighShelf, 6.0, 3000.0, 0.8);
    const auto before = Coefficients(s);
    s.changed = 0;
    try {
      s.Design(code, -4.5, 2500.0, 44100.0, 3.0);
      ADD_FAILURE() << "code " << code << " was accepted";
    } catch (const KException& e) {
      EXPECT_EQ(e.Message(), KString("Invalid filter type."));
    }
    EXPECT_EQ(Coefficients(s), before);
    EXPECT_EQ(std::make_tuple(s.type, s.changed, s.gain, s.frequency, s.sampleRate, s.quality),
              std::make_tuple(code, uint8_t{1}, -4.5, 2500.0, 44100.0, 3.0));
  }
}

// Magnitudes known exactly at DC, centre and Nyquist (NaN: not checked); the fixed-zero pair sums to one.
TEST(KFilterSection, ResponsesAtDcCentreAndNyquist) {
  const double g12 = std::pow(10.0, 0.6), g6 = std::pow(10.0, 0.3), s6 = std::sqrt(g6), r2 = kInvRoot2, no = NAN;
  const struct { int32_t type; double gainDb, centre, q, expected[3]; } cases[] = {
      {kLowPass, 0, 2000, 4, {1, 4, 0}},          {kHighPass, 0, 2000, r2, {0, r2, 1}},        {kBandPass, 0, 5000, 3, {0, 1, 0}},
      {kNotch, 0, 5000, 3, {1, 0, 1}},            {kPeak, 12, 700, 2, {1, g12, 1}},            {kAllPass, 0, 1200, 3, {1, 1, 1}},
      {kOnePoleLowPass, 0, 1e3, 1, {1, no, no}},  {kOnePoleHighPass, 0, 1e3, 1, {0, no, 1}},   {kBilinearLowPass, 0, 1e3, 1, {1, r2, 0}},
      {kBilinearHighPass, 0, 1e3, 1, {0, r2, 1}}, {kFixedZeroLowPass, 0, 440, 1, {1, no, no}}, {kFixedZeroHighPass, 0, 2e4, 1, {0, no, no}},
      {kFirstOrderAllPass, 0, 1200, 3, {1, 1, 1}}, {kLowShelf, 6, 300, r2, {g6, s6, 1}}, {kHighShelf, -6, 8000, r2, {1, 1 / s6, 1 / g6}},
      {kMatchedPeak, -12, 15e3, 0.5, {no, 1 / g12, no}}};
  for (const auto& c : cases) {
    const double at[] = {0.0, c.centre, kNyquist};
    for (int k = 0; k < 3; ++k) {
      const double magnitude = std::abs(Response(Designed(c.type, c.gainDb, c.centre, c.q), at[k]));
      EXPECT_TRUE(std::isnan(c.expected[k]) || std::abs(magnitude - c.expected[k]) <= 1e-6 * c.expected[k] + 1e-9)
          << c.type << " at " << at[k];
    }
  }
  EXPECT_NEAR(std::abs(std::arg(Response(Designed(kAllPass, 0, 1200, 3), 1200))), std::numbers::pi, 1e-9);  // half a turn
  for (double corner : {5.0, 440.0, 6000.0, 20000.0}) {
    const KFilterSection low = Designed(kFixedZeroLowPass, 0, corner), high = Designed(kFixedZeroHighPass, 0, corner);
    for (double hz = 0.0; hz <= kNyquist; hz += 997.0) EXPECT_LT(std::abs(Response(low, hz) + Response(high, hz) - 1.0), 1e-12);
  }
}

// The matched peak follows the analog bell from its centre to Nyquist, where the cookbook one is squeezed to 0 dB.
TEST(KFilterSection, MatchedPeakFollowsTheAnalogBell) {
  const struct { double gainDb, centre, q, rate, toleranceDb; } cases[] = {
      {12, 700, 2, 48000, 0.05},   {12, 5000, 0.7, 48000, 0.5},  {-12, 15000, 0.5, 48000, 0.75},
      {12, 18000, 1, 44100, 0.75}, {-12, 18000, 2, 44100, 0.75}, {18, 20000, 3, 44100, 0.75}};
  for (const auto& c : cases) {
    const KFilterSection matched = Designed(kMatchedPeak, c.gainDb, c.centre, c.q, c.rate);
    const KFilterSection cookbook = Designed(kPeak, c.gainDb, c.centre, c.q, c.rate);
    const auto analog = [&](double hz) {  // (s² + s·A/Q + 1)/(s² + s/(A·Q) + 1), A = 10^(dB/40)
      const double a = std::pow(10.0, c.gainDb / 40.0);
      const std::complex<double> s(0.0, hz / c.centre);
      return std::abs((s * s + s * a / c.q + 1.0) / (s * s + s / (a * c.q) + 1.0));
    };
    double worstCookbook = 0.0;
    for (int k = 0; k <= 8; ++k) {  // from the centre to Nyquist, where the match is close
      const double hz = k == 8 ? c.rate / 2 : c.centre + k * (c.rate / 2 - c.centre) / 8;
      EXPECT_NEAR(Db(std::abs(Response(matched, hz)) / analog(hz)), 0.0, k == 8 ? 0.01 : c.toleranceDb) << c.centre << " " << hz;
      worstCookbook = std::fmax(worstCookbook, std::abs(Db(std::abs(Response(cookbook, hz)) / analog(hz))));
    }
    EXPECT_TRUE(c.centre < 0.3 * c.rate || worstCookbook > 5.0) << c.centre << " " << worstCookbook;
  }
}
