#include <gtest/gtest.h>

#include <initializer_list>
#include <span>

#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"

using Point = KAudioPluginBase::RampPoint;
constexpr int32_t kEnd = ParameterRamp::kBlockEnd;
constexpr int32_t kAudioPool = KAudioPluginBase::kAudioRampCapacity;
constexpr int32_t kPostedPool = KAudioPluginBase::kPostedRampCapacity;

namespace {
// Ramps are observed where they act: the pieces Process is called with, "<length>@<value at start>".
class RampTest : public testing::Test {
protected:
  // More parameters than ramp records, each with a final value no other shares.
  static constexpr int32_t kCount = kAudioPool + 8;
  static double Target(int32_t parameter) { return 0.25 + parameter / 1024.0; }

  double Value(int32_t parameter) const { return plugin.GetParameter(parameter).Normalized(); }
  void ExpectEveryRecordSpare() const {
    EXPECT_EQ(plugin.ActiveRampCount(), 0);
    EXPECT_EQ(plugin.SpareRampCount(), kAudioPool);
  }

  KRecordingPlugin plugin{kCount};
  KBlockBuffers buffers{2, 2, 256};
};
}  // namespace

// Each row through one plug-in: its ramps, its blocks, their pieces for parameter 0 and its last
// value. Every ramp ends inside the row's blocks, so every record is spare again.
TEST_F(RampTest, RampsCutTheBlockAtTheirBreakPointsAndEndOnTheirLastValue) {
  struct Ramp { int32_t parameter; std::vector<Point> points; bool fine = false; };
  struct Row { std::vector<Ramp> ramps; std::vector<int32_t> blocks; const char* pieces; double last; bool jump = false; };
  const Row rows[] = {
      {{{0, {{0, 0.2}, {64, 0.6}}}}, {64}, "64@0.2", 0.6},
      {{{0, {{0, 0.2}, {kEnd, 0.6}}}}, {64}, "64@0.2", 0.6},
      {{{0, {{10, 0.2}, {40, 0.6}}}}, {64}, "10@0.2 30@0.2 24@0.6", 0.6},  // the first value until it starts
      // Clamped only after interpolating; parameter 1 only adds break points.
      {{{0, {{0, -0.3}, {100, 1.7}}}, {1, {{0, 0}, {10, 0}, {50, 0}, {90, 0}, {100, 0}}}}, {100}, "10@0 40@0 40@0.7 10@1", 1.0},
      {{{0, {{0, 0.0}, {20, 0.5}, {20, 0.9}, {40, 0.1}}}}, {64}, "20@0 20@0.9 24@0.1", 0.1},  // equal times: a step
      {{{0, {{0, 0.0}, {48, 0.6}, {96, 0.2}}}}, {64, 64}, "48@0 16@0.6 | 32@0.466667 32@0.2", 0.2},  // past its corner
      {{{0, {{0, 0.0}, {200, 1.0}}}, {0, {{0, 0.5}, {32, 0.25}}}}, {64}, "32@0.5 32@0.25", 0.25},  // replaced
      {{{0, {{0, 0.0}, {kEnd, 1.0}}, true}}, {128}, "32@0 32@0.25 32@0.5 32@0.75", 1.0},  // fine pieces while it lives
      {{{0, {{0, 0.0}, {kEnd, 1.0}}}}, {128}, "128@0", 1.0},
      // A jump applies every last value at once, without a split.
      {{{0, {{10, 0.1}, {20, 0.5}, {30, 0.9}}}, {1, {{0, 0.2}, {32, 0.6}}}}, {64}, "64@0.9", 0.9, true},
  };
  for (const auto& row : rows) {
    for (const Ramp& ramp : row.ramps) EXPECT_TRUE(plugin.AddRamp(ramp.parameter, ramp.points, ramp.fine));
    if (row.jump) plugin.RequestJump();
    std::string pieces;
    for (int32_t length : row.blocks) {
      plugin.Run(buffers, length);
      pieces += (pieces.empty() ? "" : " | ") + plugin.Pieces(0);
    }
    EXPECT_EQ(pieces, row.pieces);
    EXPECT_DOUBLE_EQ(Value(0), row.last) << row.pieces;
    ExpectEveryRecordSpare();
  }
}

TEST_F(RampTest, AnExhaustedPoolAllocatesNothingAndAppliesTheFinalValueAtOnce) {
  int32_t accepted = 0;
  {
    KAllocationCounter allocations;
    for (int32_t p = 0; p < kCount; ++p) {
      const Point points[] = {{0, 0.0}, {64, Target(p)}};
      accepted += plugin.AddRamp(p, points, false) ? 1 : 0;
    }
    EXPECT_EQ(allocations.Count(), 0);
  }
  EXPECT_EQ(accepted, kAudioPool);
  for (int32_t p = kAudioPool; p < kCount; ++p) EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  plugin.Run(buffers, 64);
  for (int32_t p = 0; p < kCount; ++p) EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  ExpectEveryRecordSpare();
}

// Posts start at the next block, a later post replaces one not taken yet; without records left,
// only final values are kept, there from the first sample.
TEST_F(RampTest, PostedRampsStartAtTheNextBlockAndNeverLoseTheirFinalValue) {
  const auto post = [&](int32_t p, std::initializer_list<Point> points) {
    plugin.PostRamp(p, std::span(points.begin(), points.size()), false);
  };
  {
    KAllocationCounter allocations;
    for (int32_t p = 0; p < kPostedPool + 16; ++p) post(p, {{0, 0.0}, {32, Target(p)}});
    post(0, {{0, 0.1}, {32, Target(0)}});
    EXPECT_EQ(allocations.Count(), 0);
  }
  EXPECT_EQ(Value(kPostedPool + 15), 0.0);  // nothing moves before the next block
  plugin.Run(buffers, 64);
  for (int32_t p = 0; p < kPostedPool + 16; ++p) {
    EXPECT_DOUBLE_EQ(plugin.Seen(0, p), p == 0 ? 0.1 : p < kPostedPool ? 0.0 : Target(p)) << p;
    EXPECT_DOUBLE_EQ(Value(p), Target(p)) << p;
  }
  plugin.Run(buffers, 64);  // retired posted records come back at the next block start
  for (int32_t p = 0; p < kPostedPool; ++p) post(p, {{0, 0.0}, {32, 1.0}});
  plugin.Run(buffers, 64);
  EXPECT_EQ(plugin.Pieces(kPostedPool - 1), "32@0 32@1");
  ExpectEveryRecordSpare();
}
