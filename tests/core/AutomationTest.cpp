// The host interface: gestures around sends, their quiet-time end, the sending counter, latency.
#include <gtest/gtest.h>

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
