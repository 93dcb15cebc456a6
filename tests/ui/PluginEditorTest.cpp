// The editor of every catalogue plug-in, generated from its parameter table: a control for every
// parameter, help on F1 over each, pictures at every scale, undo and redo through the keys, the
// size asked of the host, and the plug-ins' own graphs.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <set>
#include <string>

#include "kernel/KCatalogue.h"
#include "plugins/KPluginEditors.h"
#include "tests/core/UserDataFolder.h"
#include "tests/ui/DrawerTestSupport.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/KHelpTexts.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KGraphs.h"
#include "ui/controls/KValueControl.h"
#include "ui/editor/KHelpPanel.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/utility/KUtilityPlugin.h"

namespace {

// Controls that edit a parameter, by the parameter's key.
void CollectEditing(KControl& control, std::multiset<std::string>& keys) {
  const bool edits = dynamic_cast<KValueControl*>(&control) || dynamic_cast<KSwitch*>(&control) || dynamic_cast<KDropDown*>(&control);
  if (edits) keys.insert(control.HelpKey().ToUtf8());
  for (int32_t i = 0; i < control.ChildCount(); ++i) CollectEditing(control.Child(i), keys);
}

// Distinct colours in a picture, counted up to a limit.
size_t ColourCount(const KBitmap& picture) {
  std::set<KColor> colours;
  for (int32_t y = 0; y < picture.Height() && colours.size() < 64; y += 3)
    for (int32_t x = 0; x < picture.Width(); x += 3) colours.insert(picture.Pixel(x, y));
  return colours.size();
}

// Pixels of `a` and `b` that differ outside every knob and slider of the editor.
int64_t DifferencesOutsideValueControls(KEditor& editor, const KBitmap& a, const KBitmap& b) {
  std::vector<KRect> controls;
  KFindControl<KValueControl>(editor.Tree().Root(), [&](KValueControl& c) { return controls.push_back(c.Bounds()), false; });
  int64_t outside = 0;
  for (int32_t y = 0; y < a.Height(); ++y)
    for (int32_t x = 0; x < a.Width(); ++x)
      if (a.Pixel(x, y) != b.Pixel(x, y) &&
          std::none_of(controls.begin(), controls.end(), [&](const KRect& r) { return KContains(r, KPoint{x, y}); }))
        ++outside;
  return outside;
}

// Every knob's and slider's label as `label` (a copy of each control's own when empty).
void Relabel(KEditor& editor, const KString& label, std::vector<KString>& kept) {
  KFindControl<KValueControl>(editor.Tree().Root(), [&](KValueControl& c) {
    kept.push_back(c.Label());
    c.SetLabel(label);
    return false;
  });
}

// The parameters an editor has a control for: every one, but for the effect pipeline's slot
// parameters past a module's twelfth, which are there for the host's automation.
int32_t EditedCount(const KAudioPlugin& plugin) {
  return plugin.Identifier().ToUtf8() == "KEffectPipeline" ? KEffectPipeline::kFirstExtra : plugin.ParameterCount();
}

class EveryPluginEditor : public ::testing::TestWithParam<const char*> {};

TEST_P(EveryPluginEditor, HasOneControlPerParameterHelpForEachAndDrawsAtEveryScale) {
  const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin(GetParam());
  KRecordingEditorHost host;
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, &host);
  std::multiset<std::string> keys;
  CollectEditing(editor->Tree().Root(), keys);
  ASSERT_EQ(keys.size(), size_t(EditedCount(*plugin)));
  for (int32_t i = 0; i < EditedCount(*plugin); ++i) EXPECT_EQ(keys.count(plugin->GetParameter(i).Key().ToUtf8()), 1u) << i;

  // Every control lies inside the window, and no two editing controls overlap.
  std::vector<KRect> placed;
  std::function<void(KControl&)> walk = [&](KControl& c) {
    const KRect& r = c.Bounds();
    EXPECT_TRUE(r.left >= 0 && r.top >= 0 && r.right < editor->Width() && r.bottom < editor->Height()) << c.HelpKey().ToUtf8();
    if (dynamic_cast<KValueControl*>(&c) || dynamic_cast<KSwitch*>(&c) || dynamic_cast<KDropDown*>(&c)) {
      for (const KRect& other : placed) EXPECT_FALSE(KIntersects(other, r)) << c.HelpKey().ToUtf8();
      placed.push_back(r);
    }
    for (int32_t i = 0; i < c.ChildCount(); ++i) walk(c.Child(i));
  };
  walk(editor->Tree().Root());

  // F1 over each knob shows that parameter's own help.
  for (int32_t i = 0; i < EditedCount(*plugin); ++i) {
    const KString key = plugin->GetParameter(i).Key();
    KControl* control = KFindControl<KControl>(editor->Tree().Root(), [&](KControl& c) {
      return c.HelpKey() == key && (dynamic_cast<KValueControl*>(&c) || dynamic_cast<KSwitch*>(&c) || dynamic_cast<KDropDown*>(&c));
    });
    ASSERT_NE(control, nullptr);
    editor->Tree().MouseMove({KCentreOf(*control)});
    ASSERT_TRUE(editor->Tree().Key({kKeyF1, 0}));
    auto* help = dynamic_cast<KHelpPanel*>(editor->Tree().Focused());
    ASSERT_NE(help, nullptr) << key.ToUtf8();
    EXPECT_EQ(help->Markup(), KPluginEditorHelp(*plugin, key));
    EXPECT_EQ(help->Markup().ToUtf8().find(KHelpTexts::kNoHelp), std::string::npos) << key.ToUtf8();
    editor->Tree().Key({kKeyEscape, 0});  // any key closes it
    EXPECT_EQ(editor->Tree().Focused(), nullptr);
  }

  const KBitmap normal = editor->Render();
  EXPECT_EQ(normal.Width(), editor->Width());
  EXPECT_GT(ColourCount(normal), 20u);
  ASSERT_TRUE(editor->SetScale(2));
  EXPECT_EQ(host.width, 2 * editor->Width());
  EXPECT_EQ(host.height, 2 * editor->Height());
  const KBitmap large = editor->Render();
  EXPECT_EQ(large.Width(), 2 * normal.Width());
  EXPECT_EQ(large.Height(), 2 * normal.Height());
  normal.Store(KPicturePath(std::string("editor_") + GetParam() + ".png"));

  // Labels stay inside their own controls, however long: none reaches a neighbour's.
  ASSERT_TRUE(editor->SetScale(1));
  std::vector<KString> labels;
  Relabel(*editor, KString(), labels);
  const KBitmap unlabelled = editor->Render();
  size_t next = 0;
  KFindControl<KValueControl>(editor->Tree().Root(), [&](KValueControl& c) { return c.SetLabel(labels[next++]), false; });
  EXPECT_EQ(DifferencesOutsideValueControls(*editor, editor->Render(), unlabelled), 0);
  Relabel(*editor, KString::FromUtf8("Sidechain high-pass filter frequency"), labels);
  const KBitmap longLabels = editor->Render();
  longLabels.Store(KPicturePath(std::string("editor_") + GetParam() + "_long_labels.png"));
  EXPECT_EQ(DifferencesOutsideValueControls(*editor, longLabels, unlabelled), 0);
  large.Store(KPicturePath(std::string("editor_") + GetParam() + "_x2.png"));
}

std::vector<const char*> CatalogueKeys() {
  std::vector<const char*> keys;
  for (const KPluginDescription& entry : KProductCatalogue().plugins) keys.push_back(entry.key);
  return keys;
}
INSTANTIATE_TEST_SUITE_P(Catalogue, EveryPluginEditor, ::testing::ValuesIn(CatalogueKeys()));

TEST(PluginEditor, CtrlZAndCtrlYUndoAndRedoAndTellTheHostWhatMoved) {
  const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KUtilityPlugin");
  KRecordingEditorHost host;
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, &host);
  const int32_t width = plugin->FindParameter(KString("width"))->Index();
  KKnob* knob = KFindControl<KKnob>(editor->Tree().Root(), [&](KKnob& k) { return k.Link().Index() == width; });
  ASSERT_NE(knob, nullptr);
  const double start = plugin->GetParameter(width).Normalized();
  editor->Tree().MouseDown({KCentreOf(*knob)}, 1000);
  editor->Tree().MouseMove({{KCentreOf(*knob).x, KCentreOf(*knob).y + 30}});
  editor->Tree().MouseUp({{KCentreOf(*knob).x, KCentreOf(*knob).y + 30}});
  const double dragged = plugin->GetParameter(width).Normalized();
  ASSERT_LT(dragged, start);
  host.calls.clear();
  EXPECT_TRUE(editor->Tree().Key({'z', kModControl}));
  EXPECT_DOUBLE_EQ(plugin->GetParameter(width).Normalized(), start);
  ASSERT_EQ(host.KindsOf(width), "bve");
  EXPECT_DOUBLE_EQ(host.calls[1].value, start);
  EXPECT_TRUE(editor->Tree().Key({'y', kModControl}));
  EXPECT_DOUBLE_EQ(plugin->GetParameter(width).Normalized(), dragged);
  // The buttons follow the history at the next tick.
  KButton* redo = KFindControl<KButton>(editor->Tree().Root(), [](KButton& b) { return b.Caption() == KString("Redo"); });
  ASSERT_NE(redo, nullptr);
  editor->Tree().Tick();
  EXPECT_FALSE(redo->IsEnabled());
  editor->Undo();
  editor->Tree().Tick();
  EXPECT_TRUE(redo->IsEnabled());
}

// The preset menu, driven as a user does: the factory presets under their heading and the
// user's under theirs, the current one highlighted; a heading is never chosen, the keys step over
// it, and a factory preset loads and tells the host what moved but offers no renaming or deleting.
TEST(PluginEditor, ThePresetMenuOffersTheFactoryPresetsUnderTheirOwnHeading) {
  const KUserDataFolder data;  // the user's presets go to a fresh folder
  {
    const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KUtilityPlugin");
    ASSERT_EQ(plugin->FactoryPresetCount(), 3);
    plugin->SavePreset("Mine");
    KRecordingEditorHost host;
    const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, &host);
    KButton* button = KFindControl<KButton>(editor->Tree().Root(), [](KButton& b) { return b.HelpKey() == KString("presets"); });
    ASSERT_NE(button, nullptr);
    const auto open = [&] {
      editor->Tree().MouseDown({KCentreOf(*button)}, 1000);
      editor->Tree().MouseUp({KCentreOf(*button)});
      return dynamic_cast<KPopupMenu*>(editor->Tree().Focused());
    };
    const auto click = [&](KPopupMenu& menu, int32_t item) {
      const KPoint at{KCentreOf(menu.ListArea()).x, menu.ListArea().top + 3 + item * KPopupMenu::kItemHeight + KPopupMenu::kItemHeight / 2};
      editor->Tree().MouseDown({at}, 2000);
      editor->Tree().MouseUp({at});
    };
    // Factory presets, 3 of them, My presets, Mine, Save, Rename, Delete.
    KPopupMenu* menu = open();
    ASSERT_NE(menu, nullptr);
    ASSERT_EQ(menu->ItemCount(), 9);
    std::vector<int32_t> headings;
    for (int32_t i = 0; i < menu->ItemCount(); ++i)
      if (menu->IsHeading(i)) headings.push_back(i);
    EXPECT_EQ(headings, (std::vector<int32_t>{0, 4}));
    EXPECT_EQ(menu->Highlighted(), 5);
    click(*menu, 0);  // a heading: the menu closes, nothing loads
    EXPECT_EQ(std::pair(editor->Tree().Focused(), plugin->ActivePresetName().ToUtf8()), std::pair(static_cast<KControl*>(nullptr), std::string("Mine")));

    const int32_t width = plugin->FindParameter(KString("width"))->Index();
    menu = open();
    ASSERT_NE(menu, nullptr);
    click(*menu, 2);  // the second factory preset
    EXPECT_EQ(std::tuple(plugin->ActivePresetName().ToUtf8(), plugin->IsActivePresetFactory(), std::round(plugin->GetParameter(width).Working() * 1e6) / 1e6),
              std::tuple(std::string(kUtilityDescription.presets[1].name), true, 150.0));
    EXPECT_EQ(host.KindsOf(width), "bve");
    editor->Tree().Tick();
    EXPECT_EQ(button->Caption().ToUtf8(), kUtilityDescription.presets[1].name);

    menu = open();  // a factory preset is current: nothing to rename or delete
    ASSERT_NE(menu, nullptr);
    EXPECT_EQ(std::pair(menu->ItemCount(), menu->Highlighted()), std::pair(7, 2));
    editor->Tree().Key({kKeyDown, 0});
    editor->Tree().Key({kKeyDown, 0});  // over the heading of the user's presets
    EXPECT_EQ(menu->Highlighted(), 5);
    editor->Tree().Key({kKeyReturn, 0});
    EXPECT_EQ(std::pair(plugin->ActivePresetName().ToUtf8(), plugin->IsActivePresetFactory()), std::pair(std::string("Mine"), false));
  }
}

TEST(PluginEditor, AHostThatRefusesASizeKeepsTheEditorAsItWas) {
  const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KUtilityPlugin");
  KRecordingEditorHost host;
  host.acceptResize = false;
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, &host);
  EXPECT_FALSE(editor->SetScale(1.5));
  EXPECT_EQ(editor->Scale(), 1);
  EXPECT_EQ(editor->PixelWidth(), editor->Width());
  const std::unique_ptr<KEditor> alone = KMakePluginEditor(*plugin, nullptr);
  EXPECT_TRUE(alone->SetScale(1.5));
  EXPECT_EQ(alone->PixelWidth(), static_cast<int32_t>(std::lround(alone->Width() * 1.5)));
}

TEST(PluginEditor, EqualizerNodesDragFrequencyAndGainInOneGestureEach) {
  const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KEqualizerPlugin");
  KRecordingEditorHost host;
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, &host);
  KResponseGraph* graph = KFindControl<KResponseGraph>(editor->Tree().Root(), [](KResponseGraph&) { return true; });
  ASSERT_NE(graph, nullptr);
  const KPointF node = graph->NodePosition(3);
  const KPoint at{static_cast<int32_t>(node.x), static_cast<int32_t>(node.y)};
  const int32_t freq = plugin->FindParameter(KString("band4freq"))->Index();
  const int32_t gain = plugin->FindParameter(KString("band4gain"))->Index();
  const double hz = plugin->GetParameter(freq).Working();
  editor->Tree().MouseDown({at}, 1000);
  editor->Tree().MouseMove({{at.x + 40, at.y - 30}});
  editor->Tree().MouseUp({{at.x + 40, at.y - 30}});
  EXPECT_GT(plugin->GetParameter(freq).Working(), hz);
  EXPECT_GT(plugin->GetParameter(gain).Working(), 0);
  EXPECT_EQ(host.KindsOf(freq), "bve");
  EXPECT_EQ(host.KindsOf(gain), "bve");
  // The summed response follows: the graph asks for a repaint and its curve rises.
  editor->Tree().Tick();
  EXPECT_TRUE(graph->IsDirty());
  editor->Render();
  const std::vector<double>& curve = graph->Curve();
  ASSERT_EQ(curve.size(), size_t(KGraph::kSamples));
  EXPECT_GT(*std::max_element(curve.begin(), curve.end()), 1.0);
}

TEST(PluginEditor, CompressorCustomShapePointsDragOnlyWhileTheShapeIsOnAndUndoAsOneStep) {
  const std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KCompressorPlugin");
  auto& compressor = static_cast<KCompressorPlugin&>(*plugin);
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, nullptr);
  KTransferGraph* graph = KFindControl<KTransferGraph>(editor->Tree().Root(), [](KTransferGraph&) { return true; });
  ASSERT_NE(graph, nullptr);
  const std::vector<KCompressorPlugin::Point> before = compressor.CustomShape();
  ASSERT_GE(before.size(), 3u);
  // Where the middle point lies on the graph: -60..0 dB across and up the plot.
  const KRect plot = KInset(graph->Bounds(), 1);
  const auto pixel = [&](const KCompressorPlugin::Point& p) {
    const double x = 20 * std::log10(p.level), y = 20 * std::log10(p.output);
    return KPoint{static_cast<int32_t>(std::lround(plot.left + (x + 60) / 60 * (plot.right - plot.left))),
                  static_cast<int32_t>(std::lround(plot.top + -y / 60 * (plot.bottom - plot.top)))};
  };
  const KPoint at = pixel(before[1]);
  EXPECT_FALSE(editor->Tree().MouseDown({at}, 1000));  // the shape is off: nothing to drag
  editor->Tree().MouseUp({at});
  plugin->GetParameter(KCompressorPlugin::kCustomShape).SetNormalized(1);
  ASSERT_TRUE(editor->Tree().MouseDown({at}, 5000));
  editor->Tree().MouseMove({{at.x, at.y - 25}});
  editor->Tree().MouseUp({{at.x, at.y - 25}});
  const std::vector<KCompressorPlugin::Point> after = compressor.CustomShape();
  ASSERT_EQ(after.size(), before.size());
  EXPECT_GT(after[1].output, before[1].output);
  EXPECT_DOUBLE_EQ(after[0].output, before[0].output);
  editor->Undo();
  EXPECT_NEAR(compressor.CustomShape()[1].output, before[1].output, 1e-9);
}

}  // namespace
