// The product's exports end to end with the utility plug-in, in a process of their own: the
// first test makes the exports' very first calls.
#include <gtest/gtest.h>

#include <cmath>
#include <latch>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"
#include "plugins/utility/KUtilityPlugin.h"

namespace {
std::mutex gMessagesMutex;
std::vector<std::string> gMessages;

void RecordMessage(const KString& text) {
  std::lock_guard<std::mutex> lock(gMessagesMutex);
  gMessages.push_back(text.ToUtf8());
}

// Keeps user messages off the screen and lets a test read them.
class KMessageRecorder {
public:
  KMessageRecorder() : previous_(KSetUserMessageHook(RecordMessage)) {
    std::lock_guard<std::mutex> lock(gMessagesMutex);
    gMessages.clear();
  }
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

// Whether the instance is a working utility: at +6.02 dB it doubles a block of stereo audio.
bool DoublesAudio(KAudioPlugin& plugin) {
  KAudioPluginBase::Parameter* gain = plugin.FindParameter("gain");
  if (!gain || plugin.OutputChannelCount() != 2 || !plugin.SetSampleRate(48000.0)) return false;
  gain->SetWorking(6.02);
  const float left[4] = {0.25f, -0.5f, 0.125f, 0.0f};
  const float right[4] = {-0.25f, 0.5f, 0.0f, 0.375f};
  float outLeft[4], outRight[4];
  const float* in[] = {left, right};
  float* out[] = {outLeft, outRight};
  plugin.ProcessHostBlock(in, out, 4);
  for (int i = 0; i < 4; ++i) {
    if (std::abs(outLeft[i] - 2.0f * left[i]) > 1e-3f || std::abs(outRight[i] - 2.0f * right[i]) > 1e-3f) return false;
  }
  return true;
}

std::string NotFound(const std::string& name) {
  return "Could not create plugin " + name + ".\n\nError: Plugin " + name + " hasn't been found.";
}
}  // namespace

TEST(UtilityEntryPoints, FirstCallsFromManyThreadsAgree) {
  ASSERT_EQ(KModuleMap::Instance().Count(), 0) << "the exports were used before this test";
  KMessageRecorder recorder;
  constexpr int kThreads = 8;
  const char* const names[] = {"KUtilityPlugin", "KUtility"};
  std::latch start(kThreads);
  struct Seen {
    const KStringList* list = nullptr;
    int32_t listed = -1;
    std::string identifier;
    bool works = false;
  };
  std::vector<Seen> seen(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      const KString name = KString::FromUtf8(names[t % 2]);
      Seen& mine = seen[static_cast<size_t>(t)];
      start.arrive_and_wait();
      if (t % 4 < 2) mine.list = &GetTorvanePluginList();  // half the threads begin with each export
      std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(name));
      if (!mine.list) mine.list = &GetTorvanePluginList();
      mine.listed = mine.list->IndexOf("KUtilityPlugin");
      if (plugin) {
        mine.identifier = plugin->Identifier().ToUtf8();
        mine.works = DoublesAudio(*plugin);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();

  for (int t = 0; t < kThreads; ++t) {
    SCOPED_TRACE(t);
    const Seen& mine = seen[static_cast<size_t>(t)];
    EXPECT_EQ(mine.list, &GetTorvanePluginList());
    EXPECT_GE(mine.listed, 0);
    EXPECT_EQ(mine.identifier, names[t % 2]);
    EXPECT_TRUE(mine.works);
  }
  EXPECT_EQ(GetTorvanePluginList().Count(), static_cast<int32_t>(KProductCatalogue().plugins.size()));
  EXPECT_EQ(KRegistries::Instance().FileTypes().Count(), 1);  // built once
  EXPECT_EQ(KModuleMap::Instance().Count(), 3);  // both names and the list's empty one
  EXPECT_TRUE(recorder.Messages().empty());
}

TEST(UtilityEntryPoints, LookupRoutesForTheUtility) {
  KMessageRecorder recorder;
  // The exact key, a truncated key and a key with a tail resolve through the prefix scan; each
  // instance carries the name exactly as asked.
  for (const char* name : {"KUtilityPlugin", "KUtility", "KUtilityPlugin2"}) {
    std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::FromUtf8(name)));
    ASSERT_NE(plugin, nullptr) << name;
    EXPECT_NE(dynamic_cast<KUtilityPlugin*>(plugin.get()), nullptr) << name;
    EXPECT_EQ(plugin->Identifier().ToUtf8(), name);
    EXPECT_TRUE(DoublesAudio(*plugin)) << name;
  }
  EXPECT_TRUE(recorder.Messages().empty());

  // The main registry's keys carry the prefix letter; a name without it never gains one, so the
  // module-style short names find nothing here.
  for (const char* name : {"UtilityPlugin", "Utility"}) {
    KAudioPlugin* plugin = nullptr;
    EXPECT_NO_THROW(plugin = CreateTorvanePlugin(KString::FromUtf8(name)));
    EXPECT_EQ(plugin, nullptr) << name;
  }
  EXPECT_EQ(recorder.Messages(), (std::vector<std::string>{NotFound("UtilityPlugin"), NotFound("Utility")}));

  // The short name lives in the module registry, under "Stereo".
  const KPluginRecord* module = KRegistries::Instance().Modules().FindExact("Utility");
  ASSERT_NE(module, nullptr);
  EXPECT_EQ(module->category.ToUtf8(), "Stereo");
  EXPECT_EQ(module->factory, &KUtilityPlugin::Create);
}
