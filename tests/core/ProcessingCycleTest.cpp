#include <gmock/gmock.h>

#include <cmath>
#include <utility>
#include <vector>

#include "core/KLevelMeter.h"

#include "core/KChannelMode.h"
#include "tests/core/RecordingPlugin.h"

using testing::Each;
using M = KChannelMode;
using Entry = KRecordingPlugin::Entry;

namespace {
constexpr KAudioPlugin::Shape kWithSideChain{2, 2, true, false, true};

void Note(KAudioPlugin& plugin, int32_t offset, int note) {
  plugin.ScheduleMIDIEvent(offset, {0x90, static_cast<uint8_t>(note), 100, 0});
}

class ProcessingCycleTest : public testing::Test {
protected:
  std::string Run(int32_t length) { return plugin.Run(buffers, length); }
  KRecordingPlugin plugin;
  KBlockBuffers buffers{2, 2, 1500};
};
}  // namespace

// One call per block up to the cap, one ProcessUpdate for any number of changes; events cut the
// block and arrive in time order, equal offsets in arrival order, late ones after the audio.
TEST_F(ProcessingCycleTest, BlocksAreCutOnlyAtTheSubBlockCapAndAtEvents) {
  EXPECT_EQ(Run(64), "U P64");  // derived values start unset
  EXPECT_EQ(Run(1500), "P1024 P476");
  plugin.GetParameter(0).SetNormalized(0.3);
  plugin.GetParameter(1).SetNormalized(0.7);
  EXPECT_EQ(Run(64), "U P64");
  plugin.GetParameter(0).SetNormalized(0.3);  // unchanged
  EXPECT_EQ(Run(64), "P64");
  Note(plugin, 10, 60);
  EXPECT_EQ(Run(64), "P10 N60@10 P54");
  for (const auto& [offset, note] : {std::pair{20, 61}, {80, 90}, {5, 70}, {20, 62}, {0, 50}, {20, 60}, {63, 64}})
    Note(plugin, offset, note);
  EXPECT_EQ(Run(64), "N50@0 P5 N70@5 P15 N61@20 N62@20 N60@20 P43 N64@63 P1 N90@80");
}

// Modes 3 to 10 work on copies: a plug-in copying its input gets it back, on every channel pair,
// but where the mode only routes (Right swaps the pair, the "zero" ones silence the second).
TEST(ProcessingCycle, PassThroughInEveryModeLeavesTheHostInputsAsTheyWere) {
  for (const KAudioPlugin::Shape& shape : {KRecordingPlugin::kEffect, kWithSideChain}) {
    for (int32_t mode = 0; mode < M::kCount; ++mode) {
      KRecordingPlugin plugin(1, shape);
      plugin.SetChannelMode(mode);
      KBlockBuffers buffers(plugin.InputChannelCount(), plugin.OutputChannelCount(), 96);
      plugin.Run(buffers, 96);
      const bool zero = mode == M::kLeftZeroRight || mode == M::kRightZeroLeft;
      for (int32_t c = 0; c < plugin.InputChannelCount(); c += 2) {
        for (int32_t i = 0; i < 96; ++i) {
          const float left = KBlockBuffers::Signal(c, i), right = KBlockBuffers::Signal(c + 1, i);
          const std::string where = std::string(M::kNames[mode]) + ", channel " + std::to_string(c) + ", sample " + std::to_string(i);
          ASSERT_TRUE(buffers.In(c)[i] == left && buffers.In(c + 1)[i] == right) << where;
          ASSERT_FLOAT_EQ(buffers.Out(c)[i], mode == M::kRight || mode == M::kRightZeroLeft ? right : left) << where;
          ASSERT_FLOAT_EQ(buffers.Out(c + 1)[i], mode == M::kRight ? left : zero ? 0.0f : right) << where;
        }
      }
    }
  }
}

// Where a plug-in writing 1 and 2 lands: mid/side modes convert back (Stereo ones hold side first,
// so their outputs are exchanged). Meters read what the host gets, not a mono side-chain.
TEST_F(ProcessingCycleTest, EachModeDecidesWhereThePluginsResultsLandAndTheMetersReadThem) {
  const std::pair<float, float> landing[M::kCount] = {{1, 2}, {1, 2}, {1, 2},  {3, -1}, {3, 1}, {3, -1}, {1, -2},
                                                      {1, 2}, {1, 2}, {3, -1}, {3, 1},  {1, 2}, {1, 2}};
  KRecordingPlugin constant(1, KRecordingPlugin::kEffect, KRecordingPlugin::kChannelNumber);
  for (int32_t mode = 0; mode < M::kCount; ++mode) {
    constant.SetChannelMode(mode);
    constant.Run(buffers, 64);
    EXPECT_EQ(std::pair(buffers.Out(0)[63], buffers.Out(1)[63]), landing[mode]) << M::kNames[mode];
  }
  EXPECT_EQ(constant.GetMeter(KAudioPlugin::kOutputLeft).Level(), 3.0f);
  KRecordingPlugin mono(1, {2, 1, true, false, true});
  ASSERT_TRUE(mono.SetChannelsPerBus(1));
  KBlockBuffers monoBuffers(2, 1, 64);
  mono.Run(monoBuffers, 64);
  EXPECT_EQ(mono.GetMeter(KAudioPlugin::kInputLeft).Level(), 0.6875f);  // the signal's peak
  EXPECT_EQ(mono.GetMeter(KAudioPlugin::kInputRight).Level(), 0.0f);
  EXPECT_EQ(mono.GetMeter(KAudioPlugin::kOutputLeft).Level(), 0.6875f);
}

TEST_F(ProcessingCycleTest, WithoutOutputsOrSamplesNothingIsProcessedButTheMIDIArrivesOnce) {
  EXPECT_EQ(plugin.LastProcessingTime(), 0u);
  Run(64);
  EXPECT_GT(plugin.LastProcessingTime(), 0u);  // the first block stamps the clock, whatever its length
  for (int32_t variant = 0; variant < 3; ++variant) {
    KBlockBuffers fresh(2, 2, 64);
    float* leftOnly[] = {fresh.OutData(0), nullptr};
    Note(plugin, 10, 60);
    plugin.ClearLog();
    plugin.ProcessHostBlock(fresh.Inputs(), variant == 0 ? nullptr : variant == 1 ? leftOnly : fresh.Outputs(),
                            variant == 2 ? 0 : 64);
    EXPECT_EQ(plugin.Trace(), "N60@10") << variant;
    EXPECT_THAT(fresh.Out(0), Each(KBlockBuffers::kUntouched)) << variant;
    EXPECT_EQ(Run(64), "P64") << variant;  // not delivered a second time
  }
}

// Longer blocks are taken in pieces (shorter with a side-chain) as if whole: a ramp to the block
// end spans the host block, an event lands on its sample.
TEST(ProcessingCycle, BlocksLongerThanTheLongestChunkBehaveAsOneBlock) {
  constexpr int32_t kLength = 2 * KAudioPlugin::kMaxChunk + 1808;
  for (const KAudioPlugin::Shape& shape : {KRecordingPlugin::kEffect, kWithSideChain}) {
    KRecordingPlugin plugin(1, shape);
    plugin.SetChannelMode(M::kMono);
    KBlockBuffers buffers(plugin.InputChannelCount(), plugin.OutputChannelCount(), kLength);
    const KAudioPluginBase::RampPoint points[] = {{0, 0.0}, {ParameterRamp::kBlockEnd, 1.0}};
    plugin.AddRamp(0, points, false);
    Note(plugin, 5000, 60);
    plugin.Run(buffers, kLength);
    for (int32_t c = 0; c < plugin.OutputChannelCount(); ++c) EXPECT_EQ(buffers.Out(c), buffers.In(c)) << c;
    int32_t start = 0, call = 0;
    for (const Entry& entry : plugin.Log()) {
      EXPECT_TRUE(entry.kind != Entry::kNote || start == 5000) << start;
      if (entry.kind != Entry::kProcess) continue;
      EXPECT_NEAR(plugin.Seen(call++, 0), static_cast<double>(start) / kLength, 1e-12) << "at " << start;
      start += entry.length;
    }
    EXPECT_EQ(start, kLength);
  }
}

#if defined(__SSE__)
TEST_F(ProcessingCycleTest, DenormalsAreFlushedInsideProcessAndTheCallersModeIsRestored) {
  constexpr uint32_t kFlushBits = 0x8040;  // flush-to-zero and denormals-are-zero
  const uint32_t saved = _mm_getcsr();
  _mm_setcsr(saved & ~kFlushBits);
  Run(64);
  const uint32_t after = _mm_getcsr();
  _mm_setcsr(saved);
  EXPECT_EQ(plugin.Log().back().fpuControl & kFlushBits, kFlushBits);
  EXPECT_EQ(after, saved & ~kFlushBits);
}
#endif

// A reader polling from another thread sees the loudest block since its last take, though the
// meter was reset after every block in between, and then nothing until more audio comes.
TEST(KLevelMeter, TakenPeakSurvivesResetsUntilTaken) {
  KLevelMeter meter;
  const float loud = -0.75f, soft[2] = {0.25f, -0.5f};
  meter.Accumulate(&loud, 1);
  meter.Reset();
  meter.Accumulate(soft, 2);
  meter.Reset();
  EXPECT_EQ(meter.Level(), 0.0f);
  EXPECT_EQ(meter.TakePeak(), 0.75f);
  EXPECT_EQ(meter.TakePeak(), 0.0f);
  meter.Accumulate(soft, 2);
  EXPECT_EQ(meter.TakePeak(), 0.5f);
}

// The peak of every length (the wide and narrow vector loops and the scalar end), wherever it
// lies, NaN samples skipped (in a vector loop and at the end), and the peak held across calls.
TEST(KLevelMeter, PeakOfAnyLengthSkipsNaN) {
  for (int32_t n : {0, 1, 15, 16, 17, 31, 32, 33, 48, 63, 64, 100}) {
    for (int32_t at : {0, 9, 20, n - 1}) {
      std::vector<float> samples(static_cast<size_t>(n));
      for (int32_t i = 0; i < n; ++i) samples[static_cast<size_t>(i)] = (i % 3 == 0 ? -1.0f : 0.5f) * static_cast<float>(i) / 128.0f;
      if (at >= 0 && at < n) samples[static_cast<size_t>(at)] = -1.5f;
      if (n > 5) samples[5] = NAN;
      if (n > 40) samples[static_cast<size_t>(n - 2)] = NAN;
      KLevelMeter meter;
      meter.Accumulate(samples.data(), n);
      float peak = 0.0f;  // the plain way
      for (float v : samples) peak = std::abs(v) > peak ? std::abs(v) : peak;
      EXPECT_EQ(meter.Level(), peak) << n << " " << at;
      // A pair metered together: each side as alone, the right one with its peak elsewhere.
      std::vector<float> reversed(samples.rbegin(), samples.rend());
      float reversedPeak = 0.25f;  // held from before
      for (float v : reversed) reversedPeak = std::abs(v) > reversedPeak ? std::abs(v) : reversedPeak;
      KLevelMeter left, right;
      const float held = 0.25f;
      right.Accumulate(&held, 1);
      KLevelMeter::AccumulatePair(left, right, samples.data(), reversed.data(), n);
      EXPECT_EQ(left.Level(), peak) << n << " " << at;
      EXPECT_EQ(right.Level(), reversedPeak) << n << " " << at;
      const float louder = 2.0f, quieter = 0.0f;
      meter.Accumulate(&quieter, 1);
      EXPECT_EQ(meter.Level(), peak) << n;
      meter.Accumulate(&louder, 1);
      EXPECT_EQ(meter.Level(), 2.0f) << n;
    }
  }
}
