#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/KParameter.h"
#include "plugins/waveshaper/KWaveshaperPlugin.h"
#include "tests/plugins/PluginRender.h"

namespace {
using W = KWaveshaperPlugin;

std::unique_ptr<W> Shaper(std::initializer_list<std::pair<int32_t, double>> settings) {
  auto shaper = std::make_unique<W>();
  shaper->SetSampleRate(48000.0);
  for (auto [index, value] : settings) shaper->GetParameter(index).SetWorking(value);
  return shaper;
}

double Db(double x) { return 20.0 * std::log10(x); }
}  // namespace

// Symmetric curves make odd harmonics only; the bias adds even ones; rectifying moves the tone
// an octave up and leaves none of the fundamental.
TEST(Waveshaper, HarmonicsFollowTheCurvesSymmetry) {
  const Channels in = Sine(2, 48000, 1000.0, 0.5);
  for (const double shape : {W::kHardClip, W::kCubic, W::kSineFold}) {
    const Channels plain = Render(*Shaper({{W::kShape, shape}}), in, {512});
    const double fundamental = Amplitude(plain[0], 1000.0, 24000, 48000);
    EXPECT_GT(Db(Amplitude(plain[0], 3000.0, 24000, 48000) / fundamental), -40.0) << "shape " << shape;
    EXPECT_LT(Db(Amplitude(plain[0], 2000.0, 24000, 48000) / fundamental), -90.0) << "shape " << shape;
    const Channels biased = Render(*Shaper({{W::kShape, shape}, {W::kBias, 60.0}}), in, {512});
    EXPECT_GT(Db(Amplitude(biased[0], 2000.0, 24000, 48000) / Amplitude(biased[0], 1000.0, 24000, 48000)), -40.0) << "shape " << shape;
  }
  const Channels octave = Render(*Shaper({{W::kShape, W::kRectify}, {W::kDrive, 0.0}, {W::kOutputGain, 0.0}}), in, {512});
  EXPECT_LT(Db(Amplitude(octave[0], 1000.0, 24000, 48000) / Amplitude(octave[0], 2000.0, 24000, 48000)), -90.0);
}

// A hard clip driven far into the curve stays within full scale times the output gain (the DC
// blocker's overshoot aside), and the curve's average keeps aliasing well below a plain clip's:
// a 7 kHz tone's seventh harmonic, 49 kHz, folds back to 1 kHz, where nothing else lies.
TEST(Waveshaper, HardClipIsBoundedAndLowInAliasing) {
  const Channels in = Sine(1, 48000, 7000.0, 0.9);
  auto shaper = Shaper({{W::kShape, W::kHardClip}, {W::kDrive, 30.0}, {W::kOutputGain, 0.0}});
  shaper->SetChannelsPerBus(1);
  const Channels out = Render(*shaper, in, {256});
  EXPECT_LE(PeakOf(out, 24000, SIZE_MAX), 1.02f);
  // The plain clip of the same driven tone, for comparison.
  std::vector<float> plain(in[0].size());
  for (size_t i = 0; i < plain.size(); ++i) plain[i] = std::clamp(in[0][i] * 31.6227766f, -1.0f, 1.0f);
  const double aliasing = Amplitude(out[0], 1000.0, 24000, 48000), plainAliasing = Amplitude(plain, 1000.0, 24000, 48000);
  EXPECT_LT(Db(aliasing / plainAliasing), -6.0);
}
