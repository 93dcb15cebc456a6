#include <gtest/gtest.h>

#include <iterator>
#include <latch>
#include <memory>
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
struct KProbePlugin : KAudioPlugin {
  KProbePlugin(KModule* c, const KPluginRecord* r) : KAudioPlugin({}, {1, 1, false, false, false}), context(c), record(r) {}
  void Process(const float* const*, float* const*, int32_t) override {}
  KModule* const context;
  const KPluginRecord* const record;
};
KAudioPlugin* CreateProbe(KModule* context, const KPluginRecord* record) { return new KProbePlugin(context, record); }
KAudioPlugin* CreateNothing(KModule*, const KPluginRecord*) { return nullptr; }

std::vector<std::string> Listed(const KPluginRegistry& registry) {
  std::vector<std::string> listed;
  for (int32_t i = 0; i < registry.Count(); ++i)
    listed.push_back(registry.Record(i).key.ToUtf8() + "/" + registry.Record(i).category.ToUtf8());
  return listed;
}
}  // namespace

// Exact key; then, for a name starting with "K", the name without it; then the first record in
// registration order whose key agrees with the name on their common length. Create runs that
// record's factory and names the instance as asked.
TEST(KPluginRegistry, FindsExactThenWithoutTheKThenTheFirstPrefixMatch) {
  KPluginRegistry registry;
  for (const char* key : {"KReverbPlate", "SampleWarmer", "Reverb", "KChorus", "KDelayLine", "KDelay", "KDelayTape", "KCompressor"})
    registry.Register(KString::Static(key), CreateProbe, {});
  registry.Register(KString::Widen("KChorus"), CreateNothing, {});  // a duplicate keeps the first record
  const struct {
    KString name;
    const char* key;
  } cases[] = {
      {"KChorus", "KChorus"}, {KString::Widen("Reverb"), "Reverb"}, {"KSampleWarmer", "SampleWarmer"},
      {"KReverb", "Reverb"},  // the short key wins over the earlier prefix match
      {"KKReverb", "-"}, {"kSampleWarmer", "-"}, {"Compressor", "-"},  // one "K" comes off; none is ever added
      {"KDel", "KDelayLine"}, {"KDelayT", "KDelay"}, {"KDelayTapeStereo", "KDelay"}, {"", "KReverbPlate"},
      {KString::FromUtf8("KDelayLine" + std::string(80, 'x')), "KDelayLine"}, {"KFlanger", "-"},
  };
  for (const auto& [name, key] : cases) {
    const KPluginRecord* record = registry.Find(name);
    EXPECT_EQ(record ? record->key.ToUtf8() : "-", key) << name.ToUtf8();
  }
  EXPECT_EQ(registry.Count(), 8);
  EXPECT_EQ(registry.Find("KChorus")->factory, CreateProbe);

  KModule module("KDela");
  const std::unique_ptr<KAudioPlugin> plugin(registry.Create("KDela", &module));
  ASSERT_NE(plugin, nullptr);
  EXPECT_EQ(plugin->Identifier().ToUtf8(), "KDela");  // not the key it was found under
  EXPECT_EQ(static_cast<KProbePlugin&>(*plugin).context, &module);
  EXPECT_EQ(static_cast<KProbePlugin&>(*plugin).record, &registry.Record(4));
  try {
    delete registry.Create(KString::FromUtf8("N\u00F6pe"), nullptr);
    ADD_FAILURE() << "created";
  } catch (const KException& failure) {
    EXPECT_EQ(failure.Message().ToUtf8(), "Plugin N\u00F6pe hasn't been found.");
  }
}

namespace {
const KPluginDescription kTestPlugins[] = {
    {"KStereoWidth", CreateProbe, "StereoWidth", "Stereo"}, {"KCompressor", CreateProbe, "Compressor", "Dynamics"},
    {"KPipeline", CreateProbe, nullptr, nullptr},           {"KReverb", CreateProbe, "Reverb", "Reverb & Delay"},
    {"KWarmer", CreateNothing, "Warmer", "Distortion"},     {"KChorus", CreateProbe, "Chorus", "Modulation"},
    {"KVocoder", CreateProbe, "Vocoder", "Special"},        {"KEqualizer", CreateProbe, "Equalizer", "EQs & Filters"},
    {"KLimiter", CreateProbe, "Limiter", "Dynamics"},
};
const char* const kTestHosts[] = {"KPipeline", "KPipelineMini"};
}  // namespace

// The main registry keeps catalogue order; the module registry lists short keys by category.
// Thousands of further plug-ins make the build last long enough for the threads to meet in it.
TEST(KRegistries, BuiltOnceFromManyThreadsWithModulesInCategoryOrder) {
  std::vector<KPluginDescription> entries(std::begin(kTestPlugins), std::end(kTestPlugins));
  std::vector<std::string> keys(20000);
  for (size_t i = 0; i < keys.size(); ++i)
    entries.push_back({(keys[i] = "KMore" + std::to_string(i)).c_str(), CreateProbe, nullptr, nullptr});
  const KCatalogue catalogue{entries, kTestHosts};
  KRegistries registries(catalogue);
  EXPECT_EQ(registries.Main().Count(), 0);  // nothing happens before first use
  std::latch start(8);
  std::vector<std::pair<int32_t, int32_t>> seen(8);
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      registries.EnsureBuilt();
      seen[t] = {registries.Main().Count(), registries.Modules().Count()};  // complete once EnsureBuilt returns
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(seen, (std::vector<std::pair<int32_t, int32_t>>(8, {20009, 8})));
  std::vector<std::string> main = Listed(registries.Main());
  main.resize(9);
  EXPECT_EQ(main, (std::vector<std::string>{"KStereoWidth/", "KCompressor/", "KPipeline/", "KReverb/", "KWarmer/", "KChorus/",
                                            "KVocoder/", "KEqualizer/", "KLimiter/"}));
  EXPECT_EQ(Listed(registries.Modules()),
            (std::vector<std::string>{"Compressor/Dynamics", "Limiter/Dynamics", "Equalizer/EQs & Filters", "Warmer/Distortion",
                                      "Reverb/Reverb & Delay", "Chorus/Modulation", "Vocoder/Special", "StereoWidth/Stereo"}));
  EXPECT_EQ(registries.Modules().Find("KWarmer")->factory, CreateNothing);  // found by the plug-in's name
  EXPECT_EQ(registries.FileTypes().Count(), 1);  // a second build would have added another
  EXPECT_EQ(registries.PipelineHosts().Count(), 2);
}
