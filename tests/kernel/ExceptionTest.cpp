#include <gtest/gtest.h>

#include <functional>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "kernel/KTrace.h"
#include "kernel/KUserMessage.h"

static std::vector<std::string> gLines;
static void RecordLine(const KString& line) { gLines.push_back(line.ToUtf8()); }

// A guarded method returns normally, with what its result variable held when the body stopped.
TEST(KGuard, FailingBodyReturnsNormallyAndTracesTheOperation) {
  gLines.clear();
  const KTraceHook previous = KSetTraceHook(RecordLine);
  const std::function<void()> bodies[] = {[] { throw KException("Broken."); }, [] { throw 42; },
                                          [] { throw std::runtime_error("no"); }, [] { throw std::bad_alloc(); }, [] {}};
  std::vector<int> results;
  for (const auto& body : bodies) {
    int result = 5;
    KGuard("KAudioPluginBase::UndoStore", [&] { body(); result = 7; });
    results.push_back(result);
  }
  KSetTraceHook(previous);
  EXPECT_EQ(results, (std::vector<int>{5, 5, 5, 5, 7}));
  EXPECT_EQ(gLines, std::vector<std::string>(4, "SYSTEM EXCEPTION! KAudioPluginBase::UndoStore"));  // none for success
}

TEST(KUserMessage, HookReceivesTheTextUnchangedAndWithoutOneItReachesStandardError) {
  const std::string text = "Sorry, your system is out of resources.\n\nInformation: \u00C9chec \U0001F600";
  gLines.clear();
  const KUserMessageHook previous = KSetUserMessageHook(RecordLine);
  KShowUserMessage(KString::FromUtf8(text));
  KSetUserMessageHook(nullptr);  // no desktop in a test: one line on the standard error stream
  testing::internal::CaptureStderr();
  KShowUserMessage(KString::FromUtf8(text));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), text + "\n");
  KSetUserMessageHook(previous);
  EXPECT_EQ(gLines, std::vector<std::string>{text});
}
