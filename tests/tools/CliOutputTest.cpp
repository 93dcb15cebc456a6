// What `torvane render` writes: integer samples rounded and dithered, the type the input had,
// clipping counted, tags kept.
#include <gmock/gmock.h>

#include <complex>
#include <numbers>
#include <numeric>

#include "tests/tools/CliFixture.h"

namespace {

constexpr double kStep16 = 1.0 / 32768.0;  // one step of a 16-bit file, full scale 1

// Stereo at 48 kHz, `seconds` long, both channels `value(frame)`.
template <typename Value>
Audio Stereo(double seconds, Value value) {
  Audio audio{2, 48000, {}};
  for (int64_t i = 0; i < static_cast<int64_t>(seconds * 48000); ++i) audio.samples.insert(audio.samples.end(), 2, static_cast<float>(value(i)));
  return audio;
}

// The power of `error` in each of the 32 bands between 0 and half the sample rate, averaged
// over 64-sample segments (one channel of interleaved stereo).
std::vector<double> BandPowers(const std::vector<double>& error) {
  constexpr int kLength = 64;
  std::vector<double> power(kLength / 2, 0.0);
  const size_t segments = error.size() / 2 / kLength;
  for (size_t s = 0; s < segments; ++s)
    for (int k = 1; k <= kLength / 2; ++k) {
      std::complex<double> sum;
      for (int i = 0; i < kLength; ++i) sum += error[2 * (s * kLength + i)] * std::polar(1.0, -2.0 * std::numbers::pi * k * i / kLength);
      power[k - 1] += std::norm(sum) / kLength / static_cast<double>(segments);
    }
  return power;
}

}  // namespace

// A -60 dBFS sine exported to 16 bits: the error is white (every band within 3 dB of the
// others) at the level of rounding plus triangular dither, 1/12 + 1/6 of a step squared; the
// old truncation left a correlated error a quarter of a step too low on average.
TEST_F(CliTest, SixteenBitExportOfAQuietSineHasWhiteErrorAtTheDitherLevel) {
  const Audio sine = Stereo(2.0, [](int64_t i) { return 0.001 * std::sin(2.0 * std::numbers::pi * 1000.0 * i / 48000.0); });
  WriteAudio(Work() / "sine.wav", sine, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "sine.wav", "float.wav"}).exit, 0);
  ASSERT_TRUE(Same(ReadAudio(Work() / "float.wav"), ReadAudio(Work() / "sine.wav")));  // the plug-in passes the sine through
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "sine.wav", "s16.wav", "--format", "s16"}).exit, 0);
  const Audio steps = ReadAudio(Work() / "s16.wav", nullptr, true);
  ASSERT_EQ(steps.samples.size(), sine.samples.size());
  std::vector<double> error(steps.samples.size());
  double mean = 0.0, square = 0.0;
  for (size_t i = 0; i < error.size(); ++i) {
    error[i] = steps.samples[i] - static_cast<double>(sine.samples[i]) / kStep16;
    mean += error[i] / static_cast<double>(error.size()), square += error[i] * error[i] / static_cast<double>(error.size());
  }
  EXPECT_NEAR(mean, 0.0, 0.01);
  EXPECT_NEAR(square, 0.25, 0.02);
  const std::vector<double> bands = BandPowers(error);
  const auto [low, high] = std::minmax_element(bands.begin(), bands.end());
  EXPECT_LT(10.0 * std::log10(*high / *low), 3.0) << testing::PrintToString(bands);
  EXPECT_NEAR(10.0 * std::log10(std::accumulate(bands.begin(), bands.end(), 0.0) / 32.0 / 0.25), 0.0, 0.5);
}

// Rounding: with dither a constant half step averages half a step; without, each value goes
// to the nearest step (0.9 to 1 and -0.9 to -1, where truncation gave 0 and -1), in 16 and 24 bits.
TEST_F(CliTest, IntegerOutputIsRoundedAndDitheredWithoutBias) {
  WriteAudio(Work() / "half.wav", Stereo(1.0, [](int64_t) { return 0.5 * kStep16; }), SF_FORMAT_WAV | SF_FORMAT_FLOAT);
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "half.wav", "half16.wav", "--format", "s16"}).exit, 0);
  const Audio dithered = ReadAudio(Work() / "half16.wav", nullptr, true);
  ASSERT_FALSE(dithered.samples.empty());
  EXPECT_NEAR(std::accumulate(dithered.samples.begin(), dithered.samples.end(), 0.0) / static_cast<double>(dithered.samples.size()), 0.5, 0.01);

  const double values[] = {0.9, -0.9, 0.4, -0.4, 1.6, -1.6, 100.2};
  for (const auto& [format, step, bits] : {std::tuple{"s16", kStep16, 16}, std::tuple{"s24", kStep16 / 256.0, 24}}) {
    WriteAudio(Work() / "values.wav", Stereo(0.01, [&](int64_t i) { return values[i % 7] * step; }), SF_FORMAT_WAV | SF_FORMAT_DOUBLE);
    ASSERT_EQ(Run({"render", "KUtilityPlugin", "values.wav", "rounded.wav", "--format", format, "--dither", "none"}).exit, 0);
    const Audio rounded = ReadAudio(Work() / "rounded.wav", nullptr, true);
    ASSERT_FALSE(rounded.samples.empty());
    for (size_t i = 0; i < rounded.samples.size(); ++i)
      ASSERT_EQ(rounded.samples[i], std::round(values[i / 2 % 7])) << bits << " bits, sample " << i;
  }
}

// With no --format the output keeps the input's sample format where its type can hold it;
// s32 and f64 are written on request; Ogg and FLAC refuse what they cannot hold.
TEST_F(CliTest, OutputFormatFollowsTheInputUnlessGiven) {
  const Audio tone = Stereo(0.1, [](int64_t i) { return 0.5 * std::sin(i * 0.01); });
  const std::tuple<int, Words, int> cases[] = {
      {SF_FORMAT_WAV | SF_FORMAT_PCM_24, {"out.wav"}, SF_FORMAT_WAV | SF_FORMAT_PCM_24},
      {SF_FORMAT_WAV | SF_FORMAT_PCM_16, {"out.flac"}, SF_FORMAT_FLAC | SF_FORMAT_PCM_16},
      {SF_FORMAT_FLAC | SF_FORMAT_PCM_16, {"out.aiff"}, SF_FORMAT_AIFF | SF_FORMAT_PCM_16},
      {SF_FORMAT_WAV | SF_FORMAT_DOUBLE, {"out.flac"}, SF_FORMAT_FLAC | SF_FORMAT_PCM_24},
      {SF_FORMAT_WAV | SF_FORMAT_PCM_16, {"out.wav", "--format", "s32"}, SF_FORMAT_WAV | SF_FORMAT_PCM_32},
      {SF_FORMAT_WAV | SF_FORMAT_PCM_16, {"out.wav", "--format", "f64"}, SF_FORMAT_WAV | SF_FORMAT_DOUBLE},
      {SF_FORMAT_OGG | SF_FORMAT_VORBIS, {"out.wav"}, SF_FORMAT_WAV | SF_FORMAT_FLOAT},
  };
  for (const auto& [inputFormat, words, expected] : cases) {
    WriteAudio(Work() / "typed.in", tone, inputFormat);
    Words command{"render", "KUtilityPlugin", "typed.in"};
    command.insert(command.end(), words.begin(), words.end());
    const CliRun run = Run(command);
    ASSERT_EQ(run.exit, 0) << run.err;
    int format = 0;
    const Audio out = ReadAudio(Work() / words[0], &format);
    EXPECT_EQ(format, expected) << std::hex << inputFormat << " to " << words[0];
    EXPECT_EQ(out.samples.size(), tone.samples.size()) << std::hex << inputFormat;
  }
  EXPECT_THAT(Run({"render", "KUtilityPlugin", "in.wav", "out.flac", "--format", "f32"}).err, testing::HasSubstr("FLAC files cannot hold f32"));
  EXPECT_THAT(Run({"render", "KUtilityPlugin", "in.wav", "out.ogg", "--format", "s16"}).err, testing::HasSubstr("Ogg Vorbis files hold no s16"));
}

// Samples beyond full scale in an integer output are held there, counted and warned about;
// --clipping fail makes that an error that leaves no file. A float output keeps them.
TEST_F(CliTest, ClippedIntegerSamplesAreCountedAndCanFail) {
  WriteAudio(Work() / "hot.wav", Stereo(0.5, [](int64_t i) { return i % 100 < 3 ? 1.5 : 0.5; }), SF_FORMAT_WAV | SF_FORMAT_FLOAT);
  const CliRun warned = Run({"render", "KUtilityPlugin", "hot.wav", "out.wav", "--format", "s16"});
  EXPECT_EQ(warned.exit, 0);
  EXPECT_THAT(warned.err, testing::HasSubstr("warning: 1440 samples clipped at full scale in out.wav"));
  const Audio held = ReadAudio(Work() / "out.wav");
  EXPECT_EQ(*std::max_element(held.samples.begin(), held.samples.end()), 32767.0f / 32768.0f);
  const CliRun failed = Run({"render", "KUtilityPlugin", "hot.wav", "failed.wav", "--format", "s16", "--clipping", "fail"});
  EXPECT_EQ(failed.exit, 1);
  EXPECT_THAT(failed.err, testing::HasSubstr("1440 samples of failed.wav were clipped at full scale; nothing was written."));
  EXPECT_FALSE(fs::exists(Work() / "failed.wav"));
  const CliRun floating = Run({"render", "KUtilityPlugin", "hot.wav", "float.wav", "--clipping", "fail"});
  EXPECT_EQ(floating.exit, 0) << floating.err;
  EXPECT_THAT(floating.err, testing::Not(testing::HasSubstr("clipped")));
}

// Title and artist of the input reach a WAV or FLAC output.
TEST_F(CliTest, InputTagsAreKept) {
  WriteAudio(Work() / "tagged.wav", AudioFile(Work() / "in.wav"), SF_FORMAT_WAV | SF_FORMAT_FLOAT, {{SF_STR_TITLE, "Night drive"}, {SF_STR_ARTIST, "Torvane"}});
  for (const char* output : {"out.wav", "out.flac"}) {
    ASSERT_EQ(Run({"render", "KUtilityPlugin", "tagged.wav", output}).exit, 0);
    SF_INFO info{};
    SNDFILE* file = sf_open((Work() / output).c_str(), SFM_READ, &info);
    ASSERT_NE(file, nullptr);
    EXPECT_STREQ(sf_get_string(file, SF_STR_TITLE), "Night drive") << output;
    EXPECT_STREQ(sf_get_string(file, SF_STR_ARTIST), "Torvane") << output;
    sf_close(file);
  }
}
