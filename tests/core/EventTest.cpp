#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>
#include <vector>

#include "core/KEvent.h"
#include "tests/core/TraceCapture.h"

using testing::ElementsAre;

namespace {
// Every listener of a test appends id * 100 + argument to one log, so that order shows.
struct KLog {
  std::vector<int>* log;
  int id;
  void Record(const int& v) { log->push_back(id * 100 + v); }
  void Throw(const int&) { throw std::runtime_error("listener fault"); }
};

// A raw listener: the target is the log, the binding is added to the argument.
void RecordBinding(void* target, const KEventBinding* b, const int* v) {
  static_cast<std::vector<int>*>(target)->push_back(static_cast<int>(b->context) + b->tag * 100 + *v);
}

// Changes its own event's listener list from inside a round, once.
struct KMutator {
  KEvent<int>* event;
  KLog* add;
  KLog* remove;
  void Run(const int&) {
    if (add) event->AddListener<&KLog::Record>(add);
    if (remove) {
      event->RemoveListeners(remove);
      event->RemoveListeners(this);
    }
    add = remove = nullptr;
  }
  void Repost(const int& v) {
    if (v < 3) event->Post(v + 1);  // would deadlock if listeners ran under the lock
  }
};
}  // namespace

TEST(KEvent, PendingArgumentsRunOnePerExecutionFirstInFirstOut) {
  KEvent<int> event;
  std::vector<int> log;
  KLog a{&log, 1};
  event.Post(9);
  event.ExecutePendingEvent();  // no listener: consumed all the same
  EXPECT_EQ(event.PendingCount(), 0);
  event.AddListener<&KLog::Record>(&a);
  event.ExecutePendingEvent();  // nothing pending: no call
  EXPECT_TRUE(log.empty());
  for (int v : {1, 2, 3}) event.Post(v);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101));
  EXPECT_EQ(event.PendingCount(), 2);
  event.ExecutePendingEvent();
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101, 102, 103));
}

TEST(KEvent, ExecuteImmediatelyCallsInRegistrationOrderAndListenersCanBeRemoved) {
  KEvent<int> event;
  std::vector<int> log;
  KLog a{&log, 1};
  EXPECT_EQ(event.ExecuteImmediately(5), 0u);
  event.AddListener(&log, &RecordBinding, {1000, 2});
  event.AddListener<&KLog::Record>(&a);
  event.Post(7);
  EXPECT_EQ(event.ExecuteImmediately(5), 1u);
  EXPECT_THAT(log, ElementsAre(1205, 105));
  EXPECT_EQ(event.PendingCount(), 1);  // the pending argument is left alone

  event.RemoveListener(&log, &RecordBinding, {1000, 3});  // another binding: kept
  event.RemoveListener<&KLog::Record>(&a);
  event.ExecuteImmediately(6);
  event.RemoveListener(&log, &RecordBinding, {1000, 2});
  EXPECT_EQ(event.ExecuteImmediately(7), 0u);
  EXPECT_THAT(log, ElementsAre(1205, 105, 1206));
}

TEST(KEvent, ListChangesDuringARoundTakeEffectInTheNextRound) {
  KEvent<int> event;
  std::vector<int> log;
  KLog late{&log, 1}, doomed{&log, 2}, last{&log, 3};
  KMutator adder{&event, &late, nullptr}, remover{&event, nullptr, &doomed};  // remover also drops itself
  event.AddListener<&KMutator::Run>(&adder);
  event.AddListener<&KMutator::Run>(&remover);
  event.AddListener<&KLog::Record>(&doomed);
  event.AddListener<&KLog::Record>(&last);
  event.ExecuteImmediately(1);
  EXPECT_THAT(log, ElementsAre(301));  // `late` waits, `doomed` is skipped, `last` still runs
  event.ExecuteImmediately(2);
  EXPECT_THAT(log, ElementsAre(301, 302, 102));

  KEvent<int> self;
  KMutator reposter{&self, nullptr, nullptr};
  self.AddListener<&KMutator::Repost>(&reposter);
  self.AddListener<&KLog::Record>(&last);
  self.Post(1);
  while (self.PendingCount() > 0) self.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(301, 302, 102, 301, 302, 303));
}

TEST(KEvent, ThrowingListenerEndsTheRoundWithATrace) {
  KTraceCapture trace;
  KEvent<int> event;
  std::vector<int> log;
  KLog before{&log, 1}, thrower{&log, 2}, after{&log, 3};
  event.AddListener<&KLog::Record>(&before);
  event.AddListener<&KLog::Throw>(&thrower);
  event.AddListener<&KLog::Record>(&after);
  event.Post(1);
  event.Post(2);
  event.ExecutePendingEvent();
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! KEvent::ExecutePendingEvent"));
  EXPECT_EQ(event.PendingCount(), 1);  // the failed argument is gone
  EXPECT_EQ(event.ExecuteImmediately(5), 1u);  // a listener ran before the throw
  EXPECT_EQ(trace.Lines().back(), "SYSTEM EXCEPTION! KEvent::ExecuteImmediately");

  event.RemoveListeners(&thrower);  // the aborted rounds left the list usable
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101, 105, 102, 302));
}

namespace {
struct KStamp {
  int32_t producer;
  int32_t sequence;
};
struct KStampLog {
  std::vector<KStamp> seen;
  void Record(const KStamp& s) { seen.push_back(s); }
};
}  // namespace

TEST(KEvent, ConcurrentPostsWhileExecutingLoseNothingAndKeepEachPostersOrder) {
  constexpr int kProducers = 4, kEach = 5000;
  KEvent<KStamp> event;
  event.ReservePending(kProducers * kEach);
  KStampLog log;
  log.seen.reserve(kProducers * kEach);
  event.AddListener<&KStampLog::Record>(&log);
  std::vector<std::thread> producers;
  for (int p = 0; p < kProducers; ++p) {
    producers.emplace_back([&, p] {
      for (int i = 0; i < kEach; ++i) event.Post({p, i});
    });
  }
  while (log.seen.size() < size_t{kProducers * kEach}) event.ExecutePendingEvent();
  for (std::thread& t : producers) t.join();

  int next[kProducers] = {};
  for (const KStamp& s : log.seen) ASSERT_EQ(s.sequence, next[s.producer]++) << "producer " << s.producer;
  EXPECT_EQ(event.PendingCount(), 0);
}
