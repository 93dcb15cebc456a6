// The exports in a process of their own: the first test makes their very first calls.
#include <gtest/gtest.h>

#include <algorithm>
#include <latch>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "core/KAudioPlugin.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KException.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"

namespace {
std::mutex gMessagesMutex;
std::vector<std::string> gMessages;

void RecordMessage(const KString& text) {
  std::lock_guard<std::mutex> lock(gMessagesMutex);
  gMessages.push_back(text.ToUtf8());
}

// Records the user messages shown while it lives (from any thread), then restores the route.
class KMessageRecorder {
public:
  KMessageRecorder() : previous_(KSetUserMessageHook(RecordMessage)) { gMessages.clear(); }
  ~KMessageRecorder() { KSetUserMessageHook(previous_); }
  KMessageRecorder(const KMessageRecorder&) = delete;
  KMessageRecorder& operator=(const KMessageRecorder&) = delete;

  std::vector<std::string> Messages() const {
    std::lock_guard<std::mutex> lock(gMessagesMutex);
    return gMessages;
  }

private:
  KUserMessageHook previous_;
};

std::string NotFound(const std::string& name) {
  return "Could not create plugin " + name + ".\n\nError: Plugin " + name + " hasn't been found.";
}
}  // namespace

TEST(KEntryPoints, FirstCallsFromManyThreadsBuildOnce) {
  ASSERT_EQ(KModuleMap::Instance().Count(), 0) << "the exports were used before this test";
  KMessageRecorder recorder;
  constexpr int kThreads = 8;
  const std::string names[] = {"KNoSuchA", "KNoSuchB", "KNoSuchC"};
  std::latch start(kThreads);
  std::vector<const KStringList*> lists(kThreads);
  std::vector<int> createdNull(kThreads);
  std::vector<int32_t> keyCounts(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      const KString name = KString::FromUtf8(names[t % 3]);
      start.arrive_and_wait();
      if (t % 2) lists[t] = &GetTorvanePluginList();  // half the threads begin with each export
      std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(name));
      createdNull[t] = plugin == nullptr;
      if (t % 2 == 0) lists[t] = &GetTorvanePluginList();
      keyCounts[t] = lists[t]->Count();  // complete however the threads interleave
    });
  }
  for (std::thread& thread : threads) thread.join();

  KRegistries& registries = KRegistries::Instance();
  EXPECT_EQ(registries.FileTypes().Count(), 1);  // a second build would have added another
  std::vector<std::string> expected;
  for (int t = 0; t < kThreads; ++t) {
    EXPECT_EQ(lists[t], &registries.Main().Keys());
    EXPECT_EQ(keyCounts[t], static_cast<int32_t>(KProductCatalogue().plugins.size()));
    EXPECT_TRUE(createdNull[t]);  // no product plug-in has a name like these
    expected.push_back(NotFound(names[t % 3]));
  }
  std::vector<std::string> shown = recorder.Messages();
  std::sort(shown.begin(), shown.end());
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(shown, expected);

  KModuleMap& modules = KModuleMap::Instance();
  EXPECT_EQ(modules.Count(), 4);  // the three names and the list's empty one
  for (const std::string& name : names) EXPECT_NE(modules.Find(KString::FromUtf8(name)), nullptr) << name;
  EXPECT_NE(modules.Find({}), nullptr);
}

TEST(KEntryPoints, UnknownPluginShowsOneMessageAndAnswersNull) {
  KMessageRecorder recorder;
  KAudioPlugin* plugin = nullptr;
  EXPECT_NO_THROW(plugin = CreateTorvanePlugin("Nope"));
  EXPECT_EQ(plugin, nullptr);
  EXPECT_EQ(recorder.Messages(), std::vector<std::string>{NotFound("Nope")});
}

TEST(KEntryPoints, PluginListIsOneObjectForTheLifeOfTheLibrary) {
  KMessageRecorder recorder;
  const KStringList* first = nullptr;
  EXPECT_NO_THROW(first = &GetTorvanePluginList());
  EXPECT_EQ(&GetTorvanePluginList(), first);
  EXPECT_EQ(first->Count(), KRegistries::Instance().Main().Count());
  EXPECT_TRUE(recorder.Messages().empty());
}

namespace {
// Remembers the module it was created in; no parameters, processes nothing.
class KContextPlugin : public KAudioPlugin {
public:
  explicit KContextPlugin(KModule* context) : KAudioPlugin({}, {1, 1, false, false, false}), context_(context) {}
  KModule* Context() const { return context_; }

protected:
  void Process(const float* const*, float* const*, int32_t) override {}

private:
  KModule* context_;
};

KAudioPlugin* CreateContext(KModule* context, const KPluginRecord*) { return new KContextPlugin(context); }
KAudioPlugin* CreateNothing(KModule*, const KPluginRecord*) { return nullptr; }
KAudioPlugin* ThrowSilent(KModule*, const KPluginRecord*) { throw KException(KString()); }
KAudioPlugin* ThrowInteger(KModule*, const KPluginRecord*) { throw 42; }
KAudioPlugin* ThrowStandard(KModule*, const KPluginRecord*) { throw std::runtime_error("not for users"); }

const KCatalogueEntry kTestPlugins[] = {
    {"KContext", CreateContext, nullptr, nullptr},     {"KNothing", CreateNothing, nullptr, nullptr},
    {"KSilent", ThrowSilent, nullptr, nullptr},        {"KInteger", ThrowInteger, nullptr, nullptr},
    {"KStandard", ThrowStandard, nullptr, nullptr},
};
const KCatalogue kTestCatalogue{kTestPlugins, {}};

// Creation through the export's own path, over registries of test factories.
class KCreationTest : public ::testing::Test {
protected:
  KRegistries registries_{kTestCatalogue};
  KMessageRecorder recorder_;
};
}  // namespace

TEST_F(KCreationTest, CreatedInstanceCarriesTheRequestedNameAndItsModule) {
  std::unique_ptr<KAudioPlugin> plugin(KCreatePlugin(registries_, "KCont"));
  ASSERT_NE(plugin, nullptr);
  EXPECT_EQ(plugin->Identifier().ToUtf8(), "KCont");
  KModule* module = KModuleMap::Instance().Find("KCont");
  ASSERT_NE(module, nullptr);
  EXPECT_EQ(static_cast<KContextPlugin&>(*plugin).Context(), module);
  EXPECT_TRUE(recorder_.Messages().empty());
}

TEST_F(KCreationTest, FactoryKExceptionWithEmptyMessageStillShowsTheCreationMessage) {
  EXPECT_EQ(KCreatePlugin(registries_, "KSilent"), nullptr);
  EXPECT_EQ(recorder_.Messages(), std::vector<std::string>{"Could not create plugin KSilent.\n\nError: "});
}

TEST_F(KCreationTest, OtherFailuresAnswerNullWithoutMessage) {
  EXPECT_EQ(KCreatePlugin(registries_, "KInteger"), nullptr);
  EXPECT_EQ(KCreatePlugin(registries_, "KStandard"), nullptr);
  EXPECT_EQ(KCreatePlugin(registries_, "KNothing"), nullptr);
  EXPECT_TRUE(recorder_.Messages().empty());
}
