// What `torvane` lists, renders and refuses, against the kernel processing the same audio here.
#include <gmock/gmock.h>

#include <algorithm>
#include <memory>
#include <set>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KRegistries.h"
#include "tests/tools/CliFixture.h"

namespace {

// What a render must equal: the plug-in fed the input in blocks, then its latency in silence, that many frames cut.
Audio ProcessDirectly(const char* key, const Audio& input, int32_t block, const Words& assignments) {
  const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::FromUtf8(key)));
  EXPECT_TRUE(plugin->SetChannelsPerBus(input.channels) && plugin->SetSampleRate(input.rate));
  for (const std::string& a : assignments) plugin->FindParameter(KString::FromUtf8(a.substr(0, a.find('='))))->SetWorking(std::stod(a.substr(a.find('=') + 1)));
  const int64_t latency = plugin->TotalLatency(), frames = static_cast<int64_t>(input.samples.size()) / input.channels;
  std::vector<std::vector<float>> planes(plugin->InputChannelCount(), std::vector<float>(block));  // in place
  std::vector<float*> pointers;
  for (auto& plane : planes) pointers.push_back(plane.data());
  Audio result{plugin->OutputChannelCount(), input.rate, {}};
  for (int64_t at = 0; at < frames + latency; at += block) {
    const int32_t n = static_cast<int32_t>(std::min<int64_t>(block, frames + latency - at));
    for (int c = 0; c < plugin->InputChannelCount(); ++c)
      for (int32_t i = 0; i < n; ++i) planes[c][i] = c < input.channels && at + i < frames ? input.samples[(at + i) * input.channels + c] : 0.0f;
    plugin->ProcessHostBlock(pointers.data(), pointers.data(), n);
    for (int64_t i = std::max<int64_t>(0, latency - at); i < n; ++i)
      for (int c = 0; c < result.channels; ++c) result.samples.push_back(planes[c][i]);
  }
  return result;
}

}  // namespace

TEST_F(CliTest, ListsRegistryKeysInOrderAndModulesByCategory) {
  std::string keys, modules;
  for (const KPluginDescription& entry : KProductCatalogue().plugins) keys += entry.key + std::string("\n");
  for (const char* category : KRegistries::kCategories)
    for (const KPluginDescription& entry : KProductCatalogue().plugins)
      if (entry.moduleKey && std::string(category) == entry.category) modules += std::string(category) + "\t" + entry.moduleKey + "\n";
  EXPECT_EQ(Run({"list"}).out, keys);
  EXPECT_EQ(Run({"list", "--modules"}).out, modules);
}

// The saturator has latency (cut by the renderer); a keyed compressor hears silence without --sidechain.
// Random block sizes render as 512 does: none of these plug-ins depends on where blocks begin.
TEST_F(CliTest, RenderEqualsTheKernelProcessingTheSameBlocks) {
  const std::pair<const char*, Words> cases[] = {{"KSampleWarmer", {"drive=20", "tone=40", "shape=0"}},
                                                 {"KCompressorPlugin", {"threshold=0.1", "ratio=6", "attack=0.0005", "rmslength=0.01"}},
                                                 {"KCompressorPlugin", {"SideChainInput=1", "threshold=0.05", "ratio=10"}},
                                                 {"KEqualizerPlugin", {"band2gain=12", "band1type=2", "band6type=5", "band6q=4"}}};
  for (const std::string block : {"37", "64", "random"})
    for (const auto& [plugin, assignments] : cases)
      EXPECT_TRUE(Same(Render(Sets({plugin, "in.wav", "--block", block}, assignments)),
                       ProcessDirectly(plugin, AudioFile(Work() / "in.wav"), block == "random" ? 512 : std::stoi(block), assignments)))
          << plugin << " " << assignments[0] << " in blocks of " << block;
}

// Each pair renders alike, and unlike the defaults (the settings were heard).
TEST_F(CliTest, DisplayTextSetsWhatWorkingUnitsSet) {
  for (const auto& [plugin, text, working] :
       {std::tuple{"KCompressorPlugin", Words{"kneemode=Soft", "linkchannels=off", "attack=5 ms", "threshold=0.2"},
                   Words{"kneemode=2", "linkchannels=0", "attack=0.005", "threshold=0.2"}},
        std::tuple{"KEqualizerPlugin", Words{"band1type=Low shelf", "band1gain=6 dB"}, Words{"band1type=2", "band1gain=6"}}}) {
    const Audio byText = Render(Sets({plugin, "in.wav"}, text));
    EXPECT_TRUE(Same(byText, Render(Sets({plugin, "in.wav"}, working)))) << plugin;
    EXPECT_FALSE(Same(byText, Render({plugin, "in.wav"}))) << plugin;
  }
}

// The state document as a --preset file, and as a preset saved, listed, loaded and deleted.
TEST_F(CliTest, SavedStateAndPresetsRenderLikeTheSettingsGiven) {
  const Words settings{"threshold=0.1", "kneemode=Soft", "ratio=8", "release=0.3"};
  const Audio direct = Render(Sets({"KCompressorPlugin", "in.wav"}, settings));
  EXPECT_FALSE(Same(Render({"KCompressorPlugin", "in.wav"}), direct));
  std::ofstream(Work() / "state.xml") << Run(Sets({"state", "KCompressorPlugin"}, settings)).out;
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "state.xml"}), direct));
  EXPECT_EQ(Run(Sets({"presets", "KCompressorPlugin", "save", "Hard hitter"}, settings)).exit, 0);
  EXPECT_EQ(Run({"presets", "KCompressorPlugin", "save", "Gentle", "--set", "ratio=1.5"}).exit, 0);
  const std::string factory = "Gentle bus\nVocal leveler\nDrum punch\n";  // the plug-in's own, first
  EXPECT_EQ(Run({"presets", "KCompressorPlugin", "list"}).out, factory + "Hard hitter\nGentle\n");  // then in saving order
  std::ofstream(Work() / "loaded.xml") << Run({"presets", "KCompressorPlugin", "load", "Hard hitter"}).out;
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "loaded.xml"}), direct));
  EXPECT_EQ(Run({"presets", "KCompressorPlugin", "delete", "Hard hitter"}).exit, 0);
  EXPECT_EQ(Run({"presets", "KCompressorPlugin"}).out, factory + "Gentle\n");
}

// A factory preset by name, in any case, renders as its values set one by one; its state names it
// as the current factory preset; it is never deleted nor shadowed by a saved preset.
TEST_F(CliTest, FactoryPresetsLoadByNameAndCannotBeChanged) {
  const Audio direct = Render({"KCompressorPlugin", "in.wav", "--set", "threshold=0.3", "--set", "ratio=6", "--set", "attack=0.02",
                               "--set", "release=0.06", "--set", "kneemode=1"});
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "Drum punch"}), direct));
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "drum PUNCH"}), direct));
  const CliRun loaded = Run({"presets", "KCompressorPlugin", "load", "Drum punch"});
  EXPECT_THAT(loaded.out, testing::HasSubstr("<ActivePreset Current=\"1\" Factory=\"1\" Name=\"Drum punch\""));
  const std::pair<Words, std::string> refusals[] = {
      {{"presets", "KCompressorPlugin", "delete", "Drum punch"}, "'Drum punch' is a factory preset, which cannot be deleted."},
      {{"presets", "KCompressorPlugin", "save", "Drum punch"}, "'Drum punch' is the name of a factory preset; please choose another name."},
  };
  for (const auto& [words, message] : refusals) {
    const CliRun run = Run(words);
    EXPECT_EQ(run.exit, 1);
    EXPECT_THAT(run.err, testing::HasSubstr(message));
  }
  const CliRun list = Run({"presets", "KCompressorPlugin", "list"});
  EXPECT_EQ(list.out, "Gentle bus\nVocal leveler\nDrum punch\n");
  EXPECT_THAT(list.err, testing::HasSubstr("The first 3 are factory presets"));
}

// Gain automated from -60 to 0 dB over the demo: the gain heard per tenth rises from about -57 to -3 dB.
// Automation moves on a grid of the stream, not of the host's blocks: any block size, random ones
// too, renders the same automation bit for bit (here the gain, and a compressor's threshold).
TEST_F(CliTest, AutomationRampsTheGainOverTheDemoAndRendersAlikeInAnyBlocks) {
  const Audio dry = Render({"KUtilityPlugin"});
  std::vector<Audio> renders;
  for (const char* block : {"512", "64", "random"}) {
    const Audio& wet = renders.emplace_back(Render({"KUtilityPlugin", "--automate", "gain=0:-60,8:0", "--block", block}));
    ASSERT_EQ(wet.samples.size(), dry.samples.size());
    std::vector<double> energy(20), gains;
    for (size_t i = 0, tenth = dry.samples.size() / 10; i < 10 * tenth; ++i)
      energy[i / tenth] += std::pow(wet.samples[i], 2), energy[10 + i / tenth] += std::pow(dry.samples[i], 2);
    for (size_t i = 0; i < 10; ++i) gains.push_back(10.0 * std::log10(energy[i] / energy[10 + i]));
    EXPECT_TRUE(std::is_sorted(gains.begin(), gains.end(), std::less_equal<>()) && std::abs(gains.front() + 57.0) < 2.0 &&
                std::abs(gains.back() + 3.0) < 1.0) << block << ": " << testing::PrintToString(gains);
  }
  EXPECT_TRUE(Same(renders[0], renders[1]) && Same(renders[0], renders[2]));
  const Audio compressed = Render({"KCompressorPlugin", "in.wav", "--automate", "threshold=0:0.5,1:0.1", "--block", "512"});
  EXPECT_FALSE(Same(compressed, Render({"KCompressorPlugin", "in.wav", "--set", "threshold=0.5"})));  // the ramp moved it
  for (const char* block : {"32", "500", "random"})
    EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--automate", "threshold=0:0.5,1:0.1", "--block", block}), compressed)) << block;
}

// Every bad command line: its message on stderr, a failing exit, nothing on stdout and no file
// left behind, not even a hidden partial one.
TEST_F(CliTest, EveryBadInputIsOneMessageAFailingExitAndNoFile) {
  std::ofstream(Work() / "notes.txt") << "not audio\n";
  std::ofstream(Work() / "broken.xml") << "<TorvaneState Plugin=\"KUtilityPlugin\"><Parameters gain=";
  fs::create_directory(Work() / "taken.wav");  // an output name held by a folder
  const std::tuple<Words, Words, long> failures[] = {  // the words; parts of the message; its lines
      {{"render", "KCompresorPlugin", "out.wav"}, {"Unknown plug-in 'KCompresorPlugin'. Did you mean KCompressorPlugin?"}, 1},
      {{"render", "KCompressorPlugin", "out.wav", "--set", "treshold=0.5"}, {"Unknown parameter 'treshold'", "Did you mean threshold?"}, 1},
      {{"render", "KCompressorPlugin", "out.wav", "--set", "ratio=50"}, {"'ratio' is out of range (1 to 20)."}, 1},
      {{"render", "KCompressorPlugin", "out.wav", "--automate", "kneemode=0:0,1:Medium"}, {"expected one of Hard, Linear, Soft."}, 1},
      {{"render", "KUtilityPlugin", "missing.wav", "out.wav"}, {"Cannot read the audio of 'missing.wav'"}, 1},
      {{"render", "KUtilityPlugin", "notes.txt", "out.wav"}, {"Cannot read the audio of 'notes.txt'"}, 1},
      {{"render", "KUtilityPlugin", "in.wav", "nowhere/out.wav"}, {"Could not write the file 'nowhere/out.wav'"}, 1},
      {{"render", "KUtilityPlugin", "in.wav", "taken.wav"}, {"'taken.wav'", "Is a directory"}, 1},
      {{"render", "KUtilityPlugin", "in.wav", "out.wav", "--preset", "broken.xml"}, {"The preset file 'broken.xml' cannot be loaded: "}, 1},
      {{"render", "KUtilityPlugin", "in.wav", "out.wav", "--sidechain", "in.wav"}, {"KUtilityPlugin has no side-chain input."}, 1},
      {{"render", "KUtilityPlugin", "out.wav", "--bogus"}, {"Unknown option '--bogus' for 'render'."}, 1},
  };
  for (const auto& [words, message, lines] : failures) {
    const std::set<fs::path> before(fs::recursive_directory_iterator(Work()), {});
    const CliRun run = Run(words);
    const std::string command = testing::PrintToString(words);
    EXPECT_TRUE(run.exit != 0 && run.out.empty()) << command << " exited with " << run.exit << ", printing " << run.out;
    for (const std::string& part : message) EXPECT_THAT(run.err, testing::HasSubstr(part)) << command;
    EXPECT_EQ(std::count(run.err.begin(), run.err.end(), '\n'), lines) << command << run.err;
    EXPECT_EQ(std::set<fs::path>(fs::recursive_directory_iterator(Work()), {}), before) << command;
  }
}
