#include <gtest/gtest.h>

#include <algorithm>
#include <initializer_list>
#include <random>
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
      // Fine: pieces on a grid of 32 counted from the stream's start, moving only on its lines;
      // one that ends between lines holds its last value until the next, in the next block.
      {{{0, {{0, 0.0}, {kEnd, 1.0}}, true}}, {128}, "32@0 32@0.25 32@0.5 32@0.75", 1.0},
      {{{0, {{0, 0.0}, {kEnd, 1.0}}, true}}, {100, 60}, "32@0 32@0.32 32@0.64 4@0.96 | 28@0.96 32@1", 1.0},
      {{{0, {{0, 0.2}, {64, 0.6}}}}, {64}, "64@0.2", 0.6},
      {{{0, {{0, 0.2}, {kEnd, 0.6}}}}, {64}, "64@0.2", 0.6},
      {{{0, {{10, 0.2}, {40, 0.6}}}}, {64}, "10@0.2 30@0.2 24@0.6", 0.6},  // the first value until it starts
      // Clamped only after interpolating; parameter 1 only adds break points.
      {{{0, {{0, -0.3}, {100, 1.7}}}, {1, {{0, 0}, {10, 0}, {50, 0}, {90, 0}, {100, 0}}}}, {100}, "10@0 40@0 40@0.7 10@1", 1.0},
      {{{0, {{0, 0.0}, {20, 0.5}, {20, 0.9}, {40, 0.1}}}}, {64}, "20@0 20@0.9 24@0.1", 0.1},  // equal times: a step
      {{{0, {{0, 0.0}, {48, 0.6}, {96, 0.2}}}}, {64, 64}, "48@0 16@0.6 | 32@0.466667 32@0.2", 0.2},  // past its corner
      {{{0, {{0, 0.0}, {200, 1.0}}}, {0, {{0, 0.5}, {32, 0.25}}}}, {64}, "32@0.5 32@0.25", 0.25},  // replaced
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

// Where start + (end - start) * t / t rounds away from the end, the parameter still lands on the
// ramp's own last value to the bit: a host that sets 0.45 reads back 0.45, coarse or fine, whether
// a block ends on the corner or past it.
TEST_F(RampTest, ARampLandsExactlyOnItsLastValue) {
  struct Case { double from, to; int32_t length; bool fine; std::vector<int32_t> blocks; };
  const Case cases[] = {
      {0.1, 0.45, 48, false, {48}}, {0.7, 0.3, 100, false, {64, 64}}, {0.3, 0.125, 48, false, {17, 64}},
      {0.1, 0.45, 48, true, {64}}, {0.7, 0.3, 100, true, {50, 50, 64}}, {0.3, 0.125, 48, true, {128}},
  };
  for (const Case& c : cases) {
    const Point points[] = {{0, c.from}, {c.length, c.to}};
    ASSERT_TRUE(plugin.AddRamp(0, points, c.fine));
    for (int32_t length : c.blocks) plugin.Run(buffers, length);
    EXPECT_EQ(Value(0), c.to) << c.from << " to " << c.to << (c.fine ? " fine" : "");
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

// A host's lane fed block by block as its own corners (the one before the block, those inside,
// the first after it): every sample sees the lane's value at the grid line before it, the same
// whatever the block size, so the audio cannot depend on where blocks begin.
TEST(FineRampGrid, EverySampleSeesTheSameValueWhateverTheBlockSize) {
  const std::vector<Point> lane = {{1000, 0.5}, {3000, 0.1}, {3000, 0.8}, {7777, 0.3}, {9001, 0.9}};  // a step at 3000
  constexpr int32_t kLength = 10000;
  const auto valuesIn = [&](auto nextBlock) {
    KRecordingPlugin plugin(1);
    plugin.GetParameter(0).SetNormalized(lane.front().value);
    KBlockBuffers buffers(2, 2, 4096);
    std::vector<double> values;
    for (int32_t start = 0, n = 0; start < kLength; start += n) {
      n = std::min(nextBlock(), kLength - start);
      // While the lane holds, before its first corner and after its last, the host sends nothing.
      if (start + n > lane.front().time && start <= lane.back().time) {
        const auto after = std::find_if(lane.begin(), lane.end(), [&](const Point& p) { return p.time > start; });
        std::vector<Point> points = {after == lane.begin() ? Point{0, lane.front().value} : Point{after[-1].time - start, after[-1].value}};
        auto corner = after;
        for (; corner != lane.end() && corner->time < start + n; ++corner) points.push_back({corner->time - start, corner->value});
        points.push_back(corner != lane.end() ? Point{corner->time - start, corner->value} : Point{n, lane.back().value});
        EXPECT_TRUE(plugin.AddRamp(0, points, true));
      }
      plugin.Run(buffers, n);
      for (int32_t call = 0; const KRecordingPlugin::Entry& e : plugin.Log())
        if (e.kind == KRecordingPlugin::Entry::kProcess) values.insert(values.end(), static_cast<size_t>(e.length), plugin.Seen(call++, 0));
    }
    return values;
  };
  const std::vector<double> reference = valuesIn([] { return 512; });
  ASSERT_EQ(reference.size(), static_cast<size_t>(kLength));
  // Each sample holds the lane's value at the grid line at or before it.
  const auto laneAt = [&](int32_t t) {
    const auto next = std::upper_bound(lane.begin(), lane.end(), t, [](int32_t at, const Point& p) { return at < p.time; });
    if (next == lane.begin() || next == lane.end()) return next == lane.end() ? lane.back().value : lane.front().value;
    return next[-1].value + (next->value - next[-1].value) * (t - next[-1].time) / (next->time - next[-1].time);
  };
  for (int32_t s = 0; s < kLength; ++s) EXPECT_NEAR(reference[static_cast<size_t>(s)], laneAt(s / 32 * 32), 1e-12) << s;
  EXPECT_EQ(reference[4000 / 32 * 32], reference[4000 / 32 * 32 + 31]);  // held through a cell
  EXPECT_NE(reference[4000 / 32 * 32], reference[4000 / 32 * 32 + 32]);  // moved at its line
  std::mt19937 random(7);
  std::uniform_int_distribution<int32_t> anySize(1, 4096);
  for (int32_t block : {32, 500, 4096, 0})
    EXPECT_TRUE(valuesIn([&] { return block > 0 ? block : anySize(random); }) == reference) << "blocks of " << (block > 0 ? std::to_string(block) : "random size");
}
