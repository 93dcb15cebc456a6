#include <gtest/gtest.h>
#include <sndfile.h>

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <numeric>
#include <string>
#include <unistd.h>
#include <vector>

#include "dsp/KImpulseResponse.h"
#include "kernel/KException.h"

namespace {
// A two-channel response (a smooth decay, the right side half as loud) written as `format`.
std::string WriteResponse(const char* name, int format, int rate, int32_t frames) {
  const std::string path = (std::filesystem::temp_directory_path() / (std::to_string(::getpid()) + name)).string();
  SF_INFO info{};
  info.samplerate = rate;
  info.channels = 2;
  info.format = format;
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  EXPECT_NE(file, nullptr) << sf_strerror(nullptr);
  std::vector<float> samples;
  for (int32_t i = 0; i < frames; ++i) {
    const float tap = 0.5f * std::exp(-i / 200.0f);
    samples.insert(samples.end(), {tap, 0.5f * tap});
  }
  sf_writef_float(file, samples.data(), frames);
  sf_close(file);
  return path;
}

double Sum(const std::vector<float>& taps) { return std::accumulate(taps.begin(), taps.end(), 0.0); }
}  // namespace

// At the file's own rate the taps arrive as written (to the format's resolution); at another
// rate the length scales with the rate and the gain at low frequencies stays the same.
TEST(KImpulseResponse, ReadsWavAndFlacAndResamplesKeepingTheGain) {
  const std::string wav = WriteResponse("torvane_ir_test.wav", SF_FORMAT_WAV | SF_FORMAT_FLOAT, 44100, 2000);
  const std::string flac = WriteResponse("torvane_ir_test.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_24, 44100, 2000);
  const KImpulseResponse same = KReadImpulseResponse(KString::FromUtf8(wav), 44100.0);
  ASSERT_EQ(same.channels.size(), 2u);
  ASSERT_EQ(same.Length(), 2000);
  EXPECT_EQ(same.channels[0][0], 0.5f);
  EXPECT_EQ(same.channels[1][10], 0.25f * std::exp(-10 / 200.0f));

  const KImpulseResponse fromFlac = KReadImpulseResponse(KString::FromUtf8(flac), 44100.0);
  ASSERT_EQ(fromFlac.Length(), 2000);
  EXPECT_NEAR(fromFlac.channels[1][100], same.channels[1][100], 1e-6);

  const KImpulseResponse up = KReadImpulseResponse(KString::FromUtf8(flac), 96000.0);
  EXPECT_EQ(up.sampleRate, 96000.0);
  EXPECT_NEAR(up.Length(), 2000 * 96000 / 44100, 2);
  for (size_t c = 0; c < 2; ++c) EXPECT_NEAR(Sum(up.channels[c]) / Sum(same.channels[c]), 1.0, 0.01) << c;
  // 10 ms into the response at both rates: the same decay.
  EXPECT_NEAR(up.channels[0][960] * 96000 / 44100, same.channels[0][441], 0.01 * same.channels[0][441]);
  std::filesystem::remove(wav);
  std::filesystem::remove(flac);
}

TEST(KImpulseResponse, RefusesMissingAndUnreadableFilesWithTheirName) {
  try {
    KReadImpulseResponse(KString("/nonexistent/room.wav"), 48000.0);
    FAIL() << "no exception";
  } catch (const KException& e) {
    EXPECT_NE(e.Message().ToUtf8().find("/nonexistent/room.wav"), std::string::npos);
  }
  const std::string text = (std::filesystem::temp_directory_path() / (std::to_string(::getpid()) + "torvane_ir_text.wav")).string();
  FILE* f = std::fopen(text.c_str(), "w");
  std::fputs("not a sound file", f);
  std::fclose(f);
  EXPECT_THROW(KReadImpulseResponse(KString::FromUtf8(text), 48000.0), KException);
  std::filesystem::remove(text);
}
