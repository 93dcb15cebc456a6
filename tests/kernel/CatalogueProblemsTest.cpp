// Faults of a catalogue's descriptions are sentences, one per fault, never a crash; and the rules
// that derive identifiers from a description.
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace {
KAudioPlugin* CreateNothing(KModule*, const KPluginRecord*) { return nullptr; }

constexpr KPluginDescription kGain{.key = "KGainPlugin", .factory = CreateNothing, .moduleKey = "Gain", .category = "Stereo",
                                   .name = "Gain", .vst3SubCategories = "Fx|Tools", .vst2Id = "TvGa", .identity = "KGainPlugin"};
constexpr KPluginDescription kDelay{.key = "KDelay", .factory = CreateNothing, .moduleKey = nullptr, .category = nullptr,
                                    .name = "Delay", .vst3SubCategories = "Fx|Delay", .vst2Id = "TvDe", .identity = "KDelay"};

std::vector<std::string> Problems(const std::function<void(KPluginDescription& gain, KPluginDescription& delay)>& spoil) {
  std::vector<KPluginDescription> plugins{kGain, kDelay};
  spoil(plugins[0], plugins[1]);
  std::vector<std::string> problems;
  for (const KString& problem : KCatalogueProblems(KCatalogue{plugins, {}})) problems.push_back(problem.ToUtf8());
  return problems;
}
using Spoil = std::function<void(KPluginDescription&, KPluginDescription&)>;
}  // namespace

TEST(KCatalogueProblems, EveryFaultIsOneSentenceNamingThePlugin) {
  const std::pair<Spoil, std::vector<std::string>> cases[] = {
      {[](auto&, auto&) {}, {}},
      {[](auto&, auto& d) { d.name = nullptr; }, {"KDelay has no name."}},
      {[](auto&, auto& d) { d.vst3SubCategories = ""; }, {"KDelay has no VST 3 sub-categories."}},
      {[](auto& g, auto&) { g.factory = nullptr; }, {"KGainPlugin has no factory."}},
      {[](auto& g, auto&) { g.version = nullptr; }, {"KGainPlugin has no version."}},
      {[](auto&, auto& d) { d.key = nullptr; }, {"plug-in 2 has no key."}},
      {[](auto&, auto& d) { d.key = "Delay"; }, {"Delay: a key begins with \"K\"."}},
      {[](auto& g, auto&) { g.vst2Id = "TvGain"; }, {"KGainPlugin: the VST 2 id \"TvGain\" is not four printable ASCII characters."}},
      {[](auto& g, auto&) { g.vst2Id = "Tv\tG"; }, {"KGainPlugin: the VST 2 id \"Tv\tG\" is not four printable ASCII characters."}},
      {[](auto& g, auto&) { g.category = "Loud"; }, {"KGainPlugin is a module of no known category."}},
      {[](auto&, auto& d) { d.vst2Id = "TvGa"; }, {"KGainPlugin and KDelay share the VST 2 id \"TvGa\"."}},
      {[](auto&, auto& d) { d.moduleKey = "Gain", d.category = "Stereo"; }, {"KGainPlugin and KDelay share the module key \"Gain\"."}},
      // a renamed key keeps its identity, so two plug-ins cannot end up with one class id
      {[](auto&, auto& d) { d.identity = "KGainPlugin"; },
       {"KGainPlugin and KDelay share the identity \"KGainPlugin\".", "KGainPlugin and KDelay share the VST 3 class id",
        "KGainPlugin and KDelay share the AAX plug-in id"}},
      {[](auto&, auto& d) { d.key = "KGain", d.identity = "KGain"; }, {"KGainPlugin and KGain share the bundle name \"Gain\"."}},
      {[](auto&, auto& d) { d.key = "KGainPlugin", d.identity = "KGain2"; },
       {"KGainPlugin and KGainPlugin share the key \"KGainPlugin\".", "KGainPlugin and KGainPlugin share the bundle name \"Gain\"."}},
  };
  int index = 0;
  for (const auto& [spoil, expected] : cases) {
    const std::vector<std::string> problems = Problems(spoil);
    ASSERT_EQ(problems.size(), expected.size()) << "case " << index << ": " << (problems.empty() ? "" : problems[0]);
    for (size_t i = 0; i < expected.size(); ++i) EXPECT_EQ(problems[i].substr(0, expected[i].size()), expected[i]) << "case " << index;
    ++index;
  }
}

TEST(KPluginIds, RulesOnTheirEdges) {
  EXPECT_EQ(KPluginIds::FNV1a64(""), 0xCBF29CE484222325ull);  // the offset basis
  EXPECT_EQ(KPluginIds::FNV1a64("a"), 0xAF63DC4C8601EC8Cull);  // the published value for "a"
  EXPECT_EQ(KPluginIds::VST2UniqueId("TvCo"), 0x5476436F);
  EXPECT_EQ(KPluginIds::VST2UniqueId("\xFF\xFF\xFF\xFF"), -1);  // the top bit is the sign
  EXPECT_EQ(KPluginIds::BundleName("KCompressorPlugin"), "Compressor");
  EXPECT_EQ(KPluginIds::BundleName("KSampleWarmer"), "SampleWarmer");
  EXPECT_EQ(KPluginIds::BundleName("KPlugin"), "Plugin");  // nothing would be left
  EXPECT_EQ(KPluginIds::BundleName("Plain"), "Plain");
}
