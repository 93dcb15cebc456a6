#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <initializer_list>
#include <span>
#include <vector>

#include "tests/core/AllocationCounter.h"
#include "tests/core/BlockBuffers.h"
#include "tests/core/RecordingPlugin.h"

using testing::ElementsAre;
using Point = KAudioPluginBase::RampPoint;
constexpr int32_t kBlockEnd = ParameterRamp::kBlockEnd;

namespace {
// Ramps are driven through whole host blocks and observed where they act: the normalised value
// each parameter holds at the start of every Process call.
class RampTest : public testing::Test {
protected:
  explicit RampTest(int32_t parameterCount = 4) : plugin(parameterCount) {}

  bool Add(int32_t parameter, std::initializer_list<Point> points, bool fine = false) {
    return plugin.AddRamp(parameter, std::span(points.begin(), points.size()), fine);
  }
  void Post(int32_t parameter, std::initializer_list<Point> points) {
    plugin.PostRamp(parameter, std::span(points.begin(), points.size()), false);
  }
  void Block(int32_t length) {
    plugin.ClearLog();
    plugin.ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), length);
  }
  double Value(int32_t parameter) const { return plugin.GetParameter(parameter).Normalized(); }
  void ExpectEveryRecordSpare() const {
    EXPECT_EQ(plugin.ActiveRampCount(), 0);
    EXPECT_EQ(plugin.SpareRampCount(), KAudioPluginBase::kAudioRampCapacity);
  }

  KRecordingPlugin plugin;
  KBlockBuffers buffers{2, 2, 256};
};

// A final value per parameter that no other parameter shares.
double Target(int32_t parameter) { return 0.25 + parameter / 1024.0; }

class RampPoolTest : public RampTest {
protected:
  RampPoolTest() : RampTest(KAudioPluginBase::kAudioRampCapacity + 8) {}
};
}  // namespace

TEST_F(RampTest, RampOverTheWholeBlockIsOneSubBlockEndingAtItsTarget) {
  for (int32_t end : {64, kBlockEnd}) {
    SCOPED_TRACE(end);
    plugin.GetParameter(0).SetNormalized(0.0);
    EXPECT_TRUE(Add(0, {{0, 0.2}, {end, 0.6}}));
    Block(64);
    EXPECT_THAT(plugin.Lengths(), ElementsAre(64));
    EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.2);
    EXPECT_DOUBLE_EQ(Value(0), 0.6);
    ExpectEveryRecordSpare();
    Block(64);
    EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.6);
  }
}

TEST_F(RampTest, RampStartingInsideTheBlockSplitsAtItsStartAndItsEnd) {
  Add(0, {{10, 0.2}, {40, 0.6}});
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(10, 30, 24));
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.2);  // before the start: the first value
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 0), 0.2);  // the slope begins here
  EXPECT_DOUBLE_EQ(plugin.Seen(2, 0), 0.6);
  EXPECT_EQ(Value(1), 0.0);
  ExpectEveryRecordSpare();
}

TEST_F(RampTest, BlockEndSentinelBecomesTheBlockLength) {
  Add(0, {{0, 0.0}, {kBlockEnd, 1.0}});
  Add(1, {{0, 0.0}, {25, 1.0}});
  Block(100);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(25, 75));
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 0), 0.25);
  EXPECT_DOUBLE_EQ(Value(0), 1.0);
}

TEST_F(RampTest, ValuesOutsideTheRangeAreClampedOnlyAfterInterpolation) {
  Add(0, {{0, -0.3}, {100, 1.7}});
  Add(1, {{0, 0.0}, {10, 0.0}, {50, 0.0}, {90, 0.0}, {100, 0.0}});  // break points only
  Block(100);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(10, 40, 40, 10));
  EXPECT_EQ(plugin.Seen(0, 0), 0.0);  // -0.3
  EXPECT_EQ(plugin.Seen(1, 0), 0.0);  // -0.1
  EXPECT_DOUBLE_EQ(plugin.Seen(2, 0), 0.7);
  EXPECT_EQ(plugin.Seen(3, 0), 1.0);  // 1.5
  EXPECT_EQ(Value(0), 1.0);
}

TEST_F(RampTest, JumpAppliesEveryLastValueAtOnceAndIsConsumed) {
  Add(0, {{0, 0.2}, {32, 0.6}});
  Add(1, {{10, 0.1}, {20, 0.5}, {30, 0.9}});
  plugin.RequestJump();
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(64));
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.6);
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 1), 0.9);
  ExpectEveryRecordSpare();

  Add(0, {{0, 0.0}, {32, 1.0}});
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(32, 32));
}

TEST_F(RampTest, CornersArePassedAndTheRampLivesOnIntoTheNextBlock) {
  Add(0, {{0, 0.0}, {48, 0.6}, {96, 0.2}});
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(48, 16));
  EXPECT_EQ(plugin.Calls()[1].activeRamps, 1);  // the corner did not retire it
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 0), 0.6);
  const double atBlockEnd = 0.6 - 0.4 * 16.0 / 48.0;
  EXPECT_DOUBLE_EQ(Value(0), atBlockEnd);
  EXPECT_EQ(plugin.ActiveRampCount(), 1);
  EXPECT_EQ(plugin.SpareRampCount(), KAudioPluginBase::kAudioRampCapacity - 1);

  Block(64);  // times continue relative to the new block: 32 samples of the last segment remain
  EXPECT_THAT(plugin.Lengths(), ElementsAre(32, 32));
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), atBlockEnd);
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 0), 0.2);
  ExpectEveryRecordSpare();
}

TEST_F(RampTest, CornersAtTheSameTimeMakeAStep) {
  Add(0, {{0, 0.0}, {20, 0.5}, {20, 0.9}, {40, 0.1}});
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(20, 20, 24));
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 0), 0.9);
  EXPECT_DOUBLE_EQ(plugin.Seen(2, 0), 0.1);
  ExpectEveryRecordSpare();
}

TEST_F(RampTest, FineRampCutsTheBlockAtTheFineCapWhileItLives) {
  constexpr int32_t kFine = KAudioPluginBase::kDefaultFineSubBlockCap;
  Add(0, {{0, 0.0}, {kBlockEnd, 1.0}}, true);
  Block(4 * kFine);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(kFine, kFine, kFine, kFine));
  for (int32_t call = 0; call < 4; ++call) EXPECT_DOUBLE_EQ(plugin.Seen(call, 0), call / 4.0);

  Add(0, {{0, 0.0}, {kBlockEnd, 1.0}}, false);
  Block(4 * kFine);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(4 * kFine));
}

TEST_F(RampTest, AddingARampReplacesTheRampOfTheSameParameter) {
  Add(0, {{0, 0.0}, {64, 1.0}});
  Add(1, {{0, 0.0}, {64, 1.0}});
  Add(0, {{0, 0.5}, {32, 0.25}});
  EXPECT_EQ(plugin.ActiveRampCount(), 2);
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(32, 32));
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.5);
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 1), 0.5);
  EXPECT_DOUBLE_EQ(Value(0), 0.25);
  ExpectEveryRecordSpare();
}

TEST_F(RampTest, UnusablePointListsStillDeliverTheirLastValue) {
  EXPECT_FALSE(Add(0, {{5, 0.3}}));
  EXPECT_DOUBLE_EQ(Value(0), 0.3);
  std::vector<Point> tooMany(ParameterRamp::kMaxPoints + 1, Point{0, 0.7});
  EXPECT_FALSE(plugin.AddRamp(1, tooMany, false));
  EXPECT_DOUBLE_EQ(Value(1), 0.7);
  EXPECT_FALSE(Add(-1, {{0, 0.1}, {10, 0.2}}));
  EXPECT_FALSE(Add(4, {{0, 0.1}, {10, 0.2}}));
  ExpectEveryRecordSpare();
}

TEST_F(RampTest, PostedRampsStartAtTheNextBlockAndALaterPostReplaces) {
  Post(0, {{0, 0.0}, {32, 0.3}});
  Post(0, {{0, 0.1}, {32, 0.9}});
  EXPECT_EQ(Value(0), 0.0);  // nothing moves before the audio thread takes it
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(32, 32));
  EXPECT_EQ(plugin.Calls()[0].activeRamps, 1);
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 0), 0.1);
  EXPECT_DOUBLE_EQ(Value(0), 0.9);

  plugin.GetParameter(1).SetNormalized(0.2);
  plugin.PostValue(1, 0.8, 64);  // glides from the present value, in fine sub-blocks
  Block(64);
  EXPECT_THAT(plugin.Lengths(), ElementsAre(32, 32));
  EXPECT_DOUBLE_EQ(plugin.Seen(0, 1), 0.2);
  EXPECT_DOUBLE_EQ(plugin.Seen(1, 1), 0.5);
  EXPECT_DOUBLE_EQ(Value(1), 0.8);
}

TEST_F(RampPoolTest, ExhaustedAudioPoolAllocatesNothingAndAppliesTheFinalValueAtOnce) {
  const int32_t count = plugin.ParameterCount();
  int32_t accepted = 0;
  {
    KAllocationCounter allocations;
    for (int32_t p = 0; p < count; ++p) accepted += Add(p, {{0, 0.0}, {64, Target(p)}}) ? 1 : 0;
    EXPECT_EQ(allocations.Count(), 0);
  }
  EXPECT_EQ(accepted, KAudioPluginBase::kAudioRampCapacity);
  EXPECT_EQ(plugin.SpareRampCount(), 0);
  for (int32_t p = accepted; p < count; ++p) EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  Block(64);
  for (int32_t p = 0; p < count; ++p) EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  ExpectEveryRecordSpare();
}

TEST_F(RampPoolTest, ExhaustedPostedPoolKeepsFinalValuesForTheNextBlock) {
  const int32_t count = KAudioPluginBase::kPostedRampCapacity + 16;
  {
    KAllocationCounter allocations;
    for (int32_t p = 0; p < count; ++p) Post(p, {{0, 0.0}, {32, Target(p)}});
    EXPECT_EQ(allocations.Count(), 0);
  }
  for (int32_t p = 0; p < count; ++p) EXPECT_EQ(Value(p), 0.0) << p;
  Block(64);
  EXPECT_EQ(plugin.Calls()[0].activeRamps, KAudioPluginBase::kPostedRampCapacity);
  for (int32_t p = 0; p < count; ++p) {  // overflow values are there from the first sample
    EXPECT_DOUBLE_EQ(plugin.Seen(0, p), p < KAudioPluginBase::kPostedRampCapacity ? 0.0 : Target(p)) << p;
    EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  }

  // Retired posted records come back: a full round of posts finds a record each again.
  Block(64);
  for (int32_t p = 0; p < KAudioPluginBase::kPostedRampCapacity; ++p) Post(p, {{0, 0.0}, {32, 1.0}});
  Block(64);
  EXPECT_EQ(plugin.Calls()[0].activeRamps, KAudioPluginBase::kPostedRampCapacity);
  EXPECT_EQ(plugin.Seen(0, 0), 0.0);
  EXPECT_EQ(Value(0), 1.0);
  ExpectEveryRecordSpare();
}
