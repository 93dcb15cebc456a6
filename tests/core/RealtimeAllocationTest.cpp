#include <gtest/gtest.h>

#include "core/KChannelMode.h"
#include "kernel/KArray.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"

// After its first block, no block touches the heap, whatever its size, ramps, posts, MIDI or mode.
TEST(RealtimeAllocation, RampsEventsAndChannelModesProcessWithoutAllocating) {
  constexpr int32_t kSizes[] = {64, 1, 17, 128, 333, 1024, 4096, 2 * KAudioPlugin::kMaxChunk + 500, 2, 511};
  KUtilityPlugin utility;
  KRecordingPlugin recorder(8, {2, 1, true, false, true});
  for (KAudioPlugin* plugin : std::initializer_list<KAudioPlugin*>{&utility, &recorder}) {
    KBlockBuffers buffers(plugin->InputChannelCount(), plugin->OutputChannelCount(), kSizes[7]);
    const int32_t count = plugin->ParameterCount();
    KAllocationCounter allocations;
    int64_t afterFirst = 0;
    for (int32_t block = 0; block < 400; ++block) {
      const int32_t length = kSizes[block % 10];
      const double phase = (block % 10) / 10.0;
      plugin->PostValue(block % count, 1.0 - phase, 48);
      const KAudioPluginBase::RampPoint posted[] = {{0, phase}, {length / 2, 1.0 - phase}, {length, phase}};
      plugin->PostRamp((block + 3) % count, posted, false);
      const KAudioPluginBase::RampPoint points[] = {{length / 3, phase}, {ParameterRamp::kBlockEnd, 1.0 - phase}};
      plugin->AddRamp((block + 1) % count, points, block % 4 == 0);
      plugin->GetParameter((block + 2) % count).SetNormalized(phase);
      for (int32_t e = 0; e < block % 6; ++e)
        plugin->ScheduleMIDIEvent((length * e / 5 + block) % (length + 2), {0x90, static_cast<uint8_t>(60 + e), 100, 0});
      if (block % 7 == 0) plugin->SetChannelMode(block / 7 % KChannelMode::kCount);
      if (block % 50 == 0) plugin->RequestJump();
      recorder.ClearLog();
      plugin->ProcessHostBlock(block % 9 == 0 ? nullptr : buffers.Inputs(), buffers.Outputs(), length);
      if (block == 0) afterFirst = allocations.Count();
    }
    const int64_t processing = allocations.Count() - afterFirst;
    KArray<int> probe;  // the counter does see a malloc, a realloc of the live block and operator new
    probe.Append(1);
    probe.Append(2);
    const std::vector<int> one(1);
    EXPECT_EQ(allocations.Count() - afterFirst - processing, kAllocationCounterSeesMalloc ? 3 : 1);
    EXPECT_EQ(processing, 0) << (plugin == &utility ? "utility" : "recorder");
  }
  EXPECT_GT(recorder.Log().size(), 1u);  // the recorder was really driven
}
