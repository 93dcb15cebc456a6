#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "dsp/KSpectrumAnalyser.h"

namespace {
// `n` samples of a sine of `amplitude` on bin `bin` of `size` into both channels, with an
// offset on the right channel that the mean of the channels must cancel.
void PushSine(KSpectrumAnalyser& analyser, double bin, int32_t size, double amplitude, int32_t n) {
  std::vector<float> left(static_cast<size_t>(n)), right(left.size());
  for (int32_t i = 0; i < n; ++i) {
    const double v = amplitude * std::sin(6.283185307179586 * bin * i / size);
    left[static_cast<size_t>(i)] = static_cast<float>(v + 0.25);
    right[static_cast<size_t>(i)] = static_cast<float>(v - 0.25);
  }
  const float* channels[2] = {left.data(), right.data()};
  analyser.Push(channels, 2, n);
}
}  // namespace

// A bin-centred sine at −6 dB reads −6 dB on its bin at every size, nothing far from it, and
// the opposite offsets of the two channels cancel (the mean of the channels is measured).
TEST(KSpectrumAnalyser, ASineReadsItsLevelOnItsBin) {
  for (int32_t size : {256, 4096, 8192}) {
    KSpectrumAnalyser analyser;
    PushSine(analyser, size / 16.0, size, 0.5, 20000);
    std::vector<double> db;
    analyser.Measure(size, db);
    ASSERT_EQ(db.size(), static_cast<size_t>(size / 2 + 1));
    EXPECT_NEAR(db[static_cast<size_t>(size / 16)], -6.0206, 0.01) << size;
    EXPECT_LT(db[0], -90.0) << size;  // no offset left
    EXPECT_LT(db[static_cast<size_t>(size / 4)], -90.0) << size;
  }
}

// Only the newest samples count: a sine pushed after silence shows, silence pushed after a sine
// empties the picture; a NaN is heard as silence; Reset forgets all.
TEST(KSpectrumAnalyser, MeasuresTheNewestSamplesOnly) {
  KSpectrumAnalyser analyser;
  std::vector<double> db;
  analyser.Measure(1024, db);
  EXPECT_EQ(db[64], KSpectrumAnalyser::kSilence);
  PushSine(analyser, 64, 1024, 1.0, 1024);
  analyser.Measure(1024, db);
  EXPECT_NEAR(db[64], 0.0, 0.01);
  std::vector<float> silence(1024, 0.0f);
  silence[500] = std::numeric_limits<float>::quiet_NaN();
  const float* channels[1] = {silence.data()};
  analyser.Push(channels, 1, 1024);
  analyser.Measure(1024, db);
  EXPECT_EQ(db[64], KSpectrumAnalyser::kSilence);
  PushSine(analyser, 64, 1024, 1.0, 1024);
  analyser.Reset();
  analyser.Measure(1024, db);
  EXPECT_EQ(db[64], KSpectrumAnalyser::kSilence);
}
