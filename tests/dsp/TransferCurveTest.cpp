#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "dsp/KTransferCurve.h"

namespace {

using Settings = KTransferCurve::Settings;
enum : int32_t { kHard = KTransferCurve::kHardKnee, kLinear = KTransferCurve::kLinearKnee, kSoft = KTransferCurve::kSoftKnee };

KTransferCurve Make(int32_t knee, bool maximize = false, Settings s = {}) {
  s.kneeMode = knee;
  s.maximize = maximize;
  KTransferCurve curve;
  curve.Configure(s);
  return curve;
}

// Detector values from silence to beyond full scale, on both sides of every edge of the defaults.
std::vector<double> Levels() {
  std::vector<double> levels{1e-12, 1e-10};
  for (double d = 0.01; d < 1.6; d += 0.0125) levels.push_back(d);
  return levels;
}

TEST(TransferCurve, DefaultsDeriveTheLineAndKnee) {
  const KTransferCurve curve = Make(kHard);
  EXPECT_DOUBLE_EQ(curve.Threshold(), 0.25);
  EXPECT_NEAR(curve.FullScale(), 0.5400299, 1e-7);
  EXPECT_NEAR(curve.FullScale(), std::pow(0.25, 1.0 - 1.0 / 1.8), 1e-15);
  EXPECT_NEAR(curve.Slope(), 0.3867065, 1e-7);
  EXPECT_NEAR(curve.Intercept(), 0.1533234, 1e-7);
  EXPECT_NEAR(curve.Curve(1.0), curve.FullScale(), 1e-15);  // through (1, Y0)
  EXPECT_NEAR(Make(kHard, true).MakeUp(), 1.8517494, 1e-7);
  EXPECT_NEAR(Make(kHard, true).Curve(1.0), 1.0, 1e-15);
  for (int32_t knee : {kLinear, kSoft}) {
    EXPECT_NEAR(Make(knee).KneeStart(), 0.2058058, 1e-7);
    EXPECT_NEAR(Make(knee).KneeEnd(), 0.3082932, 1e-7);
  }
}

TEST(TransferCurve, VariantFollowsSettingsAndDegenerateKneesAreHard) {
  auto variant = [](int32_t knee, double size, double threshold, double ratio, bool custom = false) {
    return Make(knee, false, {threshold, ratio, knee, size, false, custom}).Chosen();
  };
  EXPECT_EQ(variant(kSoft, 0.25, 0.5, 1.8), KTransferCurve::kSoft);
  EXPECT_EQ(variant(kLinear, 0.25, 0.5, 1.8), KTransferCurve::kLinear);
  EXPECT_EQ(variant(kSoft, 0.0, 0.5, 1.8), KTransferCurve::kHard);
  EXPECT_EQ(variant(kSoft, 0.25, 1.0, 1.8), KTransferCurve::kHard);  // slope 1
  EXPECT_EQ(variant(kSoft, 0.25, 0.5, 1.0 + 1e-11), KTransferCurve::kIdle);
  EXPECT_EQ(variant(kSoft, 0.25, 0.5, 1.0 + 1e-9), KTransferCurve::kSoft);
  EXPECT_EQ(variant(kSoft, 0.25, 0.5, 1.0, true), KTransferCurve::kCustom);
  KTransferCurve soft = Make(kSoft, false, {.kneeSize = 0.0}), hard = Make(kHard);
  for (double d : Levels()) EXPECT_EQ(soft.Gain(d), hard.Gain(d)) << d;
}

TEST(TransferCurve, ThresholdOneLeavesOnlyTheTotalGain) {
  KTransferCurve curve = Make(kSoft, true, {.threshold = 1.0, .inputGain = 2.0, .outputGain = 0.75});
  EXPECT_EQ(curve.Slope(), 1.0);
  EXPECT_DOUBLE_EQ(curve.InverseGain(), 1.0 / 1.5);
  for (double d : Levels()) {
    EXPECT_DOUBLE_EQ(curve.Gain(d), 1.5) << d;
    EXPECT_DOUBLE_EQ(curve.Curve(d), d) << d;
  }
}

// Gain and graph agree; every knee is continuous at its edges; the soft knee is tangent there and
// runs under both of its tangents.
TEST(TransferCurve, KneesAreContinuousAndTheSoftKneeIsTangent) {
  for (int32_t knee : {kHard, kLinear, kSoft}) {
    KTransferCurve curve = Make(knee, false, {.inputGain = 1.25});
    for (double d : Levels()) EXPECT_NEAR(curve.Gain(d), 1.25 * curve.Curve(d) / d, 1e-12) << knee << " " << d;
    const double h = 1e-7;
    for (double edge : {curve.KneeStart(), curve.KneeEnd()}) {
      EXPECT_NEAR(curve.Gain(edge - h), curve.Gain(edge + h), 1e-5) << knee;
      const double below = curve.Curve(edge - h) - curve.Curve(edge - 2 * h), above = curve.Curve(edge + 2 * h) - curve.Curve(edge + h);
      EXPECT_TRUE(knee != kSoft || std::abs(below - above) / h < 1e-5) << edge;
    }
    for (double d = curve.KneeStart(); knee == kSoft && d < curve.KneeEnd(); d += 0.001) {
      EXPECT_LE(curve.Curve(d), std::fmin(d, curve.Intercept() + curve.Slope() * d) + 1e-15) << d;
    }
  }
}

TEST(TransferCurve, MaximizeCountsTwiceInsideTheLinearKneeOnly) {
  for (int32_t knee : {kLinear, kSoft}) {
    KTransferCurve plain = Make(knee), lifted = Make(knee, true);
    const double m = lifted.MakeUp();
    for (double d : Levels()) {
      const bool twice = knee == kLinear && d > plain.KneeStart() && d < plain.KneeEnd();
      EXPECT_NEAR(lifted.Gain(d) / plain.Gain(d), twice ? m * m : m, 1e-12) << knee << " " << d;
    }
  }
}

// A polyline over random ascending points, one of them doubled into a vertical step.
KTransferShape RandomShape(std::mt19937& random, int32_t count) {
  std::uniform_real_distribution<double> step(0.01, 0.2), output(0.0, 1.2);
  std::vector<KTransferShape::Point> points;
  double level = 0.05;
  for (int32_t k = 0; k < count; ++k) points.push_back({level += step(random), output(random)});
  points[3].level = points[2].level;
  KTransferShape shape;
  shape.SetPoints(points.data(), count);
  return shape;
}

int32_t LinearSearch(const KTransferShape& shape, double level) {
  int32_t k = 0;
  while (k + 1 < shape.Count() && level >= shape[k].end) ++k;
  return k;
}

TEST(TransferShape, WalkingSearchFindsWhatALinearSearchFinds) {
  std::mt19937 random(7);
  const KTransferShape shape = RandomShape(random, 24);
  std::vector<double> up, down, jumps, edges;
  for (double a = -0.1; a < 4.0; a += 0.013) up.push_back(a);
  down.assign(up.rbegin(), up.rend());
  for (int32_t k = 0; k < shape.Count(); ++k) edges.push_back(shape[k].end);
  std::uniform_real_distribution<double> any(-0.5, 4.5);
  for (int32_t i = 0; i < 2000; ++i) jumps.push_back(any(random));
  for (const auto* sequence : {&up, &down, &jumps, &edges}) {
    KTransferShape::Cursor cursor;
    for (double a : *sequence) ASSERT_EQ(shape.Walk(a, cursor), LinearSearch(shape, a)) << a;
  }
  KTransferShape::Cursor cursor;  // a NaN passing through must not strand the next search
  shape.Walk(3.0, cursor);
  shape.Walk(std::numeric_limits<double>::quiet_NaN(), cursor);
  EXPECT_EQ(shape.Walk(0.3, cursor), LinearSearch(shape, 0.3));
}

TEST(TransferShape, CustomGainSquaresTheDrawnOutputWithoutMakeUp) {
  std::mt19937 random(11);
  const KTransferShape shape = RandomShape(random, 12);
  KTransferCurve curve = Make(kSoft, true, {.customShape = true, .shape = &shape, .inputGain = 2.0});
  EXPECT_EQ(curve.MakeUp(), 1.0);
  EXPECT_EQ(curve.Gain(1e-10), 2.0);
  std::uniform_real_distribution<double> any(1e-9, 3.0);
  for (int32_t i = 0; i < 500; ++i) {
    const double d = any(random), a = std::sqrt(d), y = shape[LinearSearch(shape, a)].At(a);
    EXPECT_NEAR(curve.Gain(d) * d / 2.0, y * y, 1e-12) << d;
    EXPECT_NEAR(curve.Curve(d), y * y, 1e-15) << d;
  }
  curve = Make(kSoft, true, {.customShape = true, .inputGain = 2.0});  // no graph: the identity
  EXPECT_EQ(curve.Gain(0.7), 2.0);
  EXPECT_EQ(curve.Curve(0.7), 0.7);
}

}  // namespace
