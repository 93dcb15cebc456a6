// The convolution reverb at 48 kHz: its wet path is the convolution with its space, from the
// first sample; a file replaces the built-in space through the state, off the audio thread.
#include <gtest/gtest.h>
#include <sndfile.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <numeric>
#include <string>
#include <unistd.h>
#include <vector>

#include "core/KParameter.h"
#include "kernel/KException.h"
#include "plugins/convolutionreverb/KConvolutionReverbPlugin.h"
#include "tests/core/AllocationCounter.h"
#include "tests/plugins/PluginRender.h"

namespace {
using R = KConvolutionReverbPlugin;

Channels Clicks(size_t n) {
  Channels in(2, std::vector<float>(n, 0.0f));
  in[0][0] = 1.0f;
  in[1][100] = 0.5f;
  return in;
}

std::unique_ptr<R> Make(double mix) {
  auto plugin = std::make_unique<R>();
  EXPECT_TRUE(plugin->SetSampleRate(48000.0));
  plugin->GetParameter(R::kMix).SetWorking(mix);
  return plugin;
}

// A one-channel response file: a click at `tap`, at `rate`; named after the test and the
// process, as tests run side by side.
std::string WriteClick(int32_t tap, int rate) {
  const std::string name = std::string("torvane_") + ::testing::UnitTest::GetInstance()->current_test_info()->name() + "_" +
                           std::to_string(::getpid()) + ".wav";
  const std::string path = (std::filesystem::temp_directory_path() / name).string();
  SF_INFO info{};
  info.samplerate = rate;
  info.channels = 1;
  info.format = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  std::vector<float> taps(static_cast<size_t>(tap + 200), 0.0f);
  taps[static_cast<size_t>(tap)] = 1.0f;
  sf_writef_float(file, taps.data(), static_cast<sf_count_t>(taps.size()));
  sf_close(file);
  return path;
}
}  // namespace

// All wet at full width: each side is its input convolved with the space's response for that
// side (left with left, right with right), from the first sample; all dry: the input itself.
TEST(ConvolutionReverb, WetIsTheSpacesResponseAndDryIsTheInput) {
  for (int32_t space = 0; space < R::kSpaceCount; ++space) {
    const auto plugin = Make(100.0);
    plugin->GetParameter(R::kImpulse).SetWorking(space);
    const KImpulseResponse response = R::SyntheticSpace(space, 48000.0);
    const Channels out = Render(*plugin, Clicks(6000), {512});
    for (size_t i = 0; i < 6000; ++i) {
      ASSERT_NEAR(out[0][i], response.channels[0][i], 1e-6) << "space " << space << " at " << i;
      ASSERT_NEAR(out[1][i], i >= 100 ? 0.5f * response.channels[1][i - 100] : 0.0f, 1e-6) << "space " << space << " at " << i;
    }
  }
  const auto dry = Make(0.0);
  const Channels in = Clicks(3000);
  EXPECT_EQ(Render(*dry, in, {512}), in);
}

// The built-in spaces differ and decay: the hall rings longest, each carries unit energy, and the
// reported tail covers the whole response.
TEST(ConvolutionReverb, BuiltInSpacesAreDistinctAndTheTailCoversThem) {
  double lengths[R::kSpaceCount];
  for (int32_t space = 0; space < R::kSpaceCount; ++space) {
    const KImpulseResponse response = R::SyntheticSpace(space, 48000.0);
    ASSERT_EQ(response.channels.size(), 2u);
    EXPECT_NE(response.channels[0], response.channels[1]);  // decorrelated sides
    double energy = 0.0;
    for (float v : response.channels[0]) energy += static_cast<double>(v) * v;
    EXPECT_NEAR(energy, 1.0, 1e-4);
    lengths[space] = response.Length();
    const auto plugin = Make(100.0);
    plugin->GetParameter(R::kImpulse).SetWorking(space);
    EXPECT_GE(plugin->TailSamples(), static_cast<uint32_t>(response.Length()));
  }
  EXPECT_GT(lengths[1], lengths[2]);
  EXPECT_GT(lengths[2], lengths[0]);
}

// A file set through the state is read and resampled at once (a click at 10 ms of a 24 kHz file
// lands 480 samples late at 48 kHz, spread over twice the samples at half the height, so that its
// gain stays one), stays in the state as its path,
// and an unreadable path keeps the built-in space playing yet is written back unchanged.
TEST(ConvolutionReverb, AFileFromTheStateReplacesTheSpaceAndSurvivesARoundTrip) {
  const std::string path = WriteClick(240, 24000);
  const auto plugin = Make(100.0);
  plugin->SetImpulseResponseFile(KString::FromUtf8(path));
  EXPECT_EQ(plugin->ImpulseResponseFile().ToUtf8(), path);
  const std::string state = plugin->WriteState();
  EXPECT_NE(state.find(path), std::string::npos);

  const auto loaded = Make(100.0);
  loaded->ReadState(state);
  Channels in(2, std::vector<float>(2000, 0.0f));
  in[0][0] = in[1][0] = 1.0f;
  const Channels out = Render(*loaded, in, {512});
  const auto peak = std::max_element(out[0].begin(), out[0].end()) - out[0].begin();
  EXPECT_EQ(peak, 480);
  EXPECT_NEAR(out[0][480], 0.5f, 0.03f);
  EXPECT_NEAR(std::accumulate(out[0].begin(), out[0].end(), 0.0), 1.0, 0.01);
  EXPECT_EQ(out[0], out[1]);  // one channel plays on both sides
  EXPECT_LT(loaded->TailSamples(), 2000u);

  EXPECT_THROW(plugin->SetImpulseResponseFile(KString("/nonexistent/hall.wav")), KException);
  EXPECT_EQ(plugin->ImpulseResponseFile().ToUtf8(), path);  // a failed load changes nothing
  std::filesystem::remove(path);
  const auto missing = Make(100.0);
  missing->ReadState(state);
  EXPECT_EQ(missing->ImpulseResponseFile().ToUtf8(), path);
  EXPECT_EQ(missing->WriteState(), state);
  const Channels fallback = Render(*missing, Clicks(3000), {512});
  const float hall = R::SyntheticSpace(1, 48000.0).channels[0][2000];
  ASSERT_NE(hall, 0.0f);
  EXPECT_NEAR(fallback[0][2000], hall, 1e-6);
}

// Swapping spaces while playing takes the new one at the next block without allocating there;
// clearing the file returns to the built-in space.
TEST(ConvolutionReverb, SwapsSpacesWithoutAllocatingOnTheAudioThread) {
  const std::string path = WriteClick(48, 48000);
  const auto plugin = Make(100.0);
  Channels in(2, std::vector<float>(256, 0.25f));
  Render(*plugin, in, {512});
  plugin->SetImpulseResponseFile(KString::FromUtf8(path));
  std::vector<const float*> x = {in[0].data(), in[1].data()};
  Channels out(2, std::vector<float>(256));
  std::vector<float*> y = {out[0].data(), out[1].data()};
  {
    KAllocationCounter counter;
    plugin->ProcessHostBlock(x.data(), y.data(), 256);
    EXPECT_EQ(counter.Count(), 0);
  }
  // A constant 0.25 through a click at 48 samples: 0 before it, 0.25 after.
  EXPECT_EQ(out[0][47], 0.0f);
  EXPECT_NEAR(out[0][100], 0.25f, 0.02f);
  plugin->SetImpulseResponseFile(KString());
  EXPECT_TRUE(plugin->ImpulseResponseFile().IsEmpty());
  // The hall starts from silence and answers after its 18 ms gap.
  const Channels hall = Render(*plugin, Channels(2, std::vector<float>(2000, 0.25f)), {512});
  EXPECT_LT(std::abs(hall[0][800]), 1e-6f);
  EXPECT_GT(PeakOf(hall, 1000, 2000), 0.01f);
  std::filesystem::remove(path);
}

// The picture of what plays: the loudest of the channels in each slice, in dB below the loudest
// slice; the built-in space chosen, or the file's response once one is loaded.
TEST(ConvolutionReverb, EnvelopeShowsThePeaksOfWhatPlays) {
  KImpulseResponse response;
  response.sampleRate = 1000.0;
  response.channels.assign(2, std::vector<float>(1000, 0.0f));
  response.channels[0][150] = -1.0f;  // slice 1, whichever sign
  response.channels[1][950] = 0.1f;   // slice 9, 20 dB down
  response.channels[0][951] = 0.05f;  // quieter in the same slice: the peak counts
  const std::vector<double> envelope = KImpulseEnvelope(response, 10);
  ASSERT_EQ(envelope.size(), 10u);
  EXPECT_DOUBLE_EQ(envelope[1], 0.0);
  EXPECT_NEAR(envelope[9], -20.0, 1e-6);
  for (size_t s : {0u, 2u, 5u, 8u}) EXPECT_EQ(envelope[s], -180.0);
  EXPECT_EQ(KImpulseEnvelope(KImpulseResponse{}, 4), std::vector<double>(4, -180.0));

  const auto plugin = Make(30.0);
  plugin->GetParameter(R::kImpulse).SetWorking(0);  // Small room: 4 ms gap and 0.5 s
  ASSERT_NE(plugin->PlayingEnvelope(), nullptr);
  EXPECT_NEAR(plugin->PlayingEnvelope()->seconds, 0.504, 1e-4);
  plugin->GetParameter(R::kImpulse).SetWorking(1);  // Hall: 18 ms gap and 2.2 s
  EXPECT_NEAR(plugin->PlayingEnvelope()->seconds, 2.218, 1e-4);
  const std::vector<double>& hall = plugin->PlayingEnvelope()->decibels;
  ASSERT_EQ(hall.size(), size_t(R::kEnvelopeSlices));
  EXPECT_EQ(hall.front(), -180.0);  // the gap before the first reflection
  EXPECT_LT(hall.back(), -50.0);    // 60 dB down at the end

  const std::string path = WriteClick(480, 48000);
  plugin->SetImpulseResponseFile(KString::FromUtf8(path));
  EXPECT_NEAR(plugin->PlayingEnvelope()->seconds, 680.0 / 48000.0, 1e-9);
  const std::vector<double>& click = plugin->PlayingEnvelope()->decibels;
  EXPECT_EQ(std::max_element(click.begin(), click.end()) - click.begin(), 480 * R::kEnvelopeSlices / 680);
  plugin->SetImpulseResponseFile(KString());
  EXPECT_NEAR(plugin->PlayingEnvelope()->seconds, 2.218, 1e-4);
  std::filesystem::remove(path);
}
