// A host reads an effect pipeline's slot parameters from a thread of its own while the
// user-interface thread replaces the chain and the audio thread takes chains over: under
// ThreadSanitizer, the test of how the chain reaches readers beside the audio thread.
#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include "core/KParameter.h"
#include "plugins/pipeline/KEffectPipeline.h"

TEST(PipelineThreads, HostReadsSlotTextsWhileTheChainIsReplaced) {
  using P = KEffectPipeline;
  constexpr int32_t kEdits = 150;
  P pipeline;
  ASSERT_TRUE(pipeline.SetSampleRate(48000.0));
  pipeline.AddModule(KString::Static("Equalizer"));
  // Slot 0's first parameter and one beyond the twelfth (the equalizer has it, the others not).
  const int32_t watched[] = {P::ParameterIndex(0, 0), P::ParameterIndex(0, P::kModuleParameters - 1)};
  std::atomic<bool> stop{false};
  std::atomic<int64_t> blocks{0};

  std::thread audio([&] {
    std::vector<float> left(64, 0.1f), right(64, -0.1f);
    float* channels[] = {left.data(), right.data()};
    while (!stop) {
      pipeline.ProcessHostBlock(channels, channels, 64);
      blocks.fetch_add(1);
    }
  });
  int64_t reads = 0, empty = 0, carried = 0;  // the host thread's, read after it joined
  std::thread host([&] {
    while (!stop) {
      for (const int32_t index : watched) {
        const KAudioPluginBase::Parameter& parameter = pipeline.GetParameter(index);
        const std::string text = parameter.Text().ToUtf8();
        double normalized = 0;
        if (text != "-" && parameter.NormalizedFromText(parameter.TextForNormalized(0.5), normalized)) ++carried;
        empty += text.empty();
        ++reads;
      }
    }
  });

  // Slot 0's module replaced again and again, sometimes before the audio thread took the last
  // chain (which then goes unseen, freed at once), sometimes after.
  const char* const keys[] = {"Utility", "Equalizer", "Compressor"};
  for (int32_t edit = 0; edit < kEdits; ++edit) {
    pipeline.RemoveModule(0);
    EXPECT_EQ(pipeline.AddModule(KString::Static(keys[edit % 3]), edit % 2), 0);
    if (edit % 4 == 0) pipeline.MoveModule(0, 1);
    if (edit % 3 == 0)
      for (const int64_t until = blocks + 1; blocks < until;) std::this_thread::yield();
  }
  stop = true;
  audio.join();
  host.join();
  EXPECT_GT(reads, 0);
  EXPECT_EQ(empty, 0);
  EXPECT_GT(carried, 0);
  EXPECT_GT(blocks.load(), 0);
}
