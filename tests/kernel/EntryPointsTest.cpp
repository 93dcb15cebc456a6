// The exports in a process of their own: the first test makes their very first calls.
#include <gtest/gtest.h>

#include <latch>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "core/KAudioPlugin.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KException.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"

namespace {
std::mutex gMutex;
std::vector<std::string> gMessages;

// Every user message of this process is recorded, from any thread.
void Record(const KString& text) {
  std::lock_guard<std::mutex> lock(gMutex);
  gMessages.push_back(text.ToUtf8());
}
[[maybe_unused]] const KUserMessageHook gPrevious = KSetUserMessageHook(Record);  // for the whole process

// The messages shown since the last call.
std::vector<std::string> TakeMessages() {
  std::lock_guard<std::mutex> lock(gMutex);
  return std::exchange(gMessages, {});
}

KModule* gContext = nullptr;  // where the last factory ran
KAudioPlugin* ThrowSilent(KModule* context, const KPluginRecord*) {
  gContext = context;
  throw KException(KString());
}
KAudioPlugin* ThrowStandard(KModule*, const KPluginRecord*) { throw std::runtime_error("not for users"); }
KAudioPlugin* CreateNothing(KModule*, const KPluginRecord*) { return nullptr; }
const KPluginDescription kTestPlugins[] = {{"KSilent", ThrowSilent, nullptr, nullptr}, {"KStandard", ThrowStandard, nullptr, nullptr},
                                        {"KNothing", CreateNothing, nullptr, nullptr}};
const KCatalogue kTestCatalogue{kTestPlugins, {}};
}  // namespace

TEST(KEntryPoints, FirstCallsFromManyThreadsBuildOnceAndAnUnknownNameShowsOneMessage) {
  ASSERT_EQ(KModuleMap::Instance().Count(), 0) << "the exports were used before this test";
  constexpr int kThreads = 8;
  std::latch start(kThreads);
  std::vector<std::pair<const KStringList*, int32_t>> lists(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      if (t % 2) lists[t].first = &GetTorvanePluginList();  // half the threads begin with each export
      const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin("KNoSuch"));
      EXPECT_EQ(plugin.get(), nullptr);
      if (t % 2 == 0) lists[t].first = &GetTorvanePluginList();
      lists[t].second = lists[t].first->Count();  // complete however the threads interleave
    });
  }
  for (std::thread& thread : threads) thread.join();
  KRegistries& registries = KRegistries::Instance();
  EXPECT_EQ(registries.FileTypes().Count(), 1);  // a second build would have added another
  const auto listed = std::pair(&registries.Main().Keys(), static_cast<int32_t>(KProductCatalogue().plugins.size()));
  EXPECT_EQ(lists, std::vector(kThreads, listed));
  const std::string notFound = "Could not create plugin KNoSuch.\n\nError: Plugin KNoSuch hasn't been found.";
  EXPECT_EQ(TakeMessages(), std::vector<std::string>(kThreads, notFound));
  KModuleMap& modules = KModuleMap::Instance();  // one module per name, however many threads asked at once
  EXPECT_EQ(modules.Count(), 2);                  // the name's and the list's empty one
  EXPECT_EQ(modules.Find(KString::Widen("KNoSuch"))->Name().ToUtf8(), "KNoSuch");
  EXPECT_EQ(CreateTorvanePlugin("Nope"), nullptr);  // and once more, after the first use
  EXPECT_EQ(TakeMessages(), std::vector<std::string>{"Could not create plugin Nope.\n\nError: Plugin Nope hasn't been found."});
}


// Only a KException is a message for the user, even one without text; anything else answers null
// silently. The factory runs in the module of the name as asked.
TEST(KEntryPoints, FactoryFailuresAnswerNull) {
  KRegistries registries(kTestCatalogue);
  EXPECT_EQ(KCreatePlugin(registries, "KSil"), nullptr);
  EXPECT_EQ(TakeMessages(), std::vector<std::string>{"Could not create plugin KSil.\n\nError: "});
  EXPECT_EQ(gContext, KModuleMap::Instance().Find("KSil"));
  for (const KString& name : {KString("KStandard"), KString("KNothing")}) {
    EXPECT_EQ(KCreatePlugin(registries, name), nullptr) << name.ToUtf8();
    EXPECT_TRUE(TakeMessages().empty()) << name.ToUtf8();
  }
}
