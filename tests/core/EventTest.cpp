#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>
#include <vector>

#include "core/KEvent.h"
#include "tests/core/TraceCapture.h"

using testing::ElementsAre;

namespace {
// Every listener of a test appends to one log, so that the order across listeners shows.
struct KLogListener {
  std::vector<int>* log;
  int id;
  void Record(const int& value) { log->push_back(id * 100 + value); }
};

struct KBoundCall {
  void* target;
  uint64_t context;
  int32_t tag;
  int argument;
};
std::vector<KBoundCall> gBoundCalls;
void RecordBoundCall(void* target, const KEventBinding* binding, const int* argument) {
  gBoundCalls.push_back({target, binding->context, binding->tag, *argument});
}
}  // namespace

TEST(KEvent, PendingArgumentsAreExecutedOneAtATimeInOrderOfPosting) {
  KEvent<int> event;
  std::vector<int> log;
  KLogListener a{&log, 1};
  event.AddListener<&KLogListener::Record>(&a);

  event.ExecutePendingEvent();  // nothing pending: no call
  EXPECT_TRUE(log.empty());

  event.Post(1);
  event.Post(2);
  event.Post(3);
  EXPECT_EQ(event.PendingCount(), 3);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101));
  EXPECT_EQ(event.PendingCount(), 2);
  event.ExecutePendingEvent();
  event.ExecutePendingEvent();
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101, 102, 103));
  EXPECT_EQ(event.PendingCount(), 0);
}

TEST(KEvent, EventWithoutListenersStillConsumesItsArgument) {
  KEvent<int> event;
  event.Post(7);
  event.ExecutePendingEvent();
  EXPECT_EQ(event.PendingCount(), 0);
}

TEST(KEvent, ExecuteImmediatelyCallsInRegistrationOrderAndReportsACall) {
  KEvent<int> event;
  EXPECT_EQ(event.ExecuteImmediately(5), 0u);

  std::vector<int> log;
  KLogListener a{&log, 1}, b{&log, 2};
  event.AddListener<&KLogListener::Record>(&b);
  event.AddListener<&KLogListener::Record>(&a);
  event.Post(9);
  EXPECT_EQ(event.ExecuteImmediately(5) & 1u, 1u);
  EXPECT_THAT(log, ElementsAre(205, 105));
  EXPECT_EQ(event.PendingCount(), 1);  // the pending argument is left alone
}

TEST(KEvent, RawListenerGetsItsTargetAndBinding) {
  KEvent<int> event;
  int target = 0;
  gBoundCalls.clear();
  event.AddListener(&target, &RecordBoundCall, {0x1234567890ABCDEFull, -3});
  event.Post(42);
  event.ExecutePendingEvent();
  ASSERT_EQ(gBoundCalls.size(), 1u);
  EXPECT_EQ(gBoundCalls[0].target, &target);
  EXPECT_EQ(gBoundCalls[0].context, 0x1234567890ABCDEFull);
  EXPECT_EQ(gBoundCalls[0].tag, -3);
  EXPECT_EQ(gBoundCalls[0].argument, 42);

  event.RemoveListener(&target, &RecordBoundCall, {0x1234567890ABCDEFull, 4});  // other tag: kept
  EXPECT_EQ(event.ExecuteImmediately(1), 1u);
  event.RemoveListener(&target, &RecordBoundCall, {0x1234567890ABCDEFull, -3});
  EXPECT_EQ(event.ExecuteImmediately(1), 0u);
}

namespace {
struct KTwoMethods {
  std::vector<int> log;
  void First(const int& v) { log.push_back(v); }
  void Second(const int& v) { log.push_back(-v); }
};
}  // namespace

TEST(KEvent, RemovingOneMethodOrAWholeTarget) {
  KEvent<int> event;
  KTwoMethods t;
  event.AddListener<&KTwoMethods::First>(&t);
  event.AddListener<&KTwoMethods::Second>(&t);
  event.ExecuteImmediately(1);
  event.RemoveListener<&KTwoMethods::First>(&t);
  event.ExecuteImmediately(2);
  event.RemoveListeners(&t);
  EXPECT_EQ(event.ExecuteImmediately(3), 0u);
  EXPECT_THAT(t.log, ElementsAre(1, -1, -2));
}

namespace {
// Changes the listener list of its own event from inside a round.
struct KMutatingListener {
  KEvent<int>* event;
  std::vector<int>* log;
  KLogListener* toAdd = nullptr;
  KLogListener* toRemove = nullptr;
  void Run(const int& value) {
    log->push_back(value);
    if (toAdd) event->AddListener<&KLogListener::Record>(toAdd);
    if (toRemove) event->RemoveListeners(toRemove);
    if (toRemove) event->RemoveListeners(this);
    toAdd = toRemove = nullptr;
  }
};
}  // namespace

TEST(KEvent, ListenerAddedDuringARoundWaitsForTheNextRound) {
  KEvent<int> event;
  std::vector<int> log;
  KLogListener late{&log, 2};
  KMutatingListener adder{&event, &log, &late};
  event.AddListener<&KMutatingListener::Run>(&adder);
  event.Post(1);
  event.Post(2);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(1));
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(1, 2, 202));
}

TEST(KEvent, ListenerRemovedDuringARoundIsSkippedAndTheRestStillRun) {
  KEvent<int> event;
  std::vector<int> log;
  KLogListener doomed{&log, 2}, last{&log, 3};
  KMutatingListener remover{&event, &log, nullptr, &doomed};  // removes `doomed` and itself
  event.AddListener<&KMutatingListener::Run>(&remover);
  event.AddListener<&KLogListener::Record>(&doomed);
  event.AddListener<&KLogListener::Record>(&last);
  EXPECT_EQ(event.ExecuteImmediately(1), 1u);
  EXPECT_THAT(log, ElementsAre(1, 301));
  EXPECT_EQ(event.ExecuteImmediately(2), 1u);
  EXPECT_THAT(log, ElementsAre(1, 301, 302));
}

namespace {
struct KReposter {
  KEvent<int>* event;
  std::vector<int> seen;
  void Run(const int& value) {
    seen.push_back(value);
    if (value < 3) event->Post(value + 1);  // would deadlock if listeners ran under the lock
  }
};
}  // namespace

TEST(KEvent, ListenerMayPostToItsOwnEvent) {
  KEvent<int> event;
  KReposter reposter{&event, {}};
  event.AddListener<&KReposter::Run>(&reposter);
  event.Post(1);
  event.ExecutePendingEvent();
  EXPECT_EQ(event.PendingCount(), 1);
  while (event.PendingCount() > 0) event.ExecutePendingEvent();
  EXPECT_THAT(reposter.seen, ElementsAre(1, 2, 3));
}

namespace {
struct KThrower {
  void Run(const int&) { throw std::runtime_error("listener failed"); }
};
}  // namespace

TEST(KEvent, ThrowingListenerEndsTheRoundWithATrace) {
  KTraceCapture trace;
  KEvent<int> event;
  std::vector<int> log;
  KLogListener before{&log, 1}, after{&log, 3};
  KThrower thrower;
  event.AddListener<&KLogListener::Record>(&before);
  event.AddListener<&KThrower::Run>(&thrower);
  event.AddListener<&KLogListener::Record>(&after);

  event.Post(1);
  event.Post(2);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101));
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! KEvent::ExecutePendingEvent"));
  EXPECT_EQ(event.PendingCount(), 1);  // the failed argument is gone, the next one waits

  // A listener ran before the throw, so bit 0 is still reported.
  EXPECT_EQ(event.ExecuteImmediately(5), 1u);
  EXPECT_EQ(trace.Lines().back(), "SYSTEM EXCEPTION! KEvent::ExecuteImmediately");

  // The aborted rounds left the list usable: removal and later rounds work as usual.
  event.RemoveListeners(&thrower);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101, 105, 102, 302));
}

namespace {
struct KStamp {
  int32_t producer;
  int32_t sequence;
};

struct KStampCollector {
  std::vector<KStamp> seen;
  void Record(const KStamp& stamp) { seen.push_back(stamp); }
};
}  // namespace

TEST(KEvent, ConcurrentPostsWhileExecutingLoseNothingAndKeepEachPostersOrder) {
  constexpr int kProducers = 4;
  constexpr int kPerProducer = 5000;
  KEvent<KStamp> event;
  KEvent<KStamp> other;  // shares the process-wide lock
  event.ReservePending(kProducers * kPerProducer);
  KStampCollector collector;
  collector.seen.reserve(kProducers * kPerProducer);
  event.AddListener<&KStampCollector::Record>(&collector);

  std::vector<std::thread> producers;
  for (int p = 0; p < kProducers; ++p) {
    producers.emplace_back([&event, &other, p] {
      for (int i = 0; i < kPerProducer; ++i) {
        event.Post(KStamp{p, i});
        if (i % 100 == 0) other.Post(KStamp{p, i});
      }
    });
  }
  while (collector.seen.size() < static_cast<size_t>(kProducers * kPerProducer)) event.ExecutePendingEvent();
  for (std::thread& t : producers) t.join();

  int next[kProducers] = {};
  for (const KStamp& stamp : collector.seen) {
    ASSERT_EQ(stamp.sequence, next[stamp.producer]) << "producer " << stamp.producer;
    ++next[stamp.producer];
  }
  EXPECT_EQ(event.PendingCount(), 0);
  EXPECT_EQ(other.PendingCount(), kProducers * kPerProducer / 100);
}
