// Every plug-in of the catalogue, created by name at 48 kHz in stereo with every input bus fed (a
// side-chain bus too): finite, audible output at its defaults, and no allocation after its first
// block, whatever the size; a NaN or infinity spoils no more than its block; silence comes out
// as exact zeros; the host's block size changes no bit; the state and every factory preset load
// exactly; the latency and tail reported hold for an impulse. The keys are read as the tests are
// listed: each plug-in gets its own.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <initializer_list>
#include <limits>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/BlockBuffers.h"
#include "tests/plugins/PluginRender.h"

namespace {
// Host blocks after the first: both extremes, odd sizes and sizes about the processing chunk.
constexpr int32_t kSizes[] = {1, 4096, 17, 2, 511, 4095, 64, 1000, 3, 4096, 1};

constexpr double kRate = 48000.0;

class Catalogue : public ::testing::TestWithParam<KString> {
protected:
  static std::unique_ptr<KAudioPlugin> Make() {
    std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(GetParam()));
    if (plugin && !(plugin->SetSampleRate(kRate) && plugin->SetChannelsPerBus(2))) plugin.reset();
    return plugin;
  }
  const KPluginDescription& Description() const {
    static const KPluginDescription none{};
    const KPluginDescription* found = KFindDescription(KProductCatalogue(), GetParam().ToUtf8());
    return found ? *found : none;
  }
};

// The input channels: the test signal from `from` on, an impulse or silence before it.
Channels Inputs(const KAudioPlugin& plugin, size_t length, size_t from) {
  Channels in(static_cast<size_t>(plugin.InputChannelCount()), std::vector<float>(length));
  for (size_t c = 0; c < in.size(); ++c)
    for (size_t i = from; i < length; ++i) in[c][i] = KBlockBuffers::Signal(static_cast<int32_t>(c), static_cast<int32_t>(i));
  return in;
}

// The first sample from `from` on that breaks `holds` in any channel, or the length.
template <class Holds>
size_t FirstBreak(const Channels& out, size_t from, Holds holds) {
  size_t first = out.empty() ? 0 : out[0].size();
  for (const auto& channel : out)
    for (size_t i = from; i < first; ++i)
      if (!holds(channel[i])) first = i;
  return first;
}

// Moves every parameter away from its default, each to a different place.
void Scatter(KAudioPlugin& plugin) {
  for (int32_t p = 0; p < plugin.ParameterCount(); ++p) plugin.GetParameter(p).SetNormalized(std::fmod(0.13 + 0.37 * p, 1.0));
}

bool Finite(float v) { return std::isfinite(v); }

// Plays `in` in blocks of `sizes` in turn while the host plays at 120 BPM from `startQuarter`:
// each block is told the song position at its start.
Channels RenderPlaying(KAudioPlugin& plugin, const Channels& in, std::span<const int32_t> sizes, double startQuarter) {
  constexpr double kSamplesPerQuarter = kRate * 60.0 / 120.0;
  KTransport& transport = plugin.Transport();
  transport.tempo = 120.0;
  transport.flags = KTransport::kPlaying;
  return RenderWith(plugin, in, sizes, [&](size_t at) { transport.songPosition = startQuarter + static_cast<double>(at) / kSamplesPerQuarter; });
}
}  // namespace

// Names each test's plug-in in the test list, where ctest takes it into the test's name.
static void PrintTo(const KString& key, std::ostream* out) { *out << key.ToUtf8(); }

// Without a list or a counter that sees this binary's allocations, the tests below prove nothing.
TEST(CatalogueList, HoldsPluginsAndAllocationsAreCounted) {
  EXPECT_GT(GetTorvanePluginList().Count(), 0);
  KAllocationCounter counter;
  const auto one = std::make_unique<int>(1);
  EXPECT_EQ(counter.Count(), 1);
}

TEST_P(Catalogue, MakesFiniteSoundAtDefaultsAndAllocatesNothingAfterTheFirstBlock) {
  const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(GetParam()));
  ASSERT_NE(plugin, nullptr);
  ASSERT_TRUE(plugin->SetSampleRate(48000.0) && plugin->SetChannelsPerBus(2));
  ASSERT_EQ(plugin->OutputChannelCount(), 2);
  // Every input channel carries a signal of its own (peaks of 11/16). Outputs start each block as
  // NaN, so a sample the plug-in leaves unwritten counts as not finite.
  KBlockBuffers buffers(plugin->InputChannelCount(), 2, 4096);
  int64_t notFinite = 0;
  float peak = 0.0f;
  auto play = [&](int32_t n) {
    for (int32_t c = 0; c < 2; ++c) std::fill_n(buffers.OutData(c), n, std::numeric_limits<float>::quiet_NaN());
    KAllocationCounter counter;
    plugin->ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), n);
    const int64_t allocations = counter.Count();
    for (int32_t c = 0; c < 2; ++c)
      for (int32_t i = 0; i < n; ++i) {
        const float v = buffers.OutData(c)[i];
        if (std::isfinite(v)) peak = std::max(peak, std::abs(v)); else ++notFinite;
      }
    return allocations;
  };
  play(512);  // the first block may set things up
  for (int32_t n : kSizes) EXPECT_EQ(play(n), 0) << "block of " << n;
  EXPECT_EQ(notFinite, 0);
  EXPECT_GT(peak, 0.1f * 11.0f / 16.0f);  // every default passes sound within 20 dB of the input
  EXPECT_NE(plugin->TailSamples(), KAudioPlugin::kInfiniteTail);  // each says how long it rings
  RecordProperty("output_peak", std::to_string(peak));
}

INSTANTIATE_TEST_SUITE_P(Plugins, Catalogue, ::testing::ValuesIn(GetTorvanePluginList().begin(), GetTorvanePluginList().end()));

// A NaN or an infinity in every input channel at once, in the middle of a block: what comes out
// once that block (and the latency behind it) has passed is finite, and sound again.
TEST_P(Catalogue, NonFiniteInputSpoilsAtMostItsBlock) {
  constexpr size_t kBlock = 256, kSpoiled = 3;
  for (const float bad : {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
                          -std::numeric_limits<float>::infinity()}) {
    const auto plugin = Make();
    ASSERT_NE(plugin, nullptr);
    Channels in = Inputs(*plugin, 24 * kBlock, 0);
    for (auto& channel : in) channel[kSpoiled * kBlock + 100] = bad;
    const Channels out = Render(*plugin, in, {kBlock});
    const size_t clean = (kSpoiled + 1) * kBlock + static_cast<size_t>(plugin->TotalLatency());
    EXPECT_EQ(FirstBreak(out, clean, Finite), out[0].size()) << "after " << bad;
    EXPECT_GT(PeakOf(out, out[0].size() - 8 * kBlock, SIZE_MAX), 0.01f) << "silent after " << bad;
  }
}

// Sound, then silence: after the latency and a few times the tail every output sample is exactly
// zero (no denormals left decaying, no offset), and stays so.
TEST_P(Catalogue, SilenceDecaysToExactZero) {
  const auto plugin = Make();
  ASSERT_NE(plugin, nullptr);
  const size_t sound = 4800;
  const size_t settle = static_cast<size_t>(plugin->TotalLatency()) + 6 * static_cast<size_t>(plugin->TailSamples()) + 4096;
  Channels in = Inputs(*plugin, sound + settle + 4096, 0);
  for (auto& channel : in) std::fill(channel.begin() + sound, channel.end(), 0.0f);
  const Channels out = Render(*plugin, in, {512});
  EXPECT_EQ(FirstBreak(out, sound + settle, [](float v) { return v == 0.0f; }), out[0].size())
      << "latency " << plugin->TotalLatency() << ", tail " << plugin->TailSamples();
}

// The same input in host blocks of every size, with no automation: the same output, bit for bit.
TEST_P(Catalogue, OutputDoesNotDependOnTheHostBlockSize) {
  const auto whole = Make(), pieces = Make();
  ASSERT_NE(whole, nullptr);
  const Channels in = Inputs(*whole, 12000, 0);
  const Channels a = Render(*whole, in, {4096});
  const Channels b = Render(*pieces, in, {1, 17, 511, 2, 4095, 64, 1000, 3, 333});
  for (size_t c = 0; c < a.size(); ++c) {
    const auto differs = std::mismatch(a[c].begin(), a[c].end(), b[c].begin(),
                                       [](float x, float y) { return std::memcmp(&x, &y, sizeof x) == 0; });
    EXPECT_EQ(differs.first, a[c].end()) << "channel " << c << " differs from sample " << (differs.first - a[c].begin());
  }
}

// The state's LFOs moving every automatable parameter, one LFO free and one synced to a host
// that plays from a position off the beat at 120 BPM (the song position told with each block),
// over the plug-in's own LFOs where it has them: the same output at one block size and at many,
// random ones among them, bit for bit.
TEST_P(Catalogue, OutputDoesNotDependOnTheHostBlockSizeWithModulationActive) {
  const auto whole = Make(), pieces = Make();
  ASSERT_NE(whole, nullptr);
  std::string lfos[2] = {"<LFO Shape=\"Sine\" Rate=\"7.3\" Phase=\"0.1\">", "<LFO Shape=\"Random smooth\" Note=\"1/16\">"};
  for (int32_t p = 0; p < whole->ParameterCount(); ++p)
    if (whole->GetParameter(p).IsAutomatable())
      lfos[p % 2] += "<Target Parameter=\"" + whole->GetParameter(p).Key().ToUtf8() + "\" Depth=\"0.3\"/>";
  const std::string state = "<TorvaneState><LFOs>" + lfos[0] + "</LFO>" + lfos[1] + "</LFO></LFOs></TorvaneState>";
  whole->ReadState(state);
  pieces->ReadState(state);
  ASSERT_FALSE(whole->LFOs().ChildCount() == 0);

  std::mt19937 random(GetParam().ToUtf8().size());
  std::uniform_int_distribution<int32_t> size(1, 4096);
  std::vector<int32_t> sizes = {1, 64, 500, 4096, 1, 2};
  for (int i = 0; i < 24; ++i) sizes.push_back(size(random));
  const Channels in = Inputs(*whole, 24000, 0);
  const int32_t one[] = {4096};
  const Channels a = RenderPlaying(*whole, in, one, 1.37);
  const Channels b = RenderPlaying(*pieces, in, sizes, 1.37);
  EXPECT_GT(PeakOf(a, 0, SIZE_MAX), 0.0f);
  for (size_t c = 0; c < a.size(); ++c) {
    const auto differs = std::mismatch(a[c].begin(), a[c].end(), b[c].begin(),
                                       [](float x, float y) { return std::memcmp(&x, &y, sizeof x) == 0; });
    EXPECT_EQ(differs.first, a[c].end()) << "channel " << c << " differs from sample " << (differs.first - a[c].begin());
  }
}

// Every parameter away from its default, stored and loaded into a fresh instance: the same
// document again, the same values, and the same sound bit for bit.
TEST_P(Catalogue, StateRoundTripIsExact) {
  const auto stored = Make(), loaded = Make();
  ASSERT_NE(stored, nullptr);
  Scatter(*stored);
  const std::string text = stored->WriteState();
  loaded->ReadState(text);
  EXPECT_EQ(loaded->WriteState(), text);
  for (int32_t p = 0; p < stored->ParameterCount(); ++p)
    EXPECT_EQ(loaded->GetParameter(p).Working(), stored->GetParameter(p).Working()) << stored->GetParameter(p).Key().ToUtf8();
  const Channels in = Inputs(*stored, 6000, 0);
  EXPECT_EQ(Render(*loaded, in, {512}), Render(*stored, in, {512}));
}

// At least three factory presets of distinct names; each sets the values it names, returns every
// other parameter to where a fresh instance's preset load puts it (its default, or the value of a
// module the preset brings), and plays finite sound.
TEST_P(Catalogue, EveryFactoryPresetLoads) {
  const auto presets = Description().presets;
  EXPECT_GE(presets.size(), 3u);
  std::set<std::string> names;
  for (const KFactoryPreset& preset : presets) {
    ASSERT_TRUE(preset.name && *preset.name);
    EXPECT_TRUE(names.insert(preset.name).second) << "two presets named " << preset.name;
    const auto plugin = Make();
    ASSERT_NE(plugin, nullptr);
    Scatter(*plugin);
    ASSERT_NO_THROW(plugin->LoadFactoryPreset(preset)) << preset.name;
    EXPECT_EQ(plugin->ActivePresetName().ToUtf8(), preset.name);
    const auto fresh = Make();
    fresh->LoadFactoryPreset(preset);
    for (int32_t p = 0; p < plugin->ParameterCount(); ++p) {
      const auto& parameter = plugin->GetParameter(p);
      double expected = fresh->GetParameter(p).Working();
      for (const auto& value : preset.values)
        if (parameter.Key().ToUtf8() == value.key) expected = value.working;
      EXPECT_NEAR(parameter.Working(), expected, 1e-9 * std::max(1.0, std::abs(expected)))
          << preset.name << ": " << parameter.Key().ToUtf8();
    }
    const Channels out = Render(*plugin, Inputs(*plugin, 4096, 0), {512});
    EXPECT_EQ(FirstBreak(out, 0, Finite), out[0].size()) << preset.name;
  }
}

// An impulse after rest: its response reaches half its peak no sooner than the reported latency
// (a linear-phase filter may ring a little ahead of it, and an effect may delay on purpose), and
// once the latency and the reported tail have passed it has fallen below −100 dB.
TEST_P(Catalogue, ImpulseRespectsTheReportedLatencyAndTail) {
  const auto plugin = Make();
  ASSERT_NE(plugin, nullptr);
  Render(*plugin, Channels(static_cast<size_t>(plugin->InputChannelCount()), std::vector<float>(512)), {512});
  const auto latency = static_cast<size_t>(plugin->TotalLatency());
  const auto tail = static_cast<size_t>(plugin->TailSamples());
  Channels in = Inputs(*plugin, latency + tail + 4096, SIZE_MAX);
  for (auto& channel : in) channel[0] = 1.0f;
  const Channels out = Render(*plugin, in, {512});
  const float half = 0.5f * PeakOf(out, 0, SIZE_MAX);
  ASSERT_GT(half, 0.0f) << "no response";
  EXPECT_GE(FirstBreak(out, 0, [half](float v) { return std::abs(v) < half; }), latency) << "the response comes early";
  EXPECT_LT(PeakOf(out, latency + tail + 1, SIZE_MAX), 1e-5f) << "latency " << latency << ", tail " << tail;
}
