#include <gtest/gtest.h>

#include <initializer_list>
#include <latch>
#include <memory>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "core/KAudioPlugin.h"
#include "kernel/KCatalogue.h"
#include "kernel/KException.h"
#include "kernel/KModule.h"
#include "kernel/KRegistries.h"

namespace {
// Remembers what its factory was given; no parameters, processes nothing.
class KProbePlugin : public KAudioPlugin {
public:
  KProbePlugin(KModule* context, const KPluginRecord* record)
      : KAudioPlugin({}, {1, 1, false, false, false}), context_(context), record_(record) {}
  KModule* Context() const { return context_; }
  const KPluginRecord* Record() const { return record_; }

protected:
  void Process(const float* const*, float* const*, int32_t) override {}

private:
  KModule* context_;
  const KPluginRecord* record_;
};

KAudioPlugin* CreateProbe(KModule* context, const KPluginRecord* record) { return new KProbePlugin(context, record); }
KAudioPlugin* CreateNothing(KModule*, const KPluginRecord*) { return nullptr; }
KAudioPlugin* CreateBroken(KModule*, const KPluginRecord*) { throw KException("Broken."); }

void RegisterProbes(KPluginRegistry& registry, std::initializer_list<const char*> keys) {
  for (const char* key : keys) registry.Register(KString::Static(key), CreateProbe, {});
}

// The key of the record found for `name`, or "(none)".
std::string Found(const KPluginRegistry& registry, const KString& name) {
  const KPluginRecord* record = registry.Find(name);
  return record ? record->key.ToUtf8() : "(none)";
}

std::vector<std::string> Utf8(const KStringList& list) {
  std::vector<std::string> texts;
  for (const KString& text : list) texts.push_back(text.ToUtf8());
  return texts;
}

std::unique_ptr<KProbePlugin> CreateProbeFrom(const KPluginRegistry& registry, const KString& name, KModule* context) {
  return std::unique_ptr<KProbePlugin>(static_cast<KProbePlugin*>(registry.Create(name, context)));
}
}  // namespace

TEST(KPluginRegistry, KeepsRegistrationOrderAndTheFirstOfADuplicate) {
  KPluginRegistry registry;
  registry.Register("KCompressor", CreateProbe, "Dynamics");
  registry.Register("KReverb", CreateProbe, {});
  registry.Register(KString::Widen("KCompressor"), CreateNothing, {});
  ASSERT_EQ(registry.Count(), 2);
  EXPECT_EQ(Utf8(registry.Keys()), (std::vector<std::string>{"KCompressor", "KReverb"}));
  EXPECT_EQ(registry.Record(0).factory, CreateProbe);
  EXPECT_EQ(registry.Record(0).category.ToUtf8(), "Dynamics");
  EXPECT_EQ(registry.Find("KCompressor"), &registry.Record(0));
}

// Route order: exact key, then the name without its "K", then the prefix scan.
TEST(KPluginRegistry, ExactKeyThenKeyWithoutPrefixLetter) {
  KPluginRegistry registry;
  RegisterProbes(registry, {"KReverbPlate", "SampleWarmer", "Reverb", "KChorus"});
  EXPECT_EQ(Found(registry, "KChorus"), "KChorus");
  EXPECT_EQ(Found(registry, KString::FromUtf8("Reverb")), "Reverb");
  EXPECT_EQ(Found(registry, "KSampleWarmer"), "SampleWarmer");
  // The short key wins over an earlier record that the prefix scan would have found.
  EXPECT_EQ(Found(registry, "KReverb"), "Reverb");
  // Only one upper-case "K" is taken off.
  EXPECT_EQ(Found(registry, "KKReverb"), "(none)");
  EXPECT_EQ(Found(registry, "kSampleWarmer"), "(none)");
  registry.Register("KReverb", CreateProbe, {});
  EXPECT_EQ(Found(registry, "KReverb"), "KReverb");

  KPluginRegistry full;
  RegisterProbes(full, {"KSampleWarmer", "KCompressor"});
  EXPECT_EQ(Found(full, "SampleWarmer"), "(none)");  // a name never gains the prefix
}

TEST(KPluginRegistry, PrefixScanTakesTheFirstRecordAgreeingOnTheCommonLength) {
  KPluginRegistry registry;
  RegisterProbes(registry, {"KDelayLine", "KDelay", "KDelayTape"});
  EXPECT_EQ(Found(registry, "KDel"), "KDelayLine");          // truncated name
  EXPECT_EQ(Found(registry, "KDelayTapeStereo"), "KDelay");  // extends two keys: the earlier
  EXPECT_EQ(Found(registry, "KDelayT"), "KDelay");
  EXPECT_EQ(Found(registry, "KDelayLineMono"), "KDelayLine");
  EXPECT_EQ(Found(registry, ""), "KDelayLine");  // common length 0
  EXPECT_EQ(Found(registry, "KFlanger"), "(none)");
  EXPECT_EQ(Found(registry, KString::FromUtf8("KDelayTape" + std::string(80, 'x'))), "KDelay");

  KPluginRegistry empty;
  EXPECT_EQ(Found(empty, ""), "(none)");
}

TEST(KPluginRegistry, CreateNamesTheInstanceAsRequestedAndPassesContextAndRecord) {
  KPluginRegistry registry;
  RegisterProbes(registry, {"KSampleWarmer", "Compressor"});
  KModule module("KSampleW");

  const auto truncated = CreateProbeFrom(registry, "KSampleW", &module);
  ASSERT_NE(truncated, nullptr);
  EXPECT_EQ(truncated->Identifier().ToUtf8(), "KSampleW");
  EXPECT_EQ(truncated->Context(), &module);
  EXPECT_EQ(truncated->Record(), &registry.Record(0));

  const auto stripped = CreateProbeFrom(registry, KString::Widen("KCompressor"), nullptr);
  ASSERT_NE(stripped, nullptr);
  EXPECT_EQ(stripped->Identifier().ToUtf8(), "KCompressor");
  EXPECT_EQ(stripped->Context(), nullptr);
  EXPECT_EQ(stripped->Record(), &registry.Record(1));
}

// Unknown names throw the not-found message; a factory's own outcome reaches the caller as is.
TEST(KPluginRegistry, CreateFailures) {
  KPluginRegistry registry;
  registry.Register("KNothing", CreateNothing, {});
  registry.Register("KBroken", CreateBroken, {});
  auto failureOf = [](const KPluginRegistry& r, const KString& name) -> std::string {
    try {
      delete r.Create(name, nullptr);
    } catch (const KException& failure) {
      EXPECT_TRUE(failure.Context().IsEmpty());
      EXPECT_EQ(failure.Code(), 0);
      return failure.Message().ToUtf8();
    }
    return "(no exception)";
  };
  EXPECT_EQ(failureOf(registry, "Nope"), "Plugin Nope hasn't been found.");
  EXPECT_EQ(failureOf(registry, KString::FromUtf8("N\u00F6pe")), "Plugin N\u00F6pe hasn't been found.");
  EXPECT_EQ(failureOf(KPluginRegistry(), ""), "Plugin  hasn't been found.");
  EXPECT_EQ(failureOf(registry, "KBroken"), "Broken.");
  EXPECT_EQ(registry.Create("KNothing", nullptr), nullptr);
}

namespace {
const KCatalogueEntry kTestPlugins[] = {
    {"KStereoWidth", CreateProbe, "StereoWidth", "Stereo"},
    {"KCompressor", CreateProbe, "Compressor", "Dynamics"},
    {"KPipeline", CreateProbe, nullptr, nullptr},
    {"KReverb", CreateProbe, "Reverb", "Reverb & Delay"},
    {"KSampleWarmer", CreateNothing, "SampleWarmer", "Distortion"},
    {"KChorus", CreateProbe, "Chorus", "Modulation"},
    {"KVocoder", CreateProbe, "Vocoder", "Special"},
    {"KEqualizer", CreateProbe, "Equalizer", "EQs & Filters"},
    {"KLimiter", CreateProbe, "Limiter", "Dynamics"},
};
const char* const kTestHosts[] = {"KPipeline", "KPipelineMini"};
const KCatalogue kTestCatalogue{kTestPlugins, kTestHosts};
}  // namespace

TEST(KRegistries, MainRegistryFileTypeAndPipelineHosts) {
  KRegistries registries(kTestCatalogue);
  EXPECT_EQ(registries.Main().Count(), 0);  // nothing happens before first use
  registries.EnsureBuilt();
  registries.EnsureBuilt();
  const KPluginRegistry& main = registries.Main();
  ASSERT_EQ(main.Count(), 9);
  for (int32_t i = 0; i < main.Count(); ++i) {
    EXPECT_EQ(main.Record(i).key.ToUtf8(), kTestPlugins[i].key);
    EXPECT_EQ(main.Keys()[i].ToUtf8(), kTestPlugins[i].key);
    EXPECT_EQ(main.Record(i).factory, kTestPlugins[i].factory);
    EXPECT_TRUE(main.Record(i).category.IsEmpty());
  }
  ASSERT_EQ(registries.FileTypes().Count(), 1);
  EXPECT_EQ(registries.FileTypes()[0].description.ToUtf8(), "Effect pipeline file");
  EXPECT_FALSE(registries.FileTypes()[0].extension.IsEmpty());
  EXPECT_EQ(Utf8(registries.PipelineHosts()), (std::vector<std::string>{"KPipeline", "KPipelineMini"}));
}

TEST(KRegistries, ModuleRegistryFollowsCategoryOrderWithShortKeys) {
  KRegistries registries(kTestCatalogue);
  registries.EnsureBuilt();
  const KPluginRegistry& modules = registries.Modules();
  const std::vector<std::pair<std::string, std::string>> expected = {
      {"Compressor", "Dynamics"},     {"Limiter", "Dynamics"},      {"Equalizer", "EQs & Filters"},
      {"SampleWarmer", "Distortion"}, {"Reverb", "Reverb & Delay"}, {"Chorus", "Modulation"},
      {"Vocoder", "Special"},         {"StereoWidth", "Stereo"}};
  ASSERT_EQ(modules.Count(), static_cast<int32_t>(expected.size()));
  for (int32_t i = 0; i < modules.Count(); ++i) {
    EXPECT_EQ(modules.Record(i).key.ToUtf8(), expected[i].first);
    EXPECT_EQ(modules.Record(i).category.ToUtf8(), expected[i].second);
  }
  // A module runs the factory of its stand-alone plug-in and is found by the plug-in's name.
  EXPECT_EQ(modules.Find("KSampleWarmer")->factory, CreateNothing);
  EXPECT_EQ(modules.Find("KReverb")->factory, CreateProbe);
}

TEST(KRegistries, ConcurrentFirstUseBuildsOnce) {
  constexpr int kThreads = 8;
  KRegistries registries(kTestCatalogue);
  std::latch start(kThreads);
  std::vector<int32_t> seen(kThreads * 2);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      registries.EnsureBuilt();
      seen[2 * t] = registries.Main().Count();  // complete as soon as EnsureBuilt returns
      seen[2 * t + 1] = registries.Modules().Count();
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (int t = 0; t < kThreads; ++t) {
    EXPECT_EQ(seen[2 * t], 9);
    EXPECT_EQ(seen[2 * t + 1], 8);
  }
  EXPECT_EQ(registries.FileTypes().Count(), 1);
  EXPECT_EQ(registries.PipelineHosts().Count(), 2);
}

TEST(KModuleMap, OneModulePerName) {
  KModuleMap map;
  KModule* compressor = map.Acquire("KCompressor");
  EXPECT_EQ(compressor->Name().ToUtf8(), "KCompressor");
  EXPECT_EQ(map.Acquire(KString::Widen("KCompressor")), compressor);
  KModule* reverb = map.Acquire("KReverb");
  KModule* unnamed = map.Acquire({});
  EXPECT_NE(reverb, compressor);
  EXPECT_NE(unnamed, compressor);
  EXPECT_NE(unnamed, reverb);
  EXPECT_EQ(map.Find("KReverb"), reverb);
  EXPECT_EQ(map.Find("KLimiter"), nullptr);
  EXPECT_EQ(map.Count(), 3);
}

TEST(KModuleMap, ConcurrentAcquireAgreesOnOneModulePerName) {
  constexpr int kThreads = 8, kNames = 64;
  KModuleMap map;
  std::latch start(kThreads);
  std::vector<std::vector<KModule*>> got(kThreads, std::vector<KModule*>(kNames));
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      for (int i = 0; i < kNames; ++i) {  // each thread starts at another name
        const int n = (i + t * 7) % kNames;
        got[t][n] = map.Acquire(KString::FromUtf8("KModule" + std::to_string(n)));
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(map.Count(), kNames);
  std::set<KModule*> distinct;
  for (int n = 0; n < kNames; ++n) {
    for (int t = 1; t < kThreads; ++t) EXPECT_EQ(got[t][n], got[0][n]) << n;
    EXPECT_EQ(got[0][n]->Name().ToUtf8(), "KModule" + std::to_string(n));
    distinct.insert(got[0][n]);
  }
  EXPECT_EQ(distinct.size(), static_cast<size_t>(kNames));
}
