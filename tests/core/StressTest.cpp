#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <cstdint>
#include <thread>

#include "core/KChannelMode.h"
#include "core/KParameter.h"
#include "hosts/KAudioPluginInterface.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/BlockBuffers.h"

// One thread processes the utility plug-in block after block while two others do what a host's
// and an editor's threads do meanwhile. Run under ThreadSanitizer this is the test of the
// hand-over between the threads.
namespace {
using Point = KAudioPluginBase::RampPoint;
constexpr int32_t kIterations = 20000;
constexpr int32_t kBlockSizes[] = {64, 1, 256, 33, 512, 128};

// A clock the automation thread moves by hand, so that gestures time out without sleeping.
class KManualClock final : public KClock {
public:
  uint64_t Milliseconds() const noexcept override { return now.load(std::memory_order_relaxed); }
  std::atomic<uint64_t> now{0};
};

// The host end of automation: counts what reaches it.
class KCountingInterface final : public KAudioPluginInterface {
public:
  KCountingInterface(KAudioPlugin& plugin, const KClock& clock) : KAudioPluginInterface(plugin, "test", clock) {}
  void BeginGesture(int32_t) override { begun.fetch_add(1, std::memory_order_relaxed); }
  void SendAutomationValue(int32_t, double) override { sent.fetch_add(1, std::memory_order_relaxed); }
  void EndGesture(int32_t) override { ended.fetch_add(1, std::memory_order_relaxed); }
  void SendMIDIEvent(int32_t, const uint8_t*) override {}
  void ReportLatency(int32_t) override {}
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }

  std::atomic<int32_t> begun{0}, sent{0}, ended{0};
};

double FinalValue(int32_t parameter) { return 0.125 + parameter * 0.09375; }

class KAudioThread {
public:
  explicit KAudioThread(KAudioPlugin& plugin) : plugin_(plugin), thread_([this] { Run(); }) {}
  ~KAudioThread() { Stop(); }

  // Stops adding automation points of its own and waits until it has processed `count` more
  // blocks.
  void WaitBlocks(int32_t count, bool ownAutomation) {
    // Sequentially consistent: a block that starts after the count was read sees the switch.
    ownAutomation_.store(ownAutomation);
    const int64_t until = blocks_.load() + count;
    while (blocks_.load() < until) std::this_thread::yield();
  }
  void Stop() {
    stop_.store(true, std::memory_order_relaxed);
    if (thread_.joinable()) thread_.join();
  }
  bool OutputStayedFinite() const noexcept { return finite_; }

private:
  void Run() {
    KBlockBuffers buffers(2, 2, 512);
    for (int64_t block = 0; !stop_.load(std::memory_order_relaxed); ++block) {
      const int32_t length = kBlockSizes[block % std::size(kBlockSizes)];
      if (ownAutomation_.load()) {
        const Point points[] = {{0, 0.5}, {length / 2, (block % 11) / 10.0}, {ParameterRamp::kBlockEnd, 0.3}};
        plugin_.AddRamp(static_cast<int32_t>(block % plugin_.ParameterCount()), points, block % 2 == 0);
      }
      plugin_.ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), length);
      for (int32_t c = 0; c < 2; ++c)
        for (int32_t i = 0; i < length; ++i) finite_ = finite_ && std::isfinite(buffers.Out(c)[i]);
      blocks_.store(block + 1);
    }
  }

  KAudioPlugin& plugin_;
  std::atomic<bool> stop_{false};
  std::atomic<bool> ownAutomation_{true};
  std::atomic<int64_t> blocks_{0};
  bool finite_ = true;  // written by the audio thread, read after it joined
  std::thread thread_;
};
}  // namespace

TEST(Stress, AudioThreadWithConcurrentParameterAndAutomationTraffic) {
  KUtilityPlugin plugin;
  KManualClock clock;
  KCountingInterface host(plugin, clock);
  plugin.SetInterface(&host);
  const int32_t count = plugin.ParameterCount();
  KAudioThread audio(plugin);

  std::thread parameters([&] {
    for (int32_t i = 0; i < kIterations; ++i) {
      const int32_t p = i % count;
      const double value = (i % 17) / 16.0;
      plugin.GetParameter(p).SetNormalized(value);
      const Point points[] = {{i % 5, value}, {40 + i % 300, 1.0 - value}, {400, 0.5}};
      plugin.PostRamp((p + 1) % count, points, i % 3 == 0);
      plugin.PostValue((p + 2) % count, 1.0 - value, i % 200);
      if (i % 500 == 0) plugin.SetChannelMode(i / 500 % KChannelMode::kCount);
      if (i % 1500 == 0) plugin.RequestJump();
    }
  });
  std::thread automation([&] {
    for (int32_t i = 0; i < kIterations; ++i) {
      const int32_t p = i % count;
      if (i % 10 == 0) plugin.GetParameter(p).TouchAutomation(KAudioPluginBase::Parameter::kTouch);
      host.SendAutomation(p, plugin.GetParameter(p).Normalized());
      if (i % 10 == 5) plugin.GetParameter(p).TouchAutomation(KAudioPluginBase::Parameter::kRelease);
      clock.now.fetch_add(3, std::memory_order_relaxed);
      if (i % 16 == 0) host.Idle();
    }
  });
  parameters.join();
  automation.join();

  // The last word is a posted value per parameter; the audio thread adds nothing of its own.
  audio.WaitBlocks(2, false);
  for (int32_t p = 0; p < count; ++p) plugin.PostValue(p, FinalValue(p), 100);
  audio.WaitBlocks(8, false);
  audio.Stop();

  EXPECT_TRUE(audio.OutputStayedFinite());
  for (int32_t p = 0; p < count; ++p) {
    const KAudioPluginBase::Parameter& parameter = plugin.GetParameter(p);
    EXPECT_DOUBLE_EQ(parameter.Normalized(), FinalValue(p)) << p;
    EXPECT_DOUBLE_EQ(parameter.Working(), parameter.Kind().ToWorking(FinalValue(p))) << p;
  }
  EXPECT_EQ(plugin.ActiveRampCount(), 0);

  clock.now.fetch_add(KAudioPluginInterface::kGestureTimeoutMs, std::memory_order_relaxed);
  host.Idle();  // every gesture begun has ended
  EXPECT_EQ(host.TouchedCount(), 0);
  EXPECT_EQ(host.begun.load(), host.ended.load());
  EXPECT_GT(host.begun.load(), 0);
  EXPECT_EQ(host.sent.load(), kIterations);
  EXPECT_EQ(plugin.AutomationSending().load(), 0);
}
