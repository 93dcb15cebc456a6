#include <gmock/gmock.h>

#include <stdexcept>
#include <thread>

#include "core/KEvent.h"
#include "tests/core/TraceCapture.h"

using testing::ElementsAre;

namespace {
// Appends id * 100 + argument to a shared log, so that order shows.
struct KListener {
  std::vector<int>* log;
  int id;
  KEvent<int>* event = nullptr;
  KListener* late = nullptr;

  void Record(const int& v) { log->push_back(id * 100 + v); }
  void Throw(const int&) { throw std::runtime_error("listener fault"); }
  // Records, adds `late` once and posts the next argument: all from inside a round.
  void Grow(const int& v) {
    Record(v);
    if (v == 1) event->AddListener<&KListener::Record>(late);
    if (v < 3) event->Post(v + 1);  // would deadlock if listeners ran under the lock
  }
};
}  // namespace

TEST(KEvent, PendingArgumentsRunOnePerExecutionInOrderAndListenersJoinFromTheNextRound) {
  KEvent<int> event;
  std::vector<int> log;
  KListener late{&log, 1}, grower{&log, 2, &event, &late};
  event.Post(9);
  event.ExecutePendingEvent();  // no listener: consumed all the same
  EXPECT_EQ(event.PendingCount(), 0);
  event.AddListener<&KListener::Grow>(&grower);
  event.Post(1);
  event.Post(7);
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(201));
  while (event.PendingCount() > 0) event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(201, 207, 107, 202, 102, 203, 103));
}

TEST(KEvent, AThrowingListenerEndsTheRoundWithATrace) {
  KTraceCapture trace;
  KEvent<int> event;
  std::vector<int> log;
  KListener before{&log, 1}, thrower{&log, 2}, after{&log, 3};
  event.AddListener<&KListener::Record>(&before);
  event.AddListener<&KListener::Throw>(&thrower);
  event.AddListener<&KListener::Record>(&after);
  event.Post(1);
  event.Post(2);
  event.ExecutePendingEvent();
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! KEvent::ExecutePendingEvent"));
  event.RemoveListeners(&thrower);  // the aborted round left the list usable
  event.ExecutePendingEvent();
  EXPECT_THAT(log, ElementsAre(101, 102, 302));
}

TEST(KEvent, ConcurrentPostsWhileExecutingLoseNothingAndKeepEachPostersOrder) {
  constexpr int kPosters = 4, kEach = 5000;
  std::vector<int> seen;  // poster * kEach + sequence, in the order executed
  seen.reserve(kPosters * kEach);
  KListener collector{&seen, 0};
  KEvent<int> event;
  event.ReservePending(kPosters * kEach);
  event.AddListener<&KListener::Record>(&collector);
  std::vector<std::thread> posters;
  for (int p = 0; p < kPosters; ++p)
    posters.emplace_back([&, p] {
      for (int i = 0; i < kEach; ++i) event.Post(p * kEach + i);
    });
  while (seen.size() < size_t{kPosters * kEach}) event.ExecutePendingEvent();
  for (std::thread& t : posters) t.join();
  int next[kPosters] = {};
  for (int v : seen) ASSERT_EQ(v % kEach, next[v / kEach]++) << "poster " << v / kEach;
}
