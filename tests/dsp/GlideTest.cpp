#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "dsp/KDecibels.h"
#include "dsp/KGlide.h"

// Each lane steps before the sample that uses it, reaches its target at the glide's last sample
// and sits on it exactly from then on, across fills of any length; the same targets again change
// nothing; a jump lands.
TEST(KGlide, StraightLinesThatLandExactlyOnTheTarget) {
  KGlide<2> glide;
  const double start[2] = {1.0, -3.0}, to[2] = {0.1, 7.0};
  glide.Aim(start, 5, true);
  EXPECT_EQ(glide.left, 0);
  glide.Aim(to, 10, false);
  glide.Aim(to, 3, false);  // no restart
  std::vector<double> a(25), b(25);
  for (int32_t at : {0, 3, 4, 11}) {
    const int32_t n = at == 11 ? 14 : (at == 0 ? 3 : (at == 3 ? 1 : 7));
    glide.Fill(0, a.data() + at, n);
    glide.Fill(1, b.data() + at, n);
    glide.Passed(n);
  }
  for (int32_t i = 0; i < 10; ++i) EXPECT_NEAR(a[i], 1.0 - 0.09 * (i + 1), 1e-12) << i;
  for (int32_t i = 10; i < 25; ++i) EXPECT_TRUE(a[i] == 0.1 && b[i] == 7.0) << i;
  EXPECT_NEAR(b[4], -3.0 + 5.0, 1e-12);
  EXPECT_EQ(glide.left, 0);
  const double back[2] = {2.0, 2.0};
  glide.Aim(back, 100, true);
  EXPECT_TRUE(glide.value[0] == 2.0 && glide.value[1] == 2.0 && glide.step[0] == 0.0);
}

TEST(KDecibels, ConversionsAndTheSmoothingCoefficient) {
  EXPECT_EQ(KDecibelsToLinear(0.0), 1.0);
  EXPECT_NEAR(KDecibelsToLinear(-6.0206), 0.5, 1e-5);
  EXPECT_NEAR(KLinearToDecibels(KDecibelsToLinear(17.5)), 17.5, 1e-12);
  EXPECT_NEAR(KSmoothingCoefficient(48000.0, 0.01), std::exp(-1.0 / 480.0), 1e-15);
  EXPECT_EQ(KSmoothingCoefficient(48000.0, 1e-16), 0.0);  // too short to divide by: instant
}
