// The host interface's own logic: gestures around sends, the quiet-time end, the sending
// counter and the latency report at idle. Time comes from a hand-driven clock.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <ostream>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/KAudioPluginInterface.h"

namespace {
class KManualClock final : public KClock {
public:
  uint64_t Milliseconds() const noexcept override { return now; }
  uint64_t now = 1000;
};

const KLinearKind kAmount(0.0, 1.0, "", "{0.2}");
constexpr KParameterInfo kTable[] = {
    {"a", "A", &kAmount, 0.1, KParameterInfo::kAutomatable},
    {"b", "B", &kAmount, 0.2, KParameterInfo::kAutomatable},
    {"c", "C", &kAmount, 0.3, 0},
    {"d", "D", &kAmount, 0.4, KParameterInfo::kAutomatable},
};
constexpr int32_t kCount = static_cast<int32_t>(std::size(kTable));

class KSilentPlugin final : public KAudioPlugin {
public:
  KSilentPlugin() : KAudioPlugin(kTable, {1, 1, false, false, false}) {}
  using KAudioPlugin::SetOversampling;

protected:
  void Process(const float* const*, float* const*, int32_t) override {}
};

// What the host saw, with the sending counter as it stood during each call.
struct HostCall {
  enum Kind { kBegin, kSend, kEnd, kLatency } kind;
  int32_t index;  // the latency for kLatency
  double value = 0.0;
  int32_t counter = 0;
  bool operator==(const HostCall&) const = default;
};

void PrintTo(const HostCall& call, std::ostream* out) {
  static const char* const kNames[] = {"begin", "send", "end", "latency"};
  *out << kNames[call.kind] << "(" << call.index << ", " << call.value << ") counter " << call.counter;
}

class KRecordingInterface final : public KAudioPluginInterface {
public:
  KRecordingInterface(KAudioPlugin& plugin, const KClock& clock) : KAudioPluginInterface(plugin, "Test", clock) {}

  void BeginGesture(int32_t index) override { Record({HostCall::kBegin, index}); }
  void SendAutomationValue(int32_t index, double normalized) override { Record({HostCall::kSend, index, normalized}); }
  void EndGesture(int32_t index) override {
    Record({HostCall::kEnd, index});
    if (onEnd) onEnd(index);
  }
  void SendMIDIEvent(int32_t, const uint8_t[4]) override {}
  void ReportLatency(int32_t samples) override { Record({HostCall::kLatency, samples}); }
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }

  std::vector<HostCall> calls;
  std::function<void(int32_t)> onEnd;  // a host that reacts to the end of a gesture

private:
  void Record(HostCall call) {
    call.counter = Plugin().AutomationSending().load();
    calls.push_back(call);
  }
};

// A gesture begins inside a send (counter 1) or on a touch notice (counter 0).
HostCall Begin(int32_t index, int32_t counter = 1) { return {HostCall::kBegin, index, 0.0, counter}; }
HostCall Send(int32_t index, double value) { return {HostCall::kSend, index, value, 1}; }
HostCall End(int32_t index) { return {HostCall::kEnd, index}; }
HostCall Latency(int32_t samples) { return {HostCall::kLatency, samples}; }

class AutomationTest : public ::testing::Test {
protected:
  AutomationTest() { plugin.SetInterface(&host); }
  ~AutomationTest() override { plugin.SetInterface(nullptr); }

  // Moves the clock on and runs the interface's timer.
  void IdleAfter(uint64_t milliseconds) {
    clock.now += milliseconds;
    host.Idle();
  }

  KManualClock clock;
  KSilentPlugin plugin;
  KRecordingInterface host{plugin, clock};
};
}  // namespace

TEST_F(AutomationTest, IndexOutsideTheTableSendsAndTouchesNothing) {
  host.SendAutomation(kCount, 0.5);
  host.SendAutomation(-1, 0.5);
  host.GestureNotice(kCount, KAudioPluginBase::Parameter::kTouch);
  host.GestureNotice(-1, KAudioPluginBase::Parameter::kTouch);
  EXPECT_TRUE(host.calls.empty());
  EXPECT_EQ(host.TouchedCount(), 0);
  EXPECT_EQ(plugin.AutomationSending().load(), 0);
}

TEST_F(AutomationTest, ABurstOfSendsIsOneGestureThatEndsAfterAQuietSecond) {
  host.SendAutomation(0, 0.2);
  clock.now += 500;
  host.SendAutomation(0, 0.3);
  clock.now += 100;
  host.SendAutomation(1, 0.7);  // a gesture of its own, with its own clock
  EXPECT_EQ(host.calls, (std::vector<HostCall>{Begin(0), Send(0, 0.2), Send(0, 0.3), Begin(1), Send(1, 0.7)}));
  EXPECT_EQ(host.TouchedCount(), 2);
  host.calls.clear();

  IdleAfter(900);  // 1000 ms after the last send of parameter 0: still open
  EXPECT_TRUE(host.calls.empty());
  IdleAfter(1);
  EXPECT_EQ(host.calls, std::vector<HostCall>{End(0)});
  IdleAfter(99);
  EXPECT_EQ(host.calls, std::vector<HostCall>{End(0)});
  IdleAfter(1);
  EXPECT_EQ(host.calls, (std::vector<HostCall>{End(0), End(1)}));
  EXPECT_EQ(host.TouchedCount(), 0);
  IdleAfter(5000);
  EXPECT_EQ(host.calls.size(), 2u);
}

TEST_F(AutomationTest, EveryQuietGestureEndsInTheSameIdle) {
  for (int32_t i : {3, 0, 1}) host.SendAutomation(i, 0.5);
  host.calls.clear();
  IdleAfter(1001);
  EXPECT_EQ(host.calls, (std::vector<HostCall>{End(3), End(0), End(1)}));
}

TEST_F(AutomationTest, AHostAnsweringAnEndWithASendStartsANewGesture) {
  host.SendAutomation(0, 0.2);
  host.onEnd = [this](int32_t index) {
    if (index == 0) host.SendAutomation(1, 0.9);
  };
  host.calls.clear();
  IdleAfter(1001);
  EXPECT_EQ(host.calls, (std::vector<HostCall>{End(0), Begin(1), Send(1, 0.9)}));
  EXPECT_EQ(host.TouchedCount(), 1);
}

TEST_F(AutomationTest, AClockThatWrapsCannotKeepAGestureOpen) {
  clock.now = 0xFFFFFF00u;  // a 32-bit millisecond clock just before it wraps
  host.SendAutomation(0, 0.5);
  clock.now = 0x10;
  host.Idle();
  EXPECT_EQ(host.calls.back(), End(0));
  EXPECT_EQ(host.TouchedCount(), 0);
}

TEST_F(AutomationTest, TheSendingCounterIsRaisedDuringASendAndNeverStaysNegative) {
  host.SendAutomation(1, 0.25);
  EXPECT_EQ(host.calls.back(), Send(1, 0.25));  // counter 1 while the host had the value
  EXPECT_EQ(plugin.AutomationSending().load(), 0);

  plugin.AutomationSending().fetch_sub(3);  // unmatched decrements elsewhere
  host.SendAutomation(1, 0.5);
  EXPECT_EQ(host.calls.back(), Send(1, 0.5));  // still marks the send as in flight
  EXPECT_EQ(plugin.AutomationSending().load(), 0);

  plugin.AutomationSending().store(2);  // two sends in flight on other threads
  host.SendAutomation(1, 0.75);
  EXPECT_EQ(host.calls.back().counter, 3);
  EXPECT_EQ(plugin.AutomationSending().load(), 2);
}

TEST_F(AutomationTest, SendAllSendsEveryAutomatableParameterWithoutGestures) {
  plugin.GetParameter(3).SetNormalized(0.9);
  host.SendAllAutomation();
  EXPECT_EQ(host.calls, (std::vector<HostCall>{Send(0, 0.1), Send(1, 0.2), Send(3, 0.9)}));
  EXPECT_EQ(host.TouchedCount(), 0);
  EXPECT_EQ(plugin.AutomationSending().load(), 0);
}

TEST_F(AutomationTest, GestureNoticesFromTheParameter) {
  KAudioPluginBase::Parameter& b = plugin.GetParameter(1);
  b.TouchAutomation(KAudioPluginBase::Parameter::kRelease);  // not touched: nothing to end
  EXPECT_TRUE(host.calls.empty());

  b.TouchAutomation(KAudioPluginBase::Parameter::kTouch);
  host.SendAutomation(1, 0.6);
  b.TouchAutomation(1);  // kinds other than touch and release mean nothing here
  b.TouchAutomation(2);
  b.TouchAutomation(KAudioPluginBase::Parameter::kRelease);  // ends at once, no quiet time
  EXPECT_EQ(host.calls, (std::vector<HostCall>{Begin(1, 0), Send(1, 0.6), End(1)}));
  EXPECT_EQ(host.TouchedCount(), 0);
  b.TouchAutomation(KAudioPluginBase::Parameter::kRelease);
  IdleAfter(5000);
  EXPECT_EQ(host.calls.size(), 3u);

  plugin.SetInterface(nullptr);  // no host: a gesture goes nowhere
  b.TouchAutomation(KAudioPluginBase::Parameter::kTouch);
  b.TouchAutomation(KAudioPluginBase::Parameter::kRelease);
  EXPECT_EQ(host.calls.size(), 3u);
}

TEST_F(AutomationTest, ATouchHeldLongerThanASecondStillEndsOnItsOwn) {
  plugin.GetParameter(0).TouchAutomation(KAudioPluginBase::Parameter::kTouch);
  IdleAfter(1001);
  EXPECT_EQ(host.calls, (std::vector<HostCall>{Begin(0, 0), End(0)}));
}

TEST_F(AutomationTest, LatencyIsReportedAtIdleWhenChangedOrWhenAskedToAlways) {
  host.Idle();  // nothing asked
  plugin.ReportLatency(0);
  host.Idle();  // asked, but unchanged from what the host has
  EXPECT_TRUE(host.calls.empty());

  plugin.ReportLatency(64);
  EXPECT_TRUE(host.calls.empty());  // only at idle
  host.Idle();
  plugin.ReportLatency(64);
  host.Idle();
  EXPECT_EQ(host.calls, std::vector<HostCall>{Latency(64)});

  host.RequestLatencyReport(KAudioPluginInterface::kLatencyAlways);
  host.Idle();
  EXPECT_EQ(host.calls, (std::vector<HostCall>{Latency(64), Latency(64)}));
  host.Idle();  // the request was consumed
  EXPECT_EQ(host.calls.size(), 2u);

  // A later "if changed" does not weaken an "always" still waiting for the idle.
  host.RequestLatencyReport(KAudioPluginInterface::kLatencyAlways);
  plugin.ReportLatency(64);
  host.Idle();
  EXPECT_EQ(host.calls.size(), 3u);

  // Hosts see the latency at their own rate.
  plugin.SetOversampling(4);
  plugin.ReportLatency(66);
  EXPECT_EQ(plugin.TotalLatency(), 16);
  host.Idle();
  EXPECT_EQ(host.calls.back(), Latency(16));
  EXPECT_EQ(host.ReportedLatency(), 16);
}
