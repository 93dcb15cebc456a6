// How `torvane` names plug-ins, parameters, values and presets, and how it chains and batches.
#include <gmock/gmock.h>

#include "tests/tools/CliFixture.h"

// A value with a unit is converted into working units or refused when out of range; before,
// "attack=5 s" became 1 s and "gain=-30 dB" -24 dB without a word. The ends themselves are values.
TEST_F(CliTest, ValuesWithUnitsAreConvertedOrRefusedNeverClamped) {
  const std::string state = Run(Sets({"state", "KCompressorPlugin"}, {"attack=0.5", "gain=-24", "release=2"})).out;
  ASSERT_FALSE(state.empty());
  EXPECT_EQ(Run(Sets({"state", "KCompressorPlugin"}, {"attack=0.5 s", "gain=-24 dB", "release=2000 ms"})).out, state);
  EXPECT_EQ(Run(Sets({"state", "KCompressorPlugin"}, {"ATTACK=500 MS", "Gain=-24 db", "release=2 S"})).out, state);
  for (const auto& [plugin, assignment, range] :
       {std::tuple{"KCompressorPlugin", "attack=5 s", "(0.01 ms to 1000 ms)"}, {"KCompressorPlugin", "attack=0.001 ms", "(0.01 ms to 1000 ms)"},
        {"KCompressorPlugin", "gain=-30 dB", "(-24.0 dB to 24.0 dB)"}, {"KCompressorPlugin", "ratio=30:1", "(1.00 : 1 to 20.00 : 1)"},
        {"KEqualizerPlugin", "band1freq=30 kHz", "(20.0 Hz to 20000 Hz)"}, {"KUtilityPlugin", "balance=150 L", "(100 L to 100 R)"}}) {
    const CliRun run = Run({"state", plugin, "--set", assignment});
    EXPECT_EQ(run.exit, 1) << assignment;
    EXPECT_THAT(run.err, testing::HasSubstr("The value " + std::string(assignment).substr(std::string(assignment).find('=') + 1) + " of '")) << assignment;
    EXPECT_THAT(run.err, testing::HasSubstr(std::string("is out of range ") + range)) << run.err;
  }
  for (const char* end : {"attack=1000 ms", "attack=0.01 ms", "gain=24 dB", "ratio=20:1", "gain=0 dB"})
    EXPECT_EQ(Run({"state", "KCompressorPlugin", "--set", end}).exit, 0) << end;
  EXPECT_EQ(Run({"state", "KUtilityPlugin", "--set", "balance=100 L"}).exit, 0);
}

// Plug-ins by key or module name and parameters by key, in any letter case; close misses are
// suggested. Every name `list --modules` prints is one `info` and `render` accept (before, none was).
TEST_F(CliTest, NamesAreFoundIgnoringCaseAndMissesAreSuggested) {
  const std::string state = Run({"state", "KCompressorPlugin", "--set", "kneemode=Soft"}).out;
  EXPECT_EQ(Run({"state", "kcompressorplugin", "--set", "KNEEMODE=SOFT"}).out, state);
  EXPECT_EQ(Run({"state", "compressor", "--set", "KneeMode=soft"}).out, state);
  const std::string modules = Run({"list", "--modules"}).out;
  ASSERT_FALSE(modules.empty());
  std::istringstream lines(modules);
  for (std::string line; std::getline(lines, line);) {
    const std::string module = line.substr(line.find('\t') + 1);
    const CliRun info = Run({"info", module});
    EXPECT_EQ(info.exit, 0) << module << ": " << info.err;
    EXPECT_EQ(Run({"render", module, "--block", "512", "out.wav", "-q"}).exit, 0) << module;
  }
  const CliRun plugin = Run({"info", "Equaliser"});
  EXPECT_EQ(plugin.exit, 1);
  EXPECT_THAT(plugin.err, testing::HasSubstr("Unknown plug-in 'Equaliser'. Did you mean Equalizer?"));
  const CliRun parameter = Run({"state", "KCompressorPlugin", "--set", "Kneemod=Soft"});
  EXPECT_THAT(parameter.err, testing::HasSubstr("Unknown parameter 'Kneemod' of KCompressorPlugin. Did you mean kneemode"));
}

// `info` gives default and range in the parameter's own unit, and the entries of lists; the
// JSON form likewise (before, "unit": "ms" stood beside values in seconds).
TEST_F(CliTest, InfoShowsUnitsRangesAndListEntriesAlike) {
  const std::string text = Run({"info", "KCompressorPlugin"}).out;
  EXPECT_THAT(text, testing::ContainsRegex("attack +Attack +10.0 ms +0.01 .. 1000 ms\n"));
  EXPECT_THAT(text, testing::ContainsRegex("kneemode +Knee mode +Hard +Hard, Linear, Soft\n"));
  EXPECT_THAT(text, testing::ContainsRegex("SideChainInput .* Off, On \\(not automatable\\)\n"));
  const std::string json = Run({"info", "KCompressorPlugin", "--json"}).out;
  EXPECT_THAT(json, testing::HasSubstr("\"key\": \"attack\", \"name\": \"Attack\", \"unit\": \"ms\", \"default\": \"10.0\", \"minimum\": \"0.01\", "
                                       "\"maximum\": \"1000\", \"entries\": [], \"working\": {\"default\": 0.01, \"minimum\": 0.00001, \"maximum\": 1}"));
  EXPECT_THAT(json, testing::HasSubstr("\"key\": \"kneemode\", \"name\": \"Knee mode\", \"unit\": \"\", \"default\": \"Hard\", \"minimum\": \"Hard\", "
                                       "\"maximum\": \"Soft\", \"entries\": [\"Hard\", \"Linear\", \"Soft\"]"));
}

// --preset takes a file or a saved preset's name; `presets list` tells where they are kept; the
// state of another plug-in is refused (it loaded "successfully" with no effect before).
TEST_F(CliTest, PresetsAreFoundByNameAndMustBelongToThePlugin) {
  const Audio direct = Render(Sets({"KCompressorPlugin", "in.wav"}, {"threshold=0.1", "ratio=8"}));
  ASSERT_EQ(Run(Sets({"presets", "KCompressorPlugin", "save", "Hard hitter"}, {"threshold=0.1", "ratio=8"})).exit, 0);
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "Hard hitter"}), direct));
  EXPECT_TRUE(Same(Render({"KCompressorPlugin", "in.wav", "--preset", "hard HITTER"}), direct));
  const CliRun list = Run({"presets", "KCompressorPlugin", "list"});
  EXPECT_EQ(list.out, "Gentle bus\nVocal leveler\nDrum punch\nHard hitter\n");
  EXPECT_THAT(list.err, testing::HasSubstr("Presets of KCompressorPlugin are kept in " + (root_ / "data").string()));
  EXPECT_THAT(list.err, testing::HasSubstr("presets.xml"));

  std::ofstream(Work() / "utility.xml") << Run({"state", "KUtilityPlugin", "--set", "gain=-6"}).out;
  const std::pair<Words, std::string> failures[] = {
      {{"render", "KCompressorPlugin", "in.wav", "out.wav", "--preset", "utility.xml"},
       "The preset file 'utility.xml' holds the state of KUtilityPlugin, not of KCompressorPlugin."},
      {{"render", "KCompressorPlugin", "in.wav", "out.wav", "--preset", "Hard hiter"},
       "There is no preset file, factory preset or saved preset 'Hard hiter' of KCompressorPlugin. Did you mean Hard hitter?"},
  };
  for (const auto& [words, message] : failures) {
    const CliRun run = Run(words);
    EXPECT_EQ(run.exit, 1);
    EXPECT_THAT(run.err, testing::HasSubstr(message));
  }
}

// Automating what cannot be automated, or what --set also sets, is an error; before, the first
// was accepted and the second silently overrode the --set.
TEST_F(CliTest, AutomationOfFixedOrAlreadySetParametersIsRefused) {
  const std::pair<Words, std::string> failures[] = {
      {{"render", "KCompressorPlugin", "out.wav", "--automate", "SideChainInput=0:0,1:1"}, "'SideChainInput' of KCompressorPlugin cannot be automated."},
      {{"render", "KCompressorPlugin", "out.wav", "--set", "threshold=0.2", "--automate", "Threshold=0:0.5,1:0.1"},
       "'threshold' is both set and automated: give --set or --automate."},
  };
  for (const auto& [words, message] : failures) {
    const CliRun run = Run(words);
    EXPECT_EQ(run.exit, 1);
    EXPECT_THAT(run.err, testing::HasSubstr(message));
    EXPECT_FALSE(fs::exists(Work() / "out.wav"));
  }
}

// A chain renders as its plug-ins one after the other through files, the saturator's latency
// compensated wherever it stands, so that the output lines up with the input; --output-dir renders each input as it would alone.
TEST_F(CliTest, ChainsAndBatchesRenderAsSingleRunsDo) {
  const Words warmer{"KSampleWarmer", "--set", "drive=20"}, compressor{"KCompressorPlugin", "--set", "threshold=0.1", "--set", "ratio=6"};
  for (const auto& [first, second] : {std::pair{warmer, compressor}, std::pair{compressor, warmer}}) {
    Words one = first, two = second, chain = first;
    one.insert(one.end(), {"in.wav", "--format", "f32"});
    one.insert(one.begin(), "render"), one.push_back("step.wav");
    ASSERT_EQ(Run(one).exit, 0);
    two.insert(two.begin() + 1, "step.wav");
    const Audio series = Render(two);
    chain.push_back("+");
    chain.insert(chain.end(), second.begin(), second.end());
    chain.push_back("in.wav");
    // After the saturator the compressor also hears the saturator's first output, which a
    // series of files cuts: their renders agree within rounding once the detector has settled.
    const Audio chained = Render(chain);
    if (first != warmer) {
      EXPECT_TRUE(Same(chained, series)) << first[0] << " + " << second[0];
      continue;
    }
    ASSERT_EQ(chained.samples.size(), series.samples.size());
    double largest = 0.0;
    for (size_t i = 4800 * 2; i < series.samples.size(); ++i) largest = std::max(largest, std::fabs(double{chained.samples[i]} - series.samples[i]));
    EXPECT_LT(largest, 1e-6);
  }
  AudioFile(Work() / "second.wav", Render({"KUtilityPlugin", "in.wav", "--set", "gain=-6"}));
  const CliRun batch = Run({"render", "KCompressorPlugin", "in.wav", "second.wav", "--set", "ratio=4", "--output-dir", "rendered", "-q"});
  ASSERT_EQ(batch.exit, 1) << "the folder must exist";
  fs::create_directory(Work() / "rendered");
  ASSERT_EQ(Run({"render", "KCompressorPlugin", "in.wav", "second.wav", "--set", "ratio=4", "--output-dir", "rendered", "-q"}).exit, 0);
  for (const char* name : {"in.wav", "second.wav"})
    EXPECT_TRUE(Same(AudioFile(Work() / "rendered" / name), Render({"KCompressorPlugin", name, "--set", "ratio=4"}))) << name;
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "in.wav", "second.wav", "--output-dir", "rendered", "-t", "flac"}).exit, 0);
  EXPECT_TRUE(fs::exists(Work() / "rendered" / "in.flac") && fs::exists(Work() / "rendered" / "second.flac"));
}

TEST_F(CliTest, VersionIsTheProjectVersion) { EXPECT_EQ(Run({"--version"}).out, std::string("torvane ") + TORVANE_VERSION + "\n"); }
