#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "core/KChannelMode.h"
#include "tests/core/BlockBuffers.h"
#include "tests/core/RecordingPlugin.h"

#if defined(__SSE__)
#include <xmmintrin.h>
#endif

using testing::ElementsAre;
using Entry = KRecordingPlugin::Entry;

namespace {
constexpr KAudioPlugin::Shape kUnsplit{1, 1, true, false, false};
constexpr KAudioPlugin::Shape kWithSideChain{2, 2, true, false, true};

// The log in one line: "U" for ProcessUpdate, "P<length>" for Process, "N<note>@<offset>".
std::string Trace(const KRecordingPlugin& plugin) {
  std::string trace;
  for (const Entry& entry : plugin.Log()) {
    if (!trace.empty()) trace += ' ';
    if (entry.kind == Entry::kUpdate) trace += "U";
    if (entry.kind == Entry::kProcess) trace += "P" + std::to_string(entry.length);
    if (entry.kind == Entry::kNote) trace += "N" + std::to_string(entry.note) + "@" + std::to_string(entry.length);
  }
  return trace;
}

void Note(KAudioPlugin& plugin, int32_t offset, uint8_t note) { plugin.ScheduleMIDIEvent(offset, {0x90, note, 100, 0}); }

// One block over fresh buffers; the log holds this block only.
void RunBlock(KRecordingPlugin& plugin, KBlockBuffers& buffers, int32_t length) {
  plugin.ClearLog();
  plugin.ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), length);
}

// Where a plug-in's two results land as host left and right, per channel mode, when it writes
// `first` and `second` (mid/side modes convert them back into left and right).
std::pair<float, float> Landing(int32_t mode, float first, float second) {
  switch (mode) {
    case KChannelMode::kMono:
    case KChannelMode::kMonoStereo:
    case KChannelMode::kMonoZeroStereo: return {first + second, first - second};
    case KChannelMode::kStereo:
    case KChannelMode::kStereoZeroMono: return {second + first, second - first};
    case KChannelMode::kLeftRightNegated: return {first, -second};
    default: return {first, second};
  }
}

// What a plug-in that copies its input to its output returns for the host pair (left, right).
std::pair<float, float> PassedThrough(int32_t mode, float left, float right) {
  switch (mode) {
    case KChannelMode::kRight: return {right, left};
    case KChannelMode::kLeftZeroRight: return {left, 0.0f};
    case KChannelMode::kRightZeroLeft: return {right, 0.0f};
    default: return {left, right};
  }
}

// Runs a pass-through plug-in of `shape` once per channel mode and checks every output pair.
void ExpectPassThroughInEveryMode(const KAudioPlugin::Shape& shape) {
  for (int32_t mode = 0; mode < KChannelMode::kCount; ++mode) {
    SCOPED_TRACE(KChannelMode::kNames[mode]);
    KRecordingPlugin plugin(1, shape);
    plugin.SetChannelMode(mode);
    KBlockBuffers buffers(plugin.InputChannelCount(), plugin.OutputChannelCount(), 96);
    RunBlock(plugin, buffers, 96);
    for (int32_t c = 0; c + 1 < plugin.OutputChannelCount(); c += 2) {
      for (int32_t i = 0; i < 96; ++i) {
        const auto [left, right] = PassedThrough(mode, buffers.In(c)[i], buffers.In(c + 1)[i]);
        ASSERT_FLOAT_EQ(buffers.Out(c)[i], left) << "channel " << c << " sample " << i;
        ASSERT_FLOAT_EQ(buffers.Out(c + 1)[i], right) << "channel " << c + 1 << " sample " << i;
      }
    }
  }
}

class ProcessingCycleTest : public testing::Test {
protected:
  KRecordingPlugin plugin;
  KBlockBuffers buffers{2, 2, 64};
};
}  // namespace

TEST_F(ProcessingCycleTest, WithoutRampsOrEventsABlockIsOneCallUpToTheSubBlockCap) {
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "U P64");  // derived values start unset
  RunBlock(plugin, buffers, 1);
  EXPECT_EQ(Trace(plugin), "P1");
  KBlockBuffers large(2, 2, 1500);
  RunBlock(plugin, large, 1500);
  EXPECT_EQ(Trace(plugin), "P1024 P476");
}

TEST_F(ProcessingCycleTest, EventsSplitTheBlockAndArriveBeforeTheirSample) {
  RunBlock(plugin, buffers, 64);
  Note(plugin, 10, 60);
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "P10 N60@10 P54");

  Note(plugin, 0, 60);
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "N60@0 P64");

  // Sorted by offset; equal offsets keep the order of arrival. Late ones come after the audio.
  Note(plugin, 20, 61);
  Note(plugin, 80, 90);
  Note(plugin, 5, 70);
  Note(plugin, 20, 62);
  Note(plugin, 0, 50);
  Note(plugin, 20, 60);
  Note(plugin, 63, 64);
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "N50@0 P5 N70@5 P15 N61@20 N62@20 N60@20 P43 N64@63 P1 N90@80");
}

TEST_F(ProcessingCycleTest, WithoutEventSplittingEventsArriveBeforeTheUncutBlock) {
  KRecordingPlugin unsplit(1, kUnsplit);
  RunBlock(unsplit, buffers, 64);
  Note(unsplit, 30, 61);
  Note(unsplit, 10, 60);
  RunBlock(unsplit, buffers, 64);
  EXPECT_EQ(Trace(unsplit), "N60@10 N61@30 P64");
}

TEST_F(ProcessingCycleTest, ProcessUpdateRunsOncePerSubBlockAndOnlyAfterAChange) {
  RunBlock(plugin, buffers, 64);
  plugin.GetParameter(0).SetNormalized(0.3);
  plugin.GetParameter(1).SetNormalized(0.7);
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "U P64");
  plugin.GetParameter(0).SetNormalized(0.3);  // unchanged
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "P64");

  const KAudioPluginBase::RampPoint points[] = {{0, 0.3}, {16, 0.3}, {48, 0.9}};
  plugin.AddRamp(0, points, false);
  RunBlock(plugin, buffers, 64);
  EXPECT_EQ(Trace(plugin), "P16 P32 U P16");
}

TEST_F(ProcessingCycleTest, ChannelModesNeverWriteTheHostInputs) {
  for (int32_t mode = 0; mode < KChannelMode::kCount; ++mode) {
    SCOPED_TRACE(KChannelMode::kNames[mode]);
    KBlockBuffers fresh(2, 2, 256);
    const std::vector<float> left = fresh.In(0), right = fresh.In(1);
    plugin.SetChannelMode(mode);
    RunBlock(plugin, fresh, 256);
    EXPECT_EQ(fresh.In(0), left);
    EXPECT_EQ(fresh.In(1), right);
  }
}

TEST_F(ProcessingCycleTest, ChannelModesDecideWhereEachResultLands) {
  KRecordingPlugin constant(1, KRecordingPlugin::kEffect, KRecordingPlugin::kChannelNumber);
  for (int32_t mode = 0; mode < KChannelMode::kCount; ++mode) {
    SCOPED_TRACE(KChannelMode::kNames[mode]);
    constant.SetChannelMode(mode);
    RunBlock(constant, buffers, 64);
    const auto [left, right] = Landing(mode, 1.0f, 2.0f);
    EXPECT_THAT(buffers.Out(0), testing::Each(left));
    EXPECT_THAT(buffers.Out(1), testing::Each(right));
  }
}

TEST(ProcessingCycle, PassThroughReturnsTheInputInEveryMode) {
  ExpectPassThroughInEveryMode(KRecordingPlugin::kEffect);
  ExpectPassThroughInEveryMode(kWithSideChain);  // every channel pair is routed alike
}

TEST(ProcessingCycle, LevelMetersReadTheMainChannelsAsTheHostHasThem) {
  KRecordingPlugin stereo(1, KRecordingPlugin::kEffect, KRecordingPlugin::kChannelNumber);
  stereo.SetChannelMode(KChannelMode::kStereo);
  KBlockBuffers buffers(2, 2, 64);
  RunBlock(stereo, buffers, 64);
  EXPECT_EQ(stereo.GetMeter(KAudioPlugin::kOutputLeft).Level(), 3.0f);  // after converting back
  EXPECT_EQ(stereo.GetMeter(KAudioPlugin::kOutputRight).Level(), 1.0f);

  KRecordingPlugin mono(1, {2, 1, true, false, true});
  ASSERT_TRUE(mono.SetChannelsPerBus(1));
  KBlockBuffers monoBuffers(2, 1, 64);
  RunBlock(mono, monoBuffers, 64);
  EXPECT_EQ(mono.GetMeter(KAudioPlugin::kInputLeft).Level(), 0.6875f);  // the signal's peak
  EXPECT_EQ(mono.GetMeter(KAudioPlugin::kInputRight).Level(), 0.0f);    // not the side-chain
}

TEST_F(ProcessingCycleTest, MissingInputsReadAsSilence) {
  RunBlock(plugin, buffers, 64);
  plugin.ClearLog();
  plugin.ProcessHostBlock(nullptr, buffers.Outputs(), 64);
  EXPECT_THAT(buffers.Out(0), testing::Each(0.0f));
  EXPECT_THAT(buffers.Out(1), testing::Each(0.0f));

  const float* leftOnly[] = {buffers.Inputs()[0], nullptr};
  plugin.SetChannelMode(KChannelMode::kMono);
  plugin.ProcessHostBlock(leftOnly, buffers.Outputs(), 64);
  for (int32_t i = 0; i < 64; ++i) {
    ASSERT_FLOAT_EQ(buffers.Out(0)[i], buffers.In(0)[i]);
    ASSERT_EQ(buffers.Out(1)[i], 0.0f);
  }
}

TEST_F(ProcessingCycleTest, MissingOutputsOrSamplesProcessNothingButStillDeliverTheBlocksEvents) {
  for (int32_t variant = 0; variant < 3; ++variant) {
    SCOPED_TRACE(variant);
    KBlockBuffers fresh(2, 2, 64);
    float* leftOnly[] = {fresh.OutData(0), nullptr};
    Note(plugin, 10, 60);
    plugin.ClearLog();
    if (variant == 0) plugin.ProcessHostBlock(fresh.Inputs(), nullptr, 64);
    if (variant == 1) plugin.ProcessHostBlock(fresh.Inputs(), leftOnly, 64);
    if (variant == 2) plugin.ProcessHostBlock(fresh.Inputs(), fresh.Outputs(), 0);
    EXPECT_EQ(Trace(plugin), "N60@10");
    EXPECT_THAT(fresh.Out(0), testing::Each(KBlockBuffers::kUntouched));
    RunBlock(plugin, fresh, 64);  // the message is not delivered a second time
    EXPECT_EQ(Trace(plugin), variant == 0 ? "U P64" : "P64");
  }
}

TEST(ProcessingCycle, BlocksLongerThanTheLongestChunkBehaveAsOneBlock) {
  constexpr int32_t kLength = 2 * KAudioPlugin::kMaxChunk + 1808;
  // With a side-chain the channel mode's copies share their room among four channels.
  for (const KAudioPlugin::Shape& shape : {KRecordingPlugin::kEffect, kWithSideChain}) {
    SCOPED_TRACE(shape.inputBuses);
    KRecordingPlugin plugin(1, shape);
    plugin.SetChannelMode(KChannelMode::kMono);
    KBlockBuffers buffers(plugin.InputChannelCount(), plugin.OutputChannelCount(), kLength);
    const KAudioPluginBase::RampPoint points[] = {{0, 0.0}, {ParameterRamp::kBlockEnd, 1.0}};
    plugin.AddRamp(0, points, false);
    Note(plugin, 5000, 60);
    RunBlock(plugin, buffers, kLength);

    for (int32_t c = 0; c < plugin.OutputChannelCount(); ++c) EXPECT_EQ(buffers.Out(c), buffers.In(c)) << c;
    int32_t start = 0;
    int32_t call = 0;
    for (const Entry& entry : plugin.Log()) {
      if (entry.kind == Entry::kNote) {
        EXPECT_EQ(start, 5000);
      }
      if (entry.kind != Entry::kProcess) continue;
      EXPECT_LE(entry.length, KAudioPluginBase::kDefaultSubBlockCap);
      // The ramp runs across the whole host block, not to the end of a piece of it.
      EXPECT_NEAR(plugin.Seen(call++, 0), static_cast<double>(start) / kLength, 1e-12) << "at " << start;
      start += entry.length;
    }
    EXPECT_EQ(start, kLength);
    EXPECT_EQ(plugin.GetParameter(0).Normalized(), 1.0);
  }
}

#if defined(__SSE__)
TEST_F(ProcessingCycleTest, DenormalsAreFlushedInsideProcessAndTheCallersModeIsRestored) {
  constexpr uint32_t kFlushBits = 0x8040;  // flush-to-zero and denormals-are-zero
  const uint32_t saved = _mm_getcsr();
  for (uint32_t callers : {saved & ~kFlushBits, saved | kFlushBits}) {
    _mm_setcsr(callers);
    RunBlock(plugin, buffers, 64);
    const uint32_t after = _mm_getcsr();
    _mm_setcsr(saved);
    EXPECT_EQ(plugin.Calls()[0].fpuControl & kFlushBits, kFlushBits);
    EXPECT_EQ(after, callers);
  }
}
#endif
