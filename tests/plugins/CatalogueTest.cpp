// Every plug-in of the catalogue, created by name at 48 kHz in stereo with every input bus fed (a
// side-chain bus too): finite, audible output at its defaults, and no allocation after its first
// block, whatever the size. The keys are read as the tests are listed: each plug-in gets its own.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <memory>
#include <string>

#include "core/KAudioPlugin.h"
#include "kernel/KEntryPoints.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/BlockBuffers.h"

namespace {
// Host blocks after the first: both extremes, odd sizes and sizes about the processing chunk.
constexpr int32_t kSizes[] = {1, 4096, 17, 2, 511, 4095, 64, 1000, 3, 4096, 1};

class Catalogue : public ::testing::TestWithParam<KString> {};
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
