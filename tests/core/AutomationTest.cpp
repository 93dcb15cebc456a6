// The host interface: gestures around sends, their quiet-time end, the sending counter, latency.
#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>

#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"

namespace {
using Gesture = KAudioPluginBase::Parameter;

class AutomationTest : public ::testing::Test {
protected:
  AutomationTest() { plugin.SetInterface(&host); }
  ~AutomationTest() override { plugin.SetInterface(nullptr); }
  // Moves the clock on, runs the interface's timer and answers what the host saw since the last look.
  std::string IdleAfter(uint64_t milliseconds) {
    clock.now += milliseconds;
    host.Idle();
    return host.Take();
  }

  KHandDrivenClock clock;
  KRecordingPlugin plugin;  // four parameters
  KRecordingHost host{plugin, "Test", clock};
};
}  // namespace

TEST_F(AutomationTest, ABurstOfSendsIsOneGestureThatEndsAfterItsOwnQuietTime) {
  host.SendAutomation(4, 0.5);  // outside the table: nothing
  host.GestureNotice(4, Gesture::kTouch);
  host.SendAutomation(0, 0.2);
  clock.now += 500;
  host.SendAutomation(0, 0.3);
  clock.now += 100;
  host.SendAutomation(1, 0.7);  // a gesture of its own, with its own clock
  EXPECT_EQ(IdleAfter(900), "B0 S0=0.2/1 S0=0.3/1 B1 S1=0.7/1");  // 1000 ms after the last send of 0: open
  EXPECT_EQ(IdleAfter(1), "E0");
  EXPECT_EQ(IdleAfter(100), "E1");
  EXPECT_EQ(host.TouchedCount(), 0);
}

TEST_F(AutomationTest, TheSendingCounterIsRaisedDuringASendAndNeverStaysNegative) {
  plugin.AutomationSending().fetch_sub(3);  // unmatched decrements elsewhere
  host.SendAutomation(1, 0.5);
  EXPECT_EQ(plugin.AutomationSending().load(), 0);
  plugin.AutomationSending().store(2);  // two sends in flight on other threads
  host.SendAllAutomation();  // every automatable parameter, without gestures
  EXPECT_EQ(plugin.AutomationSending().load(), 2);
  EXPECT_EQ(IdleAfter(0), "B1 S1=0.5/1 S0=0/3 S1=0/3 S2=0/3 S3=0/3");
}

// From the audio thread a value is only posted: nothing reaches the host and nothing is allocated,
// and a burst beyond the room reserved (four per parameter) is cut short. The next idle, on the
// user-interface thread, sends what was posted, each inside its gesture.
TEST_F(AutomationTest, SendsFromProcessingWaitForTheIdleAndNeverAllocate) {
  int64_t allocations = 0;
  {
    KAllocationCounter counter;
    host.SendAutomationFromProcess(2, 0.25);
    host.SendAutomationFromProcess(4, 0.5);  // outside the table: nothing
    for (int i = 0; i < 100; ++i) host.SendAutomationFromProcess(3, i / 100.0);
    allocations = counter.Count();
  }
  EXPECT_EQ(allocations, 0);
  EXPECT_EQ(host.Take(), "");
  EXPECT_EQ(IdleAfter(0).substr(0, 30), "B2 S2=0.25/1 B3 S3=0/1 S3=0.01");
  EXPECT_EQ(host.sent.load(), 16);
  EXPECT_EQ(IdleAfter(0), "");  // all sent at the first idle
}

TEST_F(AutomationTest, GestureNoticesFromTheParameter) {
  plugin.GetParameter(1).TouchAutomation(Gesture::kRelease);  // untouched: nothing to end
  plugin.GetParameter(1).TouchAutomation(Gesture::kTouch);
  plugin.GetParameter(1).TouchAutomation(Gesture::kRelease);  // ends at once
  plugin.GetParameter(1).TouchAutomation(Gesture::kRelease);
  plugin.GetParameter(0).TouchAutomation(Gesture::kTouch);  // held, yet it ends on its own
  EXPECT_EQ(IdleAfter(1001), "B1 E1 B0 E0");
}

TEST_F(AutomationTest, LatencyIsReportedAtIdleWhenChangedOrWhenAskedToAlways) {
  plugin.ReportLatency(0);
  EXPECT_EQ(IdleAfter(0), "");  // unchanged from what the host has
  plugin.ReportLatency(64);
  EXPECT_EQ(host.Take(), "");  // only at idle
  EXPECT_EQ(IdleAfter(0), "L64");
  plugin.ReportLatency(64);
  EXPECT_EQ(IdleAfter(0), "");
  host.RequestLatencyReport(KAudioPluginInterface::kLatencyAlways);
  plugin.ReportLatency(64);  // a later "if changed" does not weaken the waiting "always"
  EXPECT_EQ(IdleAfter(0), "L64");
  EXPECT_EQ(IdleAfter(0), "");  // the request was used up
}

namespace {
// A one-way gate on a mutex and a condition variable: a test waiting on the runtime's std::latch
// was seen to hang under Wine, where that latch waits on atomics.
class KGate {
public:
  void Open() {
    {
      std::lock_guard<std::mutex> lock(mutex_);
      open_ = true;
    }
    changed_.notify_all();
  }
  void Wait() {
    std::unique_lock<std::mutex> lock(mutex_);
    changed_.wait(lock, [this] { return open_; });
  }

private:
  std::mutex mutex_;
  std::condition_variable changed_;
  bool open_ = false;
};

// A host that takes its time over beginning the gesture of parameter 0, so that the touch lock
// stays held meanwhile; it logs from any thread under a lock of its own.
class KSlowBeginHost final : public KAudioPluginInterface {
public:
  using KAudioPluginInterface::KAudioPluginInterface;
  void BeginGesture(int32_t index) override {
    if (index == 0) {
      beginning.Open();
      open.Wait();
    }
    Log("B", index);
  }
  void SendAutomationValue(int32_t index, double) override { Log("S", index); }
  void EndGesture(int32_t index) override { Log("E", index); }
  void SendMIDIEvent(int32_t, const uint8_t[4]) override {}
  void ReportLatency(int32_t) override {}
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }
  std::string Calls() {
    std::lock_guard<std::mutex> lock(mutex_);
    return calls_;
  }

  KGate beginning, open;

private:
  void Log(const char* call, int32_t index) {
    std::lock_guard<std::mutex> lock(mutex_);
    calls_ += (calls_.empty() ? "" : " ") + std::string(call) + std::to_string(index);
  }
  std::mutex mutex_;
  std::string calls_;
};
}  // namespace

// A send on one thread while another holds the touch lock waits for it, and its value goes out
// only after its own gesture began.
TEST(AutomationThreads, ASendWaitsForATouchLockHeldElsewhereAndGoesOutInsideItsGesture) {
  KRecordingPlugin plugin;
  KSlowBeginHost host(plugin, "Test");
  std::thread toucher([&] { host.GestureNotice(0, Gesture::kTouch); });
  host.beginning.Wait();  // the toucher holds the lock inside the host's begin
  std::thread sender([&] { host.SendAutomation(1, 0.5); });
  std::this_thread::sleep_for(std::chrono::milliseconds(50));  // time enough for a send that does not wait
  host.open.Open();
  toucher.join();
  sender.join();
  EXPECT_EQ(host.Calls(), "B0 B1 S1");
}
