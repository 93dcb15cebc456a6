// The audio thread processes while a host thread sets parameters, posts ramps and sends automation
// and the timer thread (the test's own) idles: under ThreadSanitizer, the test of the hand-over.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <thread>

#include "core/KChannelMode.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/RecordingPlugin.h"

TEST(Stress, AudioThreadWithConcurrentParameterAndAutomationTraffic) {
  using Point = KAudioPluginBase::RampPoint;
  constexpr int32_t kIterations = 20000;
  KUtilityPlugin plugin;
  KHandDrivenClock clock;
  KRecordingHost host(plugin, "test", clock);
  host.logging = false;  // counts only
  plugin.SetInterface(&host);
  const int32_t count = plugin.ParameterCount();
  std::atomic<bool> stop{false}, ownRamps{true}, trafficDone{false};
  std::atomic<int64_t> blocks{0};
  bool finite = true;  // written by the audio thread, read after it joined
  std::thread audio([&] {
    KBlockBuffers buffers(2, 2, 512);
    for (int64_t block = 0; !stop; ++block) {
      const int32_t length = std::array{64, 1, 256, 33, 512, 128}[block % 6];
      const Point points[] = {{0, 0.5}, {length / 2, (block % 11) / 10.0}, {ParameterRamp::kBlockEnd, 0.3}};
      if (ownRamps) plugin.AddRamp(static_cast<int32_t>(block % count), points, block % 2 == 0);
      plugin.ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), length);
      for (int32_t i = 0; i < length; ++i) finite = finite && std::isfinite(buffers.Out(0)[i] + buffers.Out(1)[i]);
      blocks.store(block + 1);
    }
  });
  const auto awaitBlocks = [&](int64_t n) {
    for (const int64_t until = blocks + n; blocks < until;) std::this_thread::yield();
  };
  std::thread traffic([&] {
    for (int32_t i = 0; i < kIterations; ++i) {
      const int32_t p = i % count;
      const double value = (i % 17) / 16.0;
      plugin.GetParameter(p).SetNormalized(value);
      const Point points[] = {{i % 5, value}, {40 + i % 300, 1.0 - value}, {400, 0.5}};
      plugin.PostRamp((p + 1) % count, points, i % 3 == 0);
      plugin.PostValue((p + 2) % count, 1.0 - value, i % 200);
      if (i % 10 == 0) plugin.GetParameter(p).TouchAutomation(KAudioPluginBase::Parameter::kTouch);
      host.SendAutomation(p, plugin.GetParameter(p).Normalized());
      if (i % 10 == 5) plugin.GetParameter(p).TouchAutomation(KAudioPluginBase::Parameter::kRelease);
      clock.now += 3;
      if (i % 500 == 0) plugin.SetChannelMode(i / 500 % KChannelMode::kCount);
      if (i % 200 == 0) awaitBlocks(1);  // so that the threads truly overlap
    }
    trafficDone = true;
  });
  for (; !trafficDone; std::this_thread::yield()) host.Idle();
  traffic.join();

  ownRamps = false;  // the last word is a posted value per parameter
  awaitBlocks(2);
  for (int32_t p = 0; p < count; ++p) plugin.PostValue(p, 0.125 + p * 0.09375, 100);
  awaitBlocks(8);
  stop = true;
  audio.join();
  EXPECT_TRUE(finite);
  for (int32_t p = 0; p < count; ++p) EXPECT_DOUBLE_EQ(plugin.GetParameter(p).Normalized(), 0.125 + p * 0.09375) << p;
  EXPECT_EQ(plugin.ActiveRampCount(), 0);
  clock.now += KAudioPluginInterface::kGestureTimeoutMs;
  host.Idle();  // every gesture begun has ended
  EXPECT_EQ(host.TouchedCount(), 0);
  EXPECT_EQ(host.begun.load(), host.ended.load());
  EXPECT_GT(host.begun.load(), 0);
  EXPECT_EQ(host.sent.load(), kIterations);
  EXPECT_EQ(plugin.AutomationSending().load(), 0);
}
