// Controls on a real plug-in's parameters: every edit is a begin / value / end gesture to the
// host, an undo step, and controls follow values that change elsewhere.
#include <gtest/gtest.h>

#include <cmath>

#include "tests/ui/EditorTestSupport.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KLevelMeterControl.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KStyle.h"
#include "ui/controls/KValueControl.h"

namespace {

struct ControlFixture : ::testing::Test {
  std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KCompressorPlugin");
  KRecordingEditorHost host;
  KControlTree tree{{0, 0, 399, 299}};
  KStyle style;
  uint64_t clock = 10000;

  int32_t Index(const char* key) { return plugin->FindParameter(KString::Static(key))->Index(); }
  KParameterLink Link(const char* key) { return KParameterLink(*plugin, Index(key), &host); }
  void Click(KPoint at, uint32_t modifiers = 0) {
    tree.MouseDown({at, modifiers}, clock += 1000);
    tree.MouseUp({at, modifiers});
  }
  void DoubleClick(KPoint at) {
    Click(at);
    tree.MouseDown({at}, clock += 100);
    tree.MouseUp({at});
  }
  void Drag(KPoint from, int32_t dy, uint32_t modifiers = 0, int32_t steps = 4) {
    tree.MouseDown({from, modifiers}, clock += 1000);
    for (int32_t i = 1; i <= steps; ++i) tree.MouseMove({{from.x, from.y + dy * i / steps}, modifiers});
    tree.MouseUp({{from.x, from.y + dy}, modifiers});
  }
  void Type(const char* text) {
    for (int32_t i = 0; i < 20; ++i) tree.Key({kKeyBackspace, 0});
    for (const char* c = text; *c; ++c) tree.Key({*c, 0});
  }
};

TEST_F(ControlFixture, ADragIsOneGestureWhoseValuesFollowTheMouseAndShiftMakesItFine) {
  KKnob& knob = tree.Root().Emplace<KKnob>(KRect{10, 10, 89, 109}, Link("threshold"));
  const int32_t p = Index("threshold");
  const double start = plugin->GetParameter(p).Normalized();
  Drag(KCentreOf(knob), -40);
  EXPECT_EQ(host.KindsOf(p), "bvvvve");
  const double coarse = plugin->GetParameter(p).Normalized() - start;
  EXPECT_NEAR(coarse, 40 / KValueControl::kDragTravel, 1e-9);
  for (size_t i = 2; i + 1 < host.calls.size(); ++i) EXPECT_GT(host.calls[i].value, host.calls[i - 1].value);
  EXPECT_DOUBLE_EQ(host.calls[host.calls.size() - 2].value, plugin->GetParameter(p).Normalized());

  const double before = plugin->GetParameter(p).Normalized();
  Drag(KCentreOf(knob), -40, kModShift);
  EXPECT_NEAR(plugin->GetParameter(p).Normalized() - before, coarse / KValueControl::kFineFactor, 1e-9);
  // Dragging past the end holds at the end; a drag or a click that changes nothing sends nothing.
  host.calls.clear();
  Drag(KCentreOf(knob), -5000, 0, 2);
  Drag(KCentreOf(knob), -100, 0, 2);
  Click(KCentreOf(knob));
  EXPECT_DOUBLE_EQ(plugin->GetParameter(p).Normalized(), 1.0);
  EXPECT_EQ(host.KindsOf(p), "bve");
}

TEST_F(ControlFixture, DoubleClickResetsTheWheelStepsAndTypingSetsAValueFromItsText) {
  KKnob& knob = tree.Root().Emplace<KKnob>(KRect{10, 10, 89, 109}, Link("gain"));
  const int32_t p = Index("gain");
  KAudioPluginBase::Parameter& gain = plugin->GetParameter(p);
  gain.SetWorking(6);
  DoubleClick(KCentreOf(knob));
  EXPECT_DOUBLE_EQ(gain.Normalized(), gain.DefaultNormalized());
  EXPECT_TRUE(tree.Wheel({KCentreOf(knob), 0, 1}));
  EXPECT_NEAR(gain.Normalized() - gain.DefaultNormalized(), 0.01, 1e-12);
  EXPECT_EQ(host.KindsOf(p), "bvebve");

  DoubleClick(KCentreOf(knob.ValueTextArea()));
  auto* field = dynamic_cast<KTextField*>(tree.Focused());
  ASSERT_NE(field, nullptr);
  EXPECT_EQ(field->Text(), gain.Text());
  Type("-7.5");
  tree.Key({kKeyReturn, 0});
  EXPECT_DOUBLE_EQ(gain.Working(), -7.5);
  EXPECT_EQ(tree.Focused(), nullptr);
  EXPECT_EQ(tree.Root().ChildCount(), 1);  // the field is gone
  // Escape, or a text that is no value, leaves the value alone.
  DoubleClick(KCentreOf(knob.ValueTextArea()));
  Type("3");
  tree.Key({kKeyEscape, 0});
  DoubleClick(KCentreOf(knob.ValueTextArea()));
  Type("loud");
  tree.Key({kKeyReturn, 0});
  EXPECT_DOUBLE_EQ(gain.Working(), -7.5);
}

TEST_F(ControlFixture, SteppedParametersSnapAndListsChooseFromTheirMenu) {
  KDropDown& list = tree.Root().Emplace<KDropDown>(KRect{10, 10, 109, 59}, Link("kneemode"));
  const int32_t p = Index("kneemode");
  const int32_t steps = plugin->GetParameter(p).Steps();
  ASSERT_EQ(steps, 2);
  Click(KCentreOf(list));
  auto* menu = dynamic_cast<KPopupMenu*>(tree.Focused());
  ASSERT_NE(menu, nullptr);
  ASSERT_EQ(menu->ItemCount(), 3);
  const KRect& area = menu->ListArea();
  Click({(area.left + area.right) / 2, area.top + 3 + 2 * KPopupMenu::kItemHeight + 5});
  EXPECT_EQ(list.Choice(), 2);
  EXPECT_DOUBLE_EQ(plugin->GetParameter(p).Normalized(), 1.0);
  EXPECT_EQ(host.KindsOf(p), "bve");
  EXPECT_EQ(tree.Root().ChildCount(), 1);

  // A knob on a stepped parameter moves only from step to step.
  host.calls.clear();
  KKnob& knob = tree.Root().Emplace<KKnob>(KRect{200, 10, 279, 109}, Link("kneemode"));
  Drag(KCentreOf(knob), 30);  // 0.15 down from 1: rounds back to 1
  EXPECT_DOUBLE_EQ(plugin->GetParameter(p).Normalized(), 1.0);
  EXPECT_EQ(host.KindsOf(p), "");
}

TEST_F(ControlFixture, SwitchesFlipInOneGestureAndEveryControlFollowsOutsideChanges) {
  KSwitch& toggle = tree.Root().Emplace<KSwitch>(KRect{10, 10, 159, 35}, Link("maximize"));
  KKnob& knob = tree.Root().Emplace<KKnob>(KRect{200, 10, 279, 109}, Link("ratio"));
  KBitmap target(400, 300);
  KDrawerToKBitmap drawer(target);
  tree.SetStyle(style);
  Click(KCentreOf(toggle));
  EXPECT_TRUE(toggle.IsOn());
  EXPECT_EQ(host.KindsOf(Index("maximize")), "bve");
  tree.Paint(drawer);
  // Host automation moves the ratio: the knob repaints at the next tick, and only then.
  plugin->GetParameter(Index("ratio")).SetNormalized(0.9);
  EXPECT_FALSE(knob.IsDirty());
  tree.Tick();
  EXPECT_TRUE(knob.IsDirty());
  EXPECT_FALSE(toggle.IsDirty());
  EXPECT_EQ(tree.Paint(drawer), knob.Bounds());
  tree.Tick();
  EXPECT_FALSE(tree.NeedsPaint());
  EXPECT_EQ(host.KindsOf(Index("ratio")), "");  // following sends nothing back
}

TEST_F(ControlFixture, EditsAreUndoSteps) {
  KKnob& knob = tree.Root().Emplace<KKnob>(KRect{10, 10, 89, 109}, Link("attack"));
  const int32_t p = Index("attack");
  const double start = plugin->GetParameter(p).Normalized();
  Drag(KCentreOf(knob), -60);
  const double dragged = plugin->GetParameter(p).Normalized();
  ASSERT_NE(dragged, start);
  ASSERT_TRUE(plugin->CanUndo());
  plugin->Undo();
  EXPECT_DOUBLE_EQ(plugin->GetParameter(p).Normalized(), start);  // the whole drag is one step
  plugin->Redo();
  EXPECT_DOUBLE_EQ(plugin->GetParameter(p).Normalized(), dragged);
}

TEST(LevelMeterControl, RisesAtOnceFallsSteadilyAndHoldsItsPeak) {
  double level = -6;
  KLevelMeterControl meter({0, 0, 29, 199}, KString("In"), KLevelMeterControl::kLevel, 2,
                           [&](double& l, double& r) { l = r = level; });
  meter.OnTimer();
  EXPECT_DOUBLE_EQ(meter.Shown(0), -6);
  level = -60;
  meter.OnTimer();
  EXPECT_DOUBLE_EQ(meter.Shown(0), -6 - KLevelMeterControl::kFallPerTick);
  for (int32_t i = 1; i < KLevelMeterControl::kHoldTicks; ++i) meter.OnTimer();
  EXPECT_DOUBLE_EQ(meter.Peak(0), -6);  // held
  meter.OnTimer();
  meter.OnTimer();
  EXPECT_LT(meter.Peak(0), -6);
  // Silence and NaN rest on the floor.
  level = std::nan("");
  for (int32_t i = 0; i < 200; ++i) meter.OnTimer();
  EXPECT_DOUBLE_EQ(meter.Shown(1), KLevelMeterControl::kFloorDb);
  EXPECT_DOUBLE_EQ(meter.Peak(1), KLevelMeterControl::kFloorDb);
}

}  // namespace
