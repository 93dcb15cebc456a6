// The effect pipeline's editor: its list of modules adds, moves, bypasses and removes modules
// through clicks, each edit an undo step that the host hears of, and the audio thread, which
// takes each new chain, allocates nothing across them.
#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "core/KAudioPluginHost.h"
#include "core/KParameter.h"
#include "kernel/KRegistries.h"
#include "plugins/KPluginEditors.h"
#include "plugins/KPluginHelpPage.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/pipeline/KPipelineChainPanel.h"
#include "tests/core/AllocationCounter.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/KHelpTexts.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KParameterControl.h"
#include "ui/controls/KPopups.h"
#include "ui/editor/KHelpPanel.h"

namespace {
using P = KEffectPipeline;
using Panel = KPipelineChainPanel;

// A host that counts the plug-in's requests to read the parameters' names and texts again.
struct NamesHost final : KAudioPluginHost {
  int32_t renamed = 0;
  void GestureNotice(int32_t, int32_t) override {}
  void BeginGesture(int32_t) override {}
  void SendAutomationValue(int32_t, double) override {}
  void EndGesture(int32_t) override {}
  void SendMIDIEvent(int32_t, const uint8_t[4]) override {}
  void ReportLatency(int32_t) override {}
  void UpdateParameterNames() override { ++renamed; }
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }
  void SendAutomation(int32_t, double) override {}
  void SendAutomationFromProcess(int32_t, double) noexcept override {}
  void SendAllAutomation() override {}
  void SendBypassAutomation(bool) override {}
  void RequestLatencyReport(int32_t) noexcept override {}
};

class PipelineEditor : public ::testing::Test {
protected:
  void SetUp() override {
    plugin_ = KMakeCataloguePlugin("KEffectPipeline");
    ASSERT_TRUE(plugin_);
    pipeline_ = dynamic_cast<P*>(plugin_.get());
    ASSERT_TRUE(pipeline_);
    ASSERT_TRUE(pipeline_->SetSampleRate(48000.0));
    pipeline_->SetInterface(&names_);
    editor_ = KMakePluginEditor(*plugin_, &host_);
  }
  void TearDown() override { pipeline_->SetInterface(nullptr); }

  KControlTree& Tree() { return editor_->Tree(); }
  void Click(KPoint at) {
    Tree().MouseDown({at}, clock_ += 1000);
    Tree().MouseUp({at});
    Tree().Tick();
  }
  // The button of `key` in the row of `position` (the add button has one only).
  KButton* Button(const char* key, int32_t position = 0) {
    int32_t seen = 0;
    return KFindControl<KButton>(Tree().Root(), [&](KButton& b) { return b.HelpKey() == KString::Static(key) && seen++ == position; });
  }
  void ClickButton(const char* key, int32_t position = 0) {
    KButton* button = Button(key, position);
    ASSERT_NE(button, nullptr) << key << " " << position;
    Click(KCentreOf(*button));
  }
  // Adds the module of `key` (effect-module registry) through the add button's menu, which lists
  // every module under a heading of its category.
  void AddThroughMenu(const KString& key) {
    ClickButton(Panel::kAddKey);
    auto* menu = dynamic_cast<KPopupMenu*>(Tree().Focused());
    ASSERT_NE(menu, nullptr);
    int32_t item = -1, headings = 0;
    for (int32_t i = 0; i < menu->ItemCount(); ++i) {
      headings += menu->IsHeading(i) ? 1 : 0;
      if (!menu->IsHeading(i) && menu->Item(i) == key) item = i;
    }
    ASSERT_EQ(menu->ItemCount(), Modules().Count() + headings);
    ASSERT_GE(item, 0) << key.ToUtf8();
    const KRect& list = menu->ListArea();
    Click({(list.left + list.right) / 2, list.top + 3 + item * KPopupMenu::kItemHeight + KPopupMenu::kItemHeight / 2});
  }
  void AddThroughMenu(const char* key) { AddThroughMenu(KString::Static(key)); }
  static const KPluginRegistry& Modules() {
    KRegistries::Instance().EnsureBuilt();
    return KRegistries::Instance().Modules();
  }
  std::vector<std::string> Keys() const {
    std::vector<std::string> keys;
    for (int32_t i = 0; i < pipeline_->ModuleCount(); ++i) keys.push_back(pipeline_->KeyAt(i).ToUtf8());
    return keys;
  }
  // Processes a few blocks, of one sample and of 512, and answers the allocations they made.
  int64_t AllocationsWhileProcessing() {
    std::vector<float> left(512, 0.25f), right(512, -0.25f);
    float* channels[] = {left.data(), right.data()};
    KAllocationCounter counter;
    for (int32_t block : {1, 512, 512}) pipeline_->ProcessHostBlock(channels, channels, block);
    return counter.Count();
  }

  std::unique_ptr<KAudioPlugin> plugin_;
  P* pipeline_ = nullptr;
  NamesHost names_;
  KRecordingEditorHost host_;
  std::unique_ptr<KEditor> editor_;
  uint64_t clock_ = 0;
};
}  // namespace

// Clicks build a chain: the menu lists the module registry in its order, a chosen module joins
// the end in the first free slot, moving and bypassing keep slots, removing frees one. Every
// edit reaches the host (texts to read again, slot values moved as gestures), lands in the
// state, and the audio thread takes each new chain without allocating.
TEST_F(PipelineEditor, ClicksAddMoveBypassAndRemoveModules) {
  EXPECT_EQ(AllocationsWhileProcessing(), 0);
  const KString first = Modules().Record(0).key, last = Modules().Record(Modules().Count() - 1).key;
  AddThroughMenu(first);
  AddThroughMenu("SampleWarmer");
  AddThroughMenu(last);
  const std::string firstKey = first.ToUtf8(), lastKey = last.ToUtf8();
  EXPECT_EQ(Keys(), (std::vector<std::string>{firstKey, "SampleWarmer", lastKey}));
  EXPECT_EQ(pipeline_->SlotAt(2), 2);
  EXPECT_EQ(names_.renamed, 3);
  // The warmer's defaults came to its slot's parameters, and the host heard of them.
  const int32_t drive = pipeline_->ModuleInSlot(1)->FindParameter(KString::Static("drive"))->Index();
  EXPECT_EQ(host_.KindsOf(P::ParameterIndex(1, drive)), "bve");
  EXPECT_EQ(pipeline_->GetParameter(P::ParameterIndex(1, drive)).Normalized(), pipeline_->ModuleInSlot(1)->GetParameter(drive).Normalized());
  EXPECT_EQ(AllocationsWhileProcessing(), 0);

  // The first row cannot move up, the last not down.
  EXPECT_FALSE(Button(Panel::kUpKey, 0)->IsEnabled());
  EXPECT_FALSE(Button(Panel::kDownKey, 2)->IsEnabled());
  ClickButton(Panel::kUpKey, 0);
  EXPECT_EQ(Keys()[0], firstKey);
  ClickButton(Panel::kUpKey, 2);  // the last module one place earlier, with its slot
  EXPECT_EQ(Keys(), (std::vector<std::string>{firstKey, lastKey, "SampleWarmer"}));
  EXPECT_EQ(pipeline_->SlotAt(1), 2);
  ClickButton(Panel::kDownKey, 0);
  EXPECT_EQ(Keys(), (std::vector<std::string>{lastKey, firstKey, "SampleWarmer"}));
  EXPECT_EQ(AllocationsWhileProcessing(), 0);

  // Bypass is the slot's parameter: a gesture to the host, and the caption follows.
  ClickButton(Panel::kBypassKey, 2);
  EXPECT_EQ(pipeline_->GetParameter(P::BypassIndex(1)).Normalized(), 1.0);
  EXPECT_EQ(host_.KindsOf(P::BypassIndex(1)), "bve");
  EXPECT_EQ(Button(Panel::kBypassKey, 2)->Caption().ToUtf8(), "Bypassed");
  EXPECT_EQ(Button(Panel::kBypassKey, 0)->Caption().ToUtf8(), "Active");
  EXPECT_EQ(AllocationsWhileProcessing(), 0);

  // The state holds the chain as it stands.
  auto restored = std::make_unique<P>();
  restored->SetIdentifier(KString::Static("KEffectPipeline"));
  restored->ReadState(pipeline_->WriteState());
  EXPECT_EQ(restored->KeyAt(2).ToUtf8(), "SampleWarmer");
  EXPECT_EQ(restored->GetParameter(P::BypassIndex(1)).Normalized(), 1.0);

  ClickButton(Panel::kRemoveKey, 2);
  EXPECT_EQ(Keys(), (std::vector<std::string>{lastKey, firstKey}));
  EXPECT_EQ(pipeline_->ModuleInSlot(1), nullptr);
  EXPECT_EQ(host_.KindsOf(P::ParameterIndex(1, drive)), "bvebve");  // back to "nothing" with the slot
  EXPECT_EQ(pipeline_->GetParameter(P::ParameterIndex(1, drive)).Text().ToUtf8(), "-");
  EXPECT_EQ(AllocationsWhileProcessing(), 0);
  EXPECT_EQ(names_.renamed, 6);

  // Undo brings the removed module back, bypassed and in its slot.
  editor_->Undo();
  Tree().Tick();
  EXPECT_EQ(Keys(), (std::vector<std::string>{lastKey, firstKey, "SampleWarmer"}));
  EXPECT_EQ(pipeline_->SlotAt(2), 1);
  EXPECT_EQ(pipeline_->GetParameter(P::BypassIndex(1)).Normalized(), 1.0);
  EXPECT_EQ(Button(Panel::kBypassKey, 2)->Caption().ToUtf8(), "Bypassed");
  EXPECT_EQ(AllocationsWhileProcessing(), 0);
}

// A slot's controls are labelled with the names of the module parameters they carry, and follow
// the chain: a module added, moved or removed relabels them at the next tick; a control that
// carries nothing has no label.
TEST_F(PipelineEditor, SlotControlsAreLabelledWithTheirModulesParameters) {
  const auto label = [&](int32_t slot, int32_t parameter) {
    const KString key = pipeline_->GetParameter(P::ParameterIndex(slot, parameter)).Key();
    KParameterControl* control = KFindControl<KParameterControl>(Tree().Root(), [&](KParameterControl& c) { return c.HelpKey() == key; });
    return control ? control->Label().ToUtf8() : std::string("(no control)");
  };
  Tree().Tick();
  EXPECT_EQ(label(0, 0), "");
  AddThroughMenu("SampleWarmer");
  AddThroughMenu("Utility");
  const KAudioPlugin& warmer = *pipeline_->ModuleInSlot(0);
  const KAudioPlugin& utility = *pipeline_->ModuleInSlot(1);
  for (int32_t p = 0; p < warmer.ParameterCount(); ++p) EXPECT_EQ(label(0, p), warmer.GetParameter(p).Name().ToUtf8()) << p;
  EXPECT_EQ(label(0, warmer.ParameterCount()), "");
  EXPECT_EQ(label(1, 0), utility.GetParameter(0).Name().ToUtf8());
  // Moving changes the order, not the slots: the labels stay; removing clears them.
  ClickButton(Panel::kUpKey, 1);
  EXPECT_EQ(label(1, 0), utility.GetParameter(0).Name().ToUtf8());
  ClickButton(Panel::kRemoveKey, 1);
  EXPECT_EQ(label(0, 0), "");
  EXPECT_EQ(label(1, 0), utility.GetParameter(0).Name().ToUtf8());
}

// The add menu lists every module once, under the heading of its category, the headings in the
// registries' order of categories; a heading cannot be chosen.
TEST_F(PipelineEditor, AddMenuGroupsModulesUnderTheirCategories) {
  ClickButton(Panel::kAddKey);
  auto* menu = dynamic_cast<KPopupMenu*>(Tree().Focused());
  ASSERT_NE(menu, nullptr);
  std::vector<std::string> headings, listed;
  std::string category;
  for (int32_t i = 0; i < menu->ItemCount(); ++i) {
    const KString item = menu->Item(i);
    if (menu->IsHeading(i)) {
      headings.push_back(category = item.ToUtf8());
      continue;
    }
    ASSERT_FALSE(category.empty()) << item.ToUtf8();
    const KPluginRecord* record = Modules().Find(item);
    ASSERT_NE(record, nullptr) << item.ToUtf8();
    EXPECT_EQ(record->category.ToUtf8(), category) << item.ToUtf8();
    listed.push_back(item.ToUtf8());
  }
  EXPECT_EQ(static_cast<int32_t>(listed.size()), Modules().Count());
  std::vector<std::string> ordered;
  for (const char* name : KRegistries::kCategories)
    if (std::find(headings.begin(), headings.end(), name) != headings.end()) ordered.push_back(name);
  EXPECT_EQ(headings, ordered);
  const KRect& list = menu->ListArea();
  Click({(list.left + list.right) / 2, list.top + 3 + KPopupMenu::kItemHeight / 2});  // the first heading
  EXPECT_EQ(pipeline_->ModuleCount(), 0);
}

// With six modules the add button rests and opens nothing; every button of the list has its
// own help on F1.
TEST_F(PipelineEditor, FullChainAndHelpOfTheButtons) {
  for (int32_t i = 0; i < P::kSlots; ++i) AddThroughMenu("Utility");
  ASSERT_EQ(pipeline_->ModuleCount(), P::kSlots);
  EXPECT_FALSE(Button(Panel::kAddKey)->IsEnabled());
  ClickButton(Panel::kAddKey);
  EXPECT_EQ(Tree().Focused(), nullptr);
  EXPECT_EQ(pipeline_->ModuleCount(), P::kSlots);

  std::vector<std::string> texts;
  for (const char* key : {Panel::kAddKey, Panel::kBypassKey, Panel::kUpKey, Panel::kDownKey, Panel::kRemoveKey}) {
    Tree().MouseMove({KCentreOf(*Button(key, 0))});
    ASSERT_TRUE(Tree().Key({kKeyF1, 0}));
    auto* help = dynamic_cast<KHelpPanel*>(Tree().Focused());
    ASSERT_NE(help, nullptr) << key;
    const std::string markup = help->Markup().ToUtf8();
    EXPECT_EQ(markup.find(KHelpTexts::kNoHelp), std::string::npos) << key;
    EXPECT_EQ(markup, KEffectPipelineButtonHelp(KString::Static(key)).ToUtf8());
    for (const std::string& other : texts) EXPECT_NE(markup, other) << key;
    texts.push_back(markup);
    Tree().Key({kKeyEscape, 0});
  }
}

// The help page gives each slot's parameters one section, since their texts differ only in the
// number; the bypasses, whose texts hold their defaults, keep one each.
TEST_F(PipelineEditor, HelpPageGivesEachSlotOneSection) {
  const std::string markup = KPluginHelpPage(*plugin_).Markup().ToUtf8();
  const auto count = [&](const std::string& what) {
    size_t n = 0;
    for (size_t at = markup.find(what); at != std::string::npos; at = markup.find(what, at + 1)) ++n;
    return n;
  };
  const std::string last = std::to_string(P::kModuleParameters);
  EXPECT_EQ(count("<l2>Slot 1 parameter 1 to Slot 1 parameter " + last + "</l2>"), 1u);
  EXPECT_EQ(count("<l2>Slot 6 parameter 1 to Slot 6 parameter " + last + "</l2>"), 1u);
  EXPECT_EQ(count("<l2>Slot 3 parameter 13"), 0u);
  EXPECT_EQ(count("<l2>Slot 4 bypass</l2>"), 1u);
  EXPECT_EQ(count("<l2>"), size_t(2 * P::kSlots));
}
