// The plug-in's state document, presets and undo through a small MIDI plug-in with curved
// parameter kinds: defaults left out, bit 2 cleaning, all-or-nothing reading, exact round trips,
// controllers, locks and kept sections. Presets go to a fresh folder (XDG_DATA_HOME).
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <cstdlib>
#include <optional>
#include <random>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "core/KPresetStore.h"
#include "core/KStateSection.h"
#include "core/KXMLReader.h"
#include "kernel/KException.h"
#include "kernel/platform/KPlatform.h"

namespace {
const KDecibelKind kGainKind(-60.0, 24.0);
const KFrequencyKind kFrequencyKind(20.0, 20000.0);
const KTimeKind kTimeKind(0.0001, 2.0);
const KRatioKind kRatioKind(1.0, 20.0);
constexpr const char* kModes[] = {"Soft", "Hard", "Tube"};
const KListKind kModeKind(kModes);
constexpr uint32_t kAuto = KParameterInfo::kAutomatable;
constexpr KParameterInfo kParameters[] = {
    {"gain", "Gain", &kGainKind, 0.0, kAuto},      {"frequency", "Frequency", &kFrequencyKind, 1000.0, kAuto},
    {"attack", "Attack", &kTimeKind, 0.01, kAuto}, {"ratio", "Ratio", &kRatioKind, 4.0, kAuto},
    {"mode", "Mode", &kModeKind, 1.0, kAuto},
};
enum : int32_t { kGain, kFrequency, kAttack, kRatio, kMode };

// Passes audio through; its own "Curve" setting goes through the plug-in section hook.
class KStatePlugin final : public KAudioPlugin {
public:
  KStatePlugin() : KAudioPlugin(kParameters, Shape{1, 1, true, false, false}) { SetIdentifier("State Test"); }
  double Working(int32_t p) const { return GetParameter(p).Working(); }
  int32_t curve = 0;

protected:
  void Process(const float* const* in, float* const* out, int32_t n) override {
    std::copy_n(in[0], n, out[0]), std::copy_n(in[1], n, out[1]);
  }
  void StorePluginSettings(Element& section, uint32_t flags) override {
    KStateSection(section, flags).Integer("Curve", curve, 0);
  }
};

// Two sounds shipped with the plug-in: the second also leaves a value at its default.
constexpr KFactoryPreset::Value kBrightValues[] = {{"gain", -6.0}, {"frequency", 4000.0}};
constexpr KFactoryPreset::Value kDarkValues[] = {{"frequency", 200.0}, {"mode", 2.0}, {"ratio", 4.0}};
constexpr KFactoryPreset kFactory[] = {{"Bright", kBrightValues}, {"Dark", kDarkValues}};

// A working value to a millionth: curved kinds do not give back every value bit for bit.
double Rounded(double value) { return std::round(value * 1e6) / 1e6; }

std::vector<std::string> Names(const KStringList& list) {
  std::vector<std::string> names;
  for (const KString& name : list) names.push_back(name.ToUtf8());
  return names;
}

// Something non-default in every section this product interprets.
void Change(KStatePlugin& plugin) {
  for (int32_t p = 0; p < plugin.ParameterCount(); ++p) plugin.GetParameter(p).SetNormalized(0.3 + 0.1 * p);
  plugin.SetChannelMode(3), plugin.SetBypass(true);
  KGlobalSettings& g = plugin.GlobalSettings();
  g.surroundVolume = -3.5;
  g.programChange.values.Append(4), g.programChange.values.Append(-1);
  g.programChange.folder = KString::FromUtf8("Drums & \"Bass\" <\xC3\xA9>");
  g.upsampling = 2, g.hqUpsampling = true, g.editorSize = {900, 600}, g.enableLatencyReporting = false;
  plugin.SetParameterLocked(kRatio, true);
  plugin.Controllers().Assign({7, 2, kFrequency}), plugin.Controllers().SetSingleChannel(true);
  plugin.curve = 2;
}

int32_t CountAttributes(const Element& e) {
  int32_t count = e.Attributes().Count();
  for (int32_t i = 0; i < e.ChildCount(); ++i) count += CountAttributes(e.GetChild(i));
  return count;
}

class PluginState : public testing::Test {
protected:
  void SetUp() override {
    if (const char* old = std::getenv("XDG_DATA_HOME")) saved_ = old;
    setenv("XDG_DATA_HOME", folder_.c_str(), 1);
  }
  void TearDown() override {
    saved_ ? setenv("XDG_DATA_HOME", saved_->c_str(), 1) : unsetenv("XDG_DATA_HOME");
    KPlatform::RemoveFolderTree(folder_);
  }
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  std::optional<std::string> saved_;
  KStatePlugin plugin;
};
}  // namespace

TEST_F(PluginState, DefaultsAreLeftOutAndBitTwoRemovesValuesThatReturnedToThem) {
  Element fresh;
  plugin.StoreState(fresh);
  EXPECT_EQ(fresh.GetName().ToUtf8(), "TorvaneState");
  EXPECT_TRUE(CountAttributes(fresh) == 2 && fresh.ChildCount() == 0);  // Plugin and Version only

  Change(plugin);
  Element root;
  plugin.StoreState(root);
  const int32_t changed = CountAttributes(root);
  plugin.LoadState(Element("TorvaneState"));
  Element kept = root;
  plugin.StoreState(kept);  // without bit 2 the earlier values stay where they were
  EXPECT_EQ(kept.GetAttribute("ChannelMode").ToUtf8(), "Mono");
  EXPECT_TRUE(kept.FindChild("Parameters")->HasAttribute("gain"));
  EXPECT_EQ(CountAttributes(kept), changed - 3);  // but the controller entry is a list, rewritten
  plugin.StoreState(root, KAudioPlugin::kRemoveDefaults);
  EXPECT_EQ(CountAttributes(root), 2);
}

TEST_F(PluginState, AnEmptyRootRestoresEveryDefault) {
  const std::string defaults = plugin.WriteState();
  Change(plugin);
  ASSERT_NE(plugin.WriteState(), defaults);
  plugin.LoadState(Element("TorvaneState"));
  EXPECT_EQ(plugin.WriteState(), defaults);
}

TEST_F(PluginState, AChannelModeTextThatNamesNoEntryKeepsTheDefault) {
  const std::pair<const char*, int32_t> cases[] = {{"Mono", 3},  {"Stereo &amp; zero Mono", 10}, {"Ambisonics", 12},
                                                   {"mono", 0},  {"Mid/Side", 0},                {"", 0},
                                                   {"3", 0},     {"Left + Right (neg) ", 0}};
  for (const auto& [text, mode] : cases) {
    plugin.SetChannelMode(5);
    plugin.ReadState(std::string("<TorvaneState ChannelMode=\"") + text + "\"/>");
    EXPECT_EQ(plugin.ChannelMode(), mode) << text;
  }
}

TEST_F(PluginState, AFailedReadLeavesTheStateExactlyAsItWas) {
  Change(plugin);
  const std::string before = plugin.WriteState();
  const char* broken[] = {"", "<TorvaneState", "<TorvaneState Bypass=\"0\"><Parameters gain=\"1\"></TorvaneState>",
                          "<TorvaneState ChannelMode=Left/>", "<TorvaneState/><TorvaneState/>", "<Other Bypass=\"0\"/>"};
  for (const char* text : broken) {
    EXPECT_THROW(plugin.ReadState(text), KException) << text;
    EXPECT_EQ(plugin.WriteState(), before) << text;
  }
}

TEST_F(PluginState, StoreLoadStoreGivesIdenticalTextForAnyValues) {
  std::mt19937 random(7);
  std::uniform_real_distribution<double> unit(0.0, 1.0);
  Change(plugin);
  for (int round = 0; round < 300; ++round) {
    for (int32_t p = 0; round > 0 && p < plugin.ParameterCount(); ++p) plugin.GetParameter(p).SetNormalized(unit(random));
    const std::string text = plugin.WriteState();
    KStatePlugin copy;
    copy.ReadState(text);
    ASSERT_EQ(copy.WriteState(), text) << round;
    for (int32_t p = 0; p < plugin.ParameterCount(); ++p) ASSERT_EQ(copy.Working(p), plugin.Working(p)) << p;
  }
}

TEST_F(PluginState, SectionsOfARicherVersionSurviveARoundTrip) {
  const std::string text =
      "<TorvaneState><MultiParameters Count=\"1\"><MultiParameter Name=\"Macro\" Targets=\"1;3\"/></MultiParameters>"
      "<LFOs><LFO Rate=\"0.25\">sine</LFO></LFOs><Arpeggiator Pattern=\"up\"/>"
      "<Controllers><NoteControllers><NoteController Note=\"60\" Parameter=\"gain\"/></NoteControllers>"
      "<Controller Number=\"74\" Parameter=\"frequency\"/><Controller Number=\"3\" Parameter=\"missing\"/></Controllers>"
      "</TorvaneState>";
  plugin.ReadState(text);
  Element stored;
  plugin.StoreState(stored);
  const Element original = KXMLReader::Read(text);
  for (const char* name : {"MultiParameters", "LFOs", "Arpeggiator"})
    EXPECT_EQ(*stored.FindChild(KString::Static(name)), *original.FindChild(KString::Static(name))) << name;
  const Element* controllers = stored.FindChild("Controllers");
  ASSERT_NE(controllers, nullptr);
  EXPECT_EQ(*controllers->FindChild("NoteControllers"), *original.FindChild("Controllers")->FindChild("NoteControllers"));
  ASSERT_EQ(plugin.Controllers().Count(), 1);  // the entry for a parameter we lack is dropped
  EXPECT_EQ(plugin.Controllers().Get(0), (KControllerMap::Assignment{74, 0, kFrequency}));
}

TEST_F(PluginState, AnAssignedControllerMovesItsParameterInTheProcessingCycle) {
  struct Case { bool single, enabled; KMIDIBytes message; double expected; };  // frequency, normalised
  const double rest = plugin.GetParameter(kFrequency).DefaultNormalized();
  const Case cases[] = {{false, true, {0xB2, 7, 127, 0}, 1.0}, {false, true, {0xB5, 7, 1, 0}, 0.0},
                        {true, true, {0xB2, 7, 127, 0}, 1.0},  {true, true, {0xB5, 7, 127, 0}, rest},
                        {false, false, {0xB2, 7, 127, 0}, rest}, {false, true, {0xB2, 8, 127, 0}, rest},
                        {false, true, {0xB2, 64, 127, 0}, rest}};
  float left[64] = {}, right[64] = {};
  float* io[] = {left, right};
  plugin.Controllers().Assign({7, 2, kFrequency});
  plugin.Controllers().Assign({64, 2, kMode});  // the pedal never reaches an assignment
  for (const Case& c : cases) {
    plugin.GetParameter(kFrequency).SetNormalized(rest);
    plugin.Controllers().SetSingleChannel(c.single);
    plugin.Controllers().SetEnabled(c.enabled);
    plugin.ScheduleMIDIEvent(10, c.message);
    plugin.ProcessHostBlock(io, io, 64);
    EXPECT_EQ(plugin.GetParameter(kFrequency).Normalized(), c.expected) << int(c.message[0]) << " " << int(c.message[1]);
  }
  EXPECT_EQ(plugin.GetParameter(kMode).Working(), 1.0);
}

TEST_F(PluginState, APresetLoadHonoursLocksAndKeptControllersAndIsOneUndoStep) {
  plugin.GetParameter(kGain).SetWorking(-6.0), plugin.GetParameter(kFrequency).SetWorking(500.0);
  plugin.Controllers().Assign({1, 0, kGain});
  plugin.SavePreset("Warm");
  const double warm = plugin.Working(kFrequency);
  plugin.GetParameter(kGain).SetWorking(-12.0), plugin.GetParameter(kFrequency).SetWorking(2000.0);
  plugin.SetParameterLocked(kGain, true);
  plugin.Controllers().Clear(), plugin.Controllers().Assign({2, 0, kFrequency});
  plugin.Controllers().SetDoNotLoadFromPresets(true);
  plugin.UndoStore(kFrequency, plugin.GetParameter(kFrequency).Normalized());
  EXPECT_FALSE(plugin.IsActivePresetCurrent());
  const double before = plugin.Working(kFrequency);

  plugin.LoadPreset("Warm");
  EXPECT_EQ(plugin.Working(kGain), -12.0);
  EXPECT_EQ(plugin.Working(kFrequency), warm);
  EXPECT_TRUE(plugin.IsParameterLocked(kGain));
  EXPECT_EQ(plugin.Controllers().Get(0), (KControllerMap::Assignment{2, 0, kFrequency}));
  EXPECT_TRUE(plugin.IsActivePresetCurrent());
  EXPECT_EQ(plugin.GlobalSettings().presetIndex, 0);

  ASSERT_TRUE(plugin.CanUndo());
  plugin.Undo();
  EXPECT_EQ(plugin.Working(kFrequency), before);
  EXPECT_FALSE(plugin.IsActivePresetCurrent());
  plugin.Redo();
  EXPECT_EQ(plugin.Working(kFrequency), warm);
  EXPECT_FALSE(plugin.CanRedo());

  plugin.Controllers().SetDoNotLoadFromPresets(false);
  plugin.LoadPreset("Warm");
  EXPECT_EQ(plugin.Controllers().Get(0), (KControllerMap::Assignment{1, 0, kGain}));
}

TEST_F(PluginState, RenamingAndDeletingPresetsKeepTheCurrentPresetInStep) {
  const KGlobalSettings& g = plugin.GlobalSettings();
  plugin.SavePreset("A"), plugin.SavePreset("B");
  EXPECT_EQ(g.presetIndex, 1);
  plugin.RenamePreset("B", "C"), plugin.DeletePreset("A");
  EXPECT_EQ(plugin.ActivePresetName().ToUtf8(), "C");
  EXPECT_EQ(g.preset.ToUtf8(), "C");
  EXPECT_EQ(g.presetIndex, 0);
  plugin.DeletePreset("C");
  EXPECT_EQ(plugin.ListPresets().Count(), 0);
  EXPECT_EQ(g.presetIndex, -1);
  EXPECT_TRUE(plugin.ActivePresetName().IsEmpty() && g.preset.IsEmpty());
  EXPECT_THROW(plugin.LoadPreset("C"), KException);
  plugin.SetIdentifier({});  // made without the registry and never named: no folder to use
  EXPECT_THROW(plugin.SavePreset("D"), KException);
}

// The factory's sounds come first, by name and by place, and the current preset follows
// whichever kind was loaded last.
TEST_F(PluginState, FactoryPresetsAreListedFirstAndSelectedByTheirPlace) {
  plugin.SetFactoryPresets(kFactory);
  plugin.GetParameter(kGain).SetWorking(-20.0);
  plugin.SavePreset("Mine");
  EXPECT_EQ(Names(plugin.ListPresets()), (std::vector<std::string>{"Bright", "Dark", "Mine"}));
  EXPECT_EQ(Names(plugin.FactoryPresetNames()), (std::vector<std::string>{"Bright", "Dark"}));
  const KGlobalSettings& g = plugin.GlobalSettings();
  EXPECT_EQ(std::pair(g.presetIndex, plugin.IsActivePresetFactory()), std::pair(2, false));

  plugin.SelectPreset(1);
  EXPECT_EQ(std::tuple(Rounded(plugin.Working(kGain)), Rounded(plugin.Working(kFrequency)), plugin.Working(kMode)), std::tuple(0.0, 200.0, 2.0));
  EXPECT_EQ(std::tuple(plugin.ActivePresetName().ToUtf8(), plugin.IsActivePresetFactory(), plugin.IsActivePresetCurrent(), g.presetIndex, g.preset.ToUtf8()),
            std::tuple("Dark", true, true, 1, "Dark"));
  plugin.SelectPreset(2);
  EXPECT_EQ(std::tuple(Rounded(plugin.Working(kGain)), plugin.ActivePresetName().ToUtf8(), plugin.IsActivePresetFactory(), g.presetIndex),
            std::tuple(-20.0, "Mine", false, 2));
  plugin.LoadPreset("Bright");
  EXPECT_EQ(std::tuple(Rounded(plugin.Working(kGain)), Rounded(plugin.Working(kFrequency)), plugin.IsActivePresetFactory(), g.presetIndex),
            std::tuple(-6.0, 4000.0, true, 0));
  for (const int32_t beyond : {-1, 3}) EXPECT_THROW(plugin.SelectPreset(beyond), KException) << beyond;
  EXPECT_EQ(plugin.ActivePresetName().ToUtf8(), "Bright");  // a refused choice changes nothing

  // Undo returns to the user's preset, and with it to its kind and place.
  plugin.Undo();
  EXPECT_EQ(std::tuple(plugin.ActivePresetName().ToUtf8(), plugin.IsActivePresetFactory(), g.presetIndex), std::tuple("Mine", false, 2));
}

// Nothing the user does with presets changes or hides a factory one; a user preset that bears a
// factory name from before is still reached by its place, and removed by its name.
TEST_F(PluginState, FactoryPresetsAreReadOnlyAndNeverShadowed) {
  plugin.SetFactoryPresets(kFactory);
  plugin.SavePreset("Mine");
  const std::string saved = plugin.WriteState();
  struct Refusal { std::function<void()> action; const char* message; };
  const Refusal refusals[] = {
      {[&] { plugin.SavePreset("Bright"); }, "'Bright' is the name of a factory preset; please choose another name."},
      {[&] { plugin.RenamePreset("Mine", "Dark"); }, "'Dark' is the name of a factory preset; please choose another name."},
      {[&] { plugin.RenamePreset("Dark", "Darker"); }, "'Dark' is a factory preset, which cannot be renamed."},
      {[&] { plugin.DeletePreset("Bright"); }, "'Bright' is a factory preset, which cannot be deleted."},
  };
  for (const Refusal& refusal : refusals) {
    try {
      refusal.action();
      ADD_FAILURE() << refusal.message;
    } catch (const KException& e) {
      EXPECT_EQ(e.Message().ToUtf8(), refusal.message);
    }
    EXPECT_EQ(Names(plugin.ListPresets()), (std::vector<std::string>{"Bright", "Dark", "Mine"})) << refusal.message;
  }
  EXPECT_EQ(plugin.WriteState(), saved);

  // Written by an older version: a user preset named like a factory one, with its own sound.
  Element legacy;
  plugin.GetParameter(kGain).SetWorking(-30.0);
  plugin.StoreState(legacy);
  KPresetStore(plugin.Module()).Store("Bright", legacy);
  EXPECT_EQ(Names(plugin.ListPresets()), (std::vector<std::string>{"Bright", "Dark", "Mine", "Bright"}));
  plugin.LoadPreset("Bright");
  EXPECT_EQ(std::pair(Rounded(plugin.Working(kGain)), plugin.IsActivePresetFactory()), std::pair(-6.0, true));
  plugin.SelectPreset(3);
  EXPECT_EQ(std::tuple(Rounded(plugin.Working(kGain)), plugin.IsActivePresetFactory(), plugin.GlobalSettings().presetIndex), std::tuple(-30.0, false, 3));
  plugin.SelectPreset(0);
  plugin.DeletePreset("Bright");  // the user's: the factory's stays, and stays current
  EXPECT_EQ(Names(plugin.ListPresets()), (std::vector<std::string>{"Bright", "Dark", "Mine"}));
  EXPECT_EQ(std::tuple(plugin.ActivePresetName().ToUtf8(), plugin.IsActivePresetFactory(), plugin.GlobalSettings().presetIndex), std::tuple("Bright", true, 0));
}

// The state remembers that the current preset is a factory one, so that a host project reopens
// with it named and in its place.
TEST_F(PluginState, AFactoryPresetSurvivesAStateRoundTripAsTheCurrentPreset) {
  plugin.SetFactoryPresets(kFactory);
  plugin.SelectPreset(1);
  const std::string text = plugin.WriteState();
  EXPECT_NE(text.find("Factory=\"1\""), std::string::npos) << text;
  KStatePlugin copy;
  copy.SetFactoryPresets(kFactory);
  copy.ReadState(text);
  EXPECT_EQ(std::tuple(copy.ActivePresetName().ToUtf8(), copy.IsActivePresetFactory(), copy.IsActivePresetCurrent(), copy.GlobalSettings().presetIndex),
            std::tuple("Dark", true, true, 1));
  EXPECT_EQ(copy.WriteState(), text);
  copy.UndoStore(kGain, copy.GetParameter(kGain).Normalized());  // an edit: still Dark's, no longer its sound
  EXPECT_EQ(std::pair(copy.IsActivePresetFactory(), copy.IsActivePresetCurrent()), std::pair(true, false));
  copy.ReadState("<TorvaneState/>");
  EXPECT_EQ(std::pair(copy.ActivePresetName().IsEmpty(), copy.IsActivePresetFactory()), std::pair(true, false));
}
