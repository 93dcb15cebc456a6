#include <gtest/gtest.h>

#include <cstdint>

#include "core/KChannelMode.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/BlockBuffers.h"
#include "tests/core/RecordingPlugin.h"

// Everything a host does on its audio thread, block after block with varying sizes, must run
// without touching the heap once the first block has been processed.
namespace {
using Point = KAudioPluginBase::RampPoint;

constexpr int32_t kBlocks = 400;
constexpr int32_t kLongest = 2 * KAudioPlugin::kMaxChunk + 500;
constexpr int32_t kSizes[] = {1, 17, 64, 128, 333, 1024, 4096, kLongest, 2, 511};

int32_t SizeOf(int32_t block) { return kSizes[block % std::size(kSizes)]; }

// What a host does before block number `block`: automation from its UI thread (here the same
// thread), automation points of the block, MIDI, and now and then a new channel mode.
void PrepareBlock(KAudioPlugin& plugin, int32_t block, int32_t length) {
  const int32_t count = plugin.ParameterCount();
  const double phase = (block % 10) / 10.0;
  plugin.PostValue(block % count, 1.0 - phase, 48);
  const Point posted[] = {{0, phase}, {length / 2, 1.0 - phase}, {length, phase}};
  plugin.PostRamp((block + 3) % count, posted, false);
  const Point points[] = {{length / 3, phase}, {ParameterRamp::kBlockEnd, 1.0 - phase}};
  plugin.AddRamp((block + 1) % count, points, block % 4 == 0);
  plugin.GetParameter((block + 2) % count).SetNormalized(phase);
  for (int32_t e = 0; e < block % 6; ++e)
    plugin.ScheduleMIDIEvent((length * e / 5 + block) % (length + 2), {0x90, static_cast<uint8_t>(60 + e), 100, 0});
  if (block % 7 == 0) plugin.SetChannelMode(block / 7 % KChannelMode::kCount);
  if (block % 50 == 0) plugin.RequestJump();
}

// Runs one warm-up block, then counts the allocations of many more.
int64_t AllocationsOverManyBlocks(KAudioPlugin& plugin, KRecordingPlugin* recorder) {
  KBlockBuffers buffers(plugin.InputChannelCount(), plugin.OutputChannelCount(), kLongest);
  PrepareBlock(plugin, 0, 64);
  plugin.ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), 64);
  KAllocationCounter allocations;
  for (int32_t block = 1; block < kBlocks; ++block) {
    if (recorder) recorder->ClearLog();
    const int32_t length = SizeOf(block);
    PrepareBlock(plugin, block, length);
    plugin.ProcessHostBlock(block % 9 == 0 ? nullptr : buffers.Inputs(), buffers.Outputs(), length);
  }
  return allocations.Count();
}
}  // namespace

TEST(RealtimeAllocation, UtilityPluginProcessesWithoutAllocating) {
  KUtilityPlugin plugin;
  EXPECT_EQ(AllocationsOverManyBlocks(plugin, nullptr), 0);
}

TEST(RealtimeAllocation, RampsEventsAndChannelModesProcessWithoutAllocating) {
  KRecordingPlugin plugin(8, {2, 1, true, false, true});
  EXPECT_EQ(AllocationsOverManyBlocks(plugin, &plugin), 0);
  EXPECT_GT(plugin.Log().size(), 1u);  // the recorder was really driven
}
