#include <gtest/gtest.h>

#include <atomic>
#include <latch>
#include <mutex>
#include <new>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "kernel/KTrace.h"
#include "kernel/KUserMessage.h"

namespace {
std::mutex gLinesMutex;
std::vector<std::string> gLines;

void RecordLine(const KString& line) {
  std::lock_guard<std::mutex> lock(gLinesMutex);
  gLines.push_back(line.ToUtf8());
}

// Installs a hook for the life of one test and puts the previous one back.
template <class Hook, Hook (*Set)(Hook)>
class KHookScope {
public:
  explicit KHookScope(Hook hook) : previous_(Set(hook)) {
    std::lock_guard<std::mutex> lock(gLinesMutex);
    gLines.clear();
  }
  ~KHookScope() { Set(previous_); }
  KHookScope(const KHookScope&) = delete;
  KHookScope& operator=(const KHookScope&) = delete;

  std::vector<std::string> Lines() const {
    std::lock_guard<std::mutex> lock(gLinesMutex);
    return gLines;
  }

private:
  Hook previous_;
};
using KTraceScope = KHookScope<KTraceHook, KSetTraceHook>;
using KMessageScope = KHookScope<KUserMessageHook, KSetUserMessageHook>;

const void* UnitsOf(const KString& text) {
  return text.VisitUnits([](const auto* units, int32_t) { return static_cast<const void*>(units); });
}

// A guarded method with a result: it answers what its variable holds when the body stops.
template <class Fail>
int GuardedCompute(const KString& operation, Fail fail) {
  int result = -1;
  KGuard(operation, [&] {
    result = 5;
    fail();
    result = 7;
  });
  return result;
}
}  // namespace

TEST(KException, CarriesItsTextsAndCopiesShareThem) {
  const KException plain("There are too many banks.");
  EXPECT_EQ(plain.Message().ToUtf8(), "There are too many banks.");
  EXPECT_TRUE(plain.Context().IsEmpty());
  EXPECT_EQ(plain.Code(), 0);

  const KString longText = KString::FromUtf8("Corrupt subsample library 2 data block. " + std::string(40, '.'));
  const KException original(longText, "presets.xml", -3);
  const KException copy = original;
  EXPECT_EQ(copy.Context().ToUtf8(), "presets.xml");
  EXPECT_EQ(copy.Code(), -3);
  EXPECT_EQ(UnitsOf(copy.Message()), UnitsOf(original.Message()));  // one heap block, not two
}

TEST(KGuard, FailingBodyReturnsNormallyAndTracesTheOperation) {
  KTraceScope trace(RecordLine);
  const KString operation = "KAudioPluginBase::UndoStore";
  int result = 0;
  EXPECT_NO_THROW(result = GuardedCompute(operation, [] { throw KException("Broken."); }));
  EXPECT_EQ(result, 5);
  EXPECT_NO_THROW(result = GuardedCompute(operation, [] { throw 42; }));
  EXPECT_EQ(result, 5);
  EXPECT_NO_THROW(result = GuardedCompute(operation, [] { throw std::runtime_error("no"); }));
  EXPECT_EQ(result, 5);
  EXPECT_NO_THROW(result = GuardedCompute("KModule::GetDataPath_User", [] { throw std::bad_alloc(); }));
  EXPECT_EQ(result, 5);
  const std::string line = "SYSTEM EXCEPTION! KAudioPluginBase::UndoStore";
  EXPECT_EQ(trace.Lines(), (std::vector<std::string>{line, line, line, "SYSTEM EXCEPTION! KModule::GetDataPath_User"}));
}

TEST(KGuard, SucceedingBodyTracesNothing) {
  KTraceScope trace(RecordLine);
  EXPECT_EQ(GuardedCompute("KThing::Compute", [] {}), 7);
  EXPECT_TRUE(trace.Lines().empty());
}

namespace {
std::atomic<int> gTraced{0};
std::atomic<int> gGarbled{0};

// Lock-free, as a sink on the audio thread must be.
void CountLine(const KString& line) {
  gTraced.fetch_add(1, std::memory_order_relaxed);
  if (line != KString("SYSTEM EXCEPTION! KProcessor::ProcessAudio")) gGarbled.fetch_add(1, std::memory_order_relaxed);
}
}  // namespace

TEST(KTrace, SinkTakesFailuresFromManyThreadsAtOnce) {
  constexpr int kThreads = 8, kFailures = 2000;
  KTraceScope trace(CountLine);
  gTraced = 0;
  gGarbled = 0;
  std::latch start(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&] {
      start.arrive_and_wait();
      for (int i = 0; i < kFailures; ++i) KGuard("KProcessor::ProcessAudio", [] { throw 1; });
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(gTraced.load(), kThreads * kFailures);
  EXPECT_EQ(gGarbled.load(), 0);
}

TEST(KUserMessage, HookReceivesTheTextUnchanged) {
  KMessageScope messages(RecordLine);
  const KString text = KString::FromUtf8("Could not load the required resources. \u00C9chec.");
  KShowUserMessage(text);
  EXPECT_EQ(messages.Lines(), std::vector<std::string>{text.ToUtf8()});
}

// Without a desktop (and without a hook) the message is one line on the standard error stream.
TEST(KUserMessage, WithoutHookTheTextReachesStandardError) {
  KMessageScope noHook(nullptr);
  const std::string text = "Sorry, your system is out of resources.\n\nInformation: Could not create a window. \u00E9";
  testing::internal::CaptureStderr();
  KShowUserMessage(KString::FromUtf8(text));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), text + "\n");
}
