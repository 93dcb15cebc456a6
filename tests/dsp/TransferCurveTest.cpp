#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "dsp/KTransferCurve.h"

namespace {

enum : int32_t { kHard = KTransferCurve::kHardKnee, kLinear = KTransferCurve::kLinearKnee, kSoft = KTransferCurve::kSoftKnee };

KTransferCurve Make(int32_t knee, bool maximize = false, KTransferCurve::Settings s = {}) {
  KTransferCurve curve;
  curve.Configure({s.threshold, s.ratio, knee, s.kneeSize, maximize, s.customShape, s.shape, s.inputGain, s.outputGain});
  return curve;
}

}  // namespace

// Threshold 0.5, ratio 1.8, knee 0.25: T, Y0 = T^(1 − 1/1.8), the line through (T, T) and (1, Y0), M = 1/Y0, knee.
TEST(TransferCurve, DefaultsDeriveTheLineAndKnee) {
  const KTransferCurve hard = Make(kHard), lifted = Make(kHard, true), soft = Make(kSoft), linear = Make(kLinear);
  const double derived[] = {hard.Threshold(), hard.FullScale(), hard.Slope(),    hard.Intercept(), lifted.MakeUp(),
                            soft.KneeStart(), soft.KneeEnd(),   linear.KneeStart(), linear.KneeEnd(),  lifted.Curve(1.0)};
  const double expected[] = {0.25, 0.5400299, 0.3867065, 0.1533234, 1.8517494, 0.2058058, 0.3082932, 0.2058058, 0.3082932, 1.0};
  for (int k = 0; k < 10; ++k) EXPECT_NEAR(derived[k], expected[k], 1e-7) << k;
}

// Knees are continuous; maximize lifts by M, by M² inside the linear knee; soft of size 0 is hard; threshold 1: G.
TEST(TransferCurve, KneesMaximizeAndThresholdOne) {
  KTransferCurve sizeZero = Make(kSoft, false, {.kneeSize = 0.0}), hard = Make(kHard);
  KTransferCurve flat = Make(kSoft, true, {.threshold = 1.0, .inputGain = 2.0, .outputGain = 0.75});
  EXPECT_EQ(sizeZero.Chosen(), KTransferCurve::kHard);
  for (int32_t knee : {kHard, kLinear, kSoft}) {
    KTransferCurve curve = Make(knee, false, {.inputGain = 1.25}), lifted = Make(knee, true, {.inputGain = 1.25});
    const double m = lifted.MakeUp(), h = 1e-7;
    for (double d = 1e-12; d < 1.6; d += 0.0125) {
      const bool twice = knee == kLinear && d > curve.KneeStart() && d < curve.KneeEnd();
      EXPECT_NEAR(lifted.Gain(d) / curve.Gain(d), twice ? m * m : m, 1e-12) << knee << " " << d;
      EXPECT_NEAR(curve.Gain(d), 1.25 * curve.Curve(d) / d, 1e-12) << knee << " " << d;  // gain and graph agree
      EXPECT_EQ(sizeZero.Gain(d), hard.Gain(d)) << d;
      EXPECT_TRUE(std::abs(flat.Gain(d) - 1.5) < 1e-15 && std::abs(flat.Curve(d) - d) < 1e-15) << d;
    }
    for (double edge : {curve.KneeStart(), curve.KneeEnd()}) EXPECT_NEAR(curve.Gain(edge - h), curve.Gain(edge + h), 1e-5) << knee;
  }
}

// Walking finds what a linear search does (rising, falling, scattered, ends, after NaN); gain = G · (drawn output)².
TEST(TransferShape, WalkingSearchAndCustomGain) {
  std::vector<KTransferShape::Point> points;
  for (int32_t k = 0; k < 24; ++k) points.push_back({0.1 * k + 0.04 * std::sin(3.0 * k), std::fmod(0.618 * k, 1.2)});
  points[3].level = points[2].level;
  KTransferShape shape;
  shape.SetPoints(points.data(), 24);
  std::vector<double> ends, levels;
  for (int32_t k = 0; k < shape.Count(); ++k) ends.push_back(shape[k].end);
  const auto linear = [&](double a) { return int32_t(std::count_if(ends.begin(), ends.end() - 1, [a](double end) { return a >= end; })); };
  for (int32_t i = -400; i < 2400; ++i) levels.push_back(i < 400 ? 3.9 - 0.01 * std::abs(i) : std::fmod(0.37 * i * i, 5.0) - 0.5);
  levels.insert(levels.end(), ends.begin(), ends.end());
  KTransferShape::Cursor cursor;
  for (double a : levels) ASSERT_EQ(shape.Walk(a, cursor), linear(a)) << a;
  shape.Walk(NAN, cursor);
  EXPECT_EQ(shape.Walk(0.3, cursor), linear(0.3));
  KTransferCurve curve = Make(kSoft, true, {.customShape = true, .shape = &shape, .inputGain = 2.0});
  for (double a = 0.02; a < 5.0; a += 0.01) EXPECT_NEAR(curve.Gain(a * a) * a * a / 2.0, std::pow(shape[linear(a)].At(a), 2), 1e-12) << a;
}

// The block law is the per-level law to the last bit, for every variant, across every region of
// the knee, for odd lengths (the scalar tail) and NaN; also for runs of four and of two that rest
// entirely, that jump across the knee without a level inside it, or that hold a NaN.
TEST(TransferCurve, BlockGainsEqualTheLawLevelByLevel) {
  KTransferShape shape;
  const KTransferShape::Point points[] = {{0.0, 0.0}, {0.3, 0.35}, {1.0, 0.7}};
  shape.SetPoints(points, 3);
  std::vector<double> levels = {0.01, 1.5, 0.02, 1.4, 0.0, 0.0, NAN, 0.0, 1.5, 1.5, 1.5, NAN, 0.01, 0.01, 0.01, 0.3,
                                0.0,  0.0, 0.0,  0.0, 1.5, 1.2, 0.01, 1.1};
  for (double d = 0.0; d < 1.6; d += 0.0037) levels.push_back(d);
  levels.push_back(NAN);
  levels.push_back(0.25);
  for (int32_t knee : {KTransferCurve::kHardKnee, KTransferCurve::kLinearKnee, KTransferCurve::kSoftKnee}) {
    for (bool custom : {false, true}) {
      for (double ratio : {1.0, 3.0}) {
        KTransferCurve curve, single;
        const KTransferCurve::Settings settings{0.5, ratio, knee, 0.4, true, custom, &shape, 1.3, 0.8};
        curve.Configure(settings);
        single.Configure(settings);
        for (size_t n : {levels.size(), levels.size() - 1, size_t{3}}) {
          std::vector<double> gains(n);
          curve.Gains(levels.data(), gains.data(), int32_t(n));
          for (size_t i = 0; i < n; ++i) {
            const double expected = single.Gain(levels[i]);
            ASSERT_TRUE(gains[i] == expected || (std::isnan(gains[i]) && std::isnan(expected))) << knee << custom << ratio << " " << levels[i];
          }
        }
      }
    }
  }
}

// Below Rest the gain is the plain G; just above it it is not (idle: everything is rest).
TEST(TransferCurve, RestIsWhereTheGainStopsDependingOnTheLevel) {
  for (int32_t knee : {KTransferCurve::kHardKnee, KTransferCurve::kSoftKnee}) {
    KTransferCurve curve;
    curve.Configure({0.5, 4.0, knee, 0.5, false, false, nullptr, 1.0, 1.0});
    EXPECT_EQ(curve.Gain(curve.Rest()), curve.TotalGain());
    EXPECT_LT(curve.Gain(curve.Rest() * 1.01), curve.TotalGain());
  }
  KTransferCurve idle;
  idle.Configure({0.5, 1.0, KTransferCurve::kHardKnee, 0.0, false, false, nullptr, 1.0, 1.0});
  EXPECT_TRUE(std::isinf(idle.Rest()));
}
