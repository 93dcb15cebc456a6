// The mid/side processor and the stereo imager at 48 kHz.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/midside/KMidSidePlugin.h"
#include "plugins/stereoimager/KStereoImagerPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
// A left and right that share something (the 300 Hz tone) and differ in something else.
Channels Stereo(size_t n) {
  const std::vector<float> common = Sine(1, n, 300.0, 0.4)[0], apart = Sine(1, n, 2000.0, 0.2)[0];
  Channels c(2, std::vector<float>(n));
  for (size_t i = 0; i < n; ++i) c[0][i] = common[i] + apart[i], c[1][i] = common[i] - apart[i];
  return c;
}
}  // namespace

// Encoding gives mid and side as (L±R)/2; decoding that gives the input back; side alone of the
// stereo signal is the 2 kHz difference on both speakers; mid gain moves the common part only.
TEST(MidSidePlugin, EncodesDecodesAndSetsMidAndSideApart) {
  using M = KMidSidePlugin;
  const Channels in = Stereo(4800);
  M encoder, decoder;
  encoder.GetParameter(M::kMode).SetWorking(M::kEncode);
  decoder.GetParameter(M::kMode).SetWorking(M::kDecode);
  const Channels coded = Render(encoder, in, {512});
  for (size_t i = 0; i < in[0].size(); ++i) {
    ASSERT_NEAR(coded[0][i], 0.5f * (in[0][i] + in[1][i]), 1e-6f);
    ASSERT_NEAR(coded[1][i], 0.5f * (in[0][i] - in[1][i]), 1e-6f);
  }
  const Channels back = Render(decoder, coded, {512});
  for (size_t c = 0; c < 2; ++c)
    for (size_t i = 0; i < in[0].size(); ++i) ASSERT_NEAR(back[c][i], in[c][i], 1e-6f);

  M side;
  side.GetParameter(M::kListen).SetWorking(M::kSideOnly);
  const Channels sideOut = Render(side, in, {512});
  const std::vector<float> apart = Sine(1, 4800, 2000.0, 0.2)[0];
  for (size_t i = 0; i < 4800; ++i) ASSERT_NEAR(sideOut[0][i], apart[i], 1e-6f) << i;
  EXPECT_EQ(sideOut[0], sideOut[1]);

  M quieterMid;
  quieterMid.GetParameter(M::kMidGain).SetWorking(-6.0206);
  const Channels out = Render(quieterMid, in, {512});
  const std::vector<float> common = Sine(1, 4800, 300.0, 0.4)[0];
  for (size_t i = 480; i < 4800; ++i) ASSERT_NEAR(out[1][i], 0.5f * common[i] - apart[i], 1e-5f) << i;  // after the glide
}

// At any setting the mono sum is the input's; with the low width at 0 a 50 Hz difference
// between the sides disappears while a 5 kHz one stays; at equal widths the side keeps its level
// at every frequency, scaled by the width (the two bands sum to an all-pass).
TEST(StereoImagerPlugin, ShapesTheSideBelowAndAboveTheCrossoverAndKeepsMono) {
  using S = KStereoImagerPlugin;
  auto antiphase = [](double hz) {
    const std::vector<float> x = Sine(1, 24000, hz, 0.5)[0];
    Channels c{x, x};
    for (float& v : c[1]) v = -v;
    return c;
  };
  S imager;
  ASSERT_TRUE(imager.SetSampleRate(48000.0));
  imager.GetParameter(S::kLowWidth).SetWorking(0.0);
  imager.GetParameter(S::kWidth).SetWorking(100.0);
  // Measured over the last 0.4 s, whole periods of every test frequency.
  EXPECT_LT(Amplitude(Render(imager, antiphase(50.0), {512})[0], 50.0, 4800, 24000), 0.05 * 0.5);
  EXPECT_NEAR(Amplitude(Render(imager, antiphase(5000.0), {512})[0], 5000.0, 4800, 24000), 0.5, 0.005);

  imager.GetParameter(S::kWidth).SetWorking(170.0);
  imager.GetParameter(S::kLowWidth).SetWorking(30.0);
  const Channels in = Stereo(9600);
  const Channels out = Render(imager, in, {512});
  for (size_t i = 0; i < in[0].size(); ++i) ASSERT_NEAR(out[0][i] + out[1][i], in[0][i] + in[1][i], 1e-5f) << i;

  S equal;
  ASSERT_TRUE(equal.SetSampleRate(48000.0));
  equal.GetParameter(S::kWidth).SetWorking(50.0);
  equal.GetParameter(S::kLowWidth).SetWorking(50.0);
  for (double hz : {50.0, 150.0, 400.0, 5000.0}) {
    const Channels half = Render(equal, antiphase(hz), {512});
    EXPECT_NEAR(Amplitude(half[0], hz, 4800, 24000), 0.25, 0.002) << hz;
  }
}
