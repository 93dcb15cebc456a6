// The control tree on its own: where events go, focus, double clicks, and which controls a
// repaint paints.
#include <gtest/gtest.h>

#include <string>

#include "ui/KDrawerToKBitmap.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KStyle.h"

namespace {

// Writes down what reaches it; takes what it is told to take.
class Probe : public KControl {
public:
  Probe(const KRect& r, std::string name, std::string& log, bool takes = true)
      : KControl(r), name_(std::move(name)), log_(log), takes_(takes) {}
  bool OnMouseDown(const KMouseEvent&) override { return Note("down", takes_); }
  void OnMouseMove(const KMouseEvent& e) override { Note("move" + std::to_string(e.at.x), true); }
  void OnMouseUp(const KMouseEvent&) override { Note("up", true); }
  bool OnDoubleClick(const KMouseEvent&) override { return Note("double", takes_); }
  bool OnWheel(const KMouseEvent&) override { return Note("wheel", takes_); }
  bool OnKey(const KKeyEvent& e) override { return Note("key" + std::to_string(e.key), takes_); }
  bool IsFocusable() const noexcept override { return focusable; }
  void OnFocusChanged(bool focused) override { Note(focused ? "focus" : "blur", true); }
  void Paint(KDrawer&, const KStyle&) override { Note("paint", true); }
  bool focusable = false;

private:
  bool Note(const std::string& what, bool answer) {
    log_ += name_ + ":" + what + " ";
    return answer;
  }
  std::string name_;
  std::string& log_;
  bool takes_;
};

struct TreeFixture : ::testing::Test {
  KControlTree tree{{0, 0, 199, 99}};
  KStyle style;
  std::string log;
  Probe& panel = tree.Root().Emplace<Probe>(KRect{0, 0, 99, 99}, "panel", log, false);
  Probe& a = panel.Emplace<Probe>(KRect{10, 10, 49, 49}, "a", log);
  Probe& b = panel.Emplace<Probe>(KRect{50, 10, 89, 49}, "b", log, false);
  KBitmap target{200, 100};
  KDrawerToKBitmap drawer{target};

  void SetUp() override {
    tree.SetStyle(style);
    tree.Paint(drawer);
    log.clear();
  }
};

TEST_F(TreeFixture, TheMouseGoesToTheControlUnderItAndStaysWithItUntilReleased) {
  EXPECT_TRUE(tree.MouseDown({{20, 20}}, 0));
  EXPECT_EQ(tree.Captured(), &a);
  tree.MouseMove({{150, 20}});  // far outside: still a's
  tree.MouseUp({{150, 20}});
  EXPECT_EQ(tree.Captured(), nullptr);
  tree.MouseMove({{30, 20}});  // nothing captured: nobody hears a move
  EXPECT_EQ(log, "a:down a:move150 a:up ");
}

TEST_F(TreeFixture, UntakenEventsBubbleToTheParentsAndEndUnhandled) {
  EXPECT_FALSE(tree.MouseDown({{60, 20}}, 0));
  EXPECT_FALSE(tree.Wheel({{60, 20}, 0, 1}));
  EXPECT_EQ(log, "b:down panel:down b:wheel panel:wheel ");
  EXPECT_FALSE(tree.MouseDown({{150, 50}}, 1000));  // only the root lies there
}

TEST_F(TreeFixture, TwoQuickClicksInPlaceMakeADoubleClickAndAThirdStartsAgain) {
  tree.MouseDown({{20, 20}}, 1000);
  tree.MouseUp({{20, 20}});
  tree.MouseDown({{22, 21}}, 1000 + KControlTree::kDoubleClickMs);
  tree.MouseUp({{22, 21}});
  tree.MouseDown({{22, 21}}, 1100 + KControlTree::kDoubleClickMs);
  EXPECT_EQ(log, "a:down a:up a:double a:down ");
  log.clear();
  // Too slow, or too far apart: two single clicks.
  tree.MouseDown({{20, 20}}, 5000);
  tree.MouseDown({{20, 20}}, 5001 + KControlTree::kDoubleClickMs);
  tree.MouseDown({{20 + KControlTree::kDoubleClickDistance + 1, 20}}, 5002 + KControlTree::kDoubleClickMs);
  EXPECT_EQ(log, "a:down a:down a:down ");
}

TEST_F(TreeFixture, KeysGoToTheFocusAndItsParentsThenToWhatLiesUnderTheMouse) {
  a.focusable = true;
  tree.MouseDown({{20, 20}}, 0);
  tree.MouseUp({{20, 20}});
  tree.MouseMove({{60, 20}});
  log.clear();
  EXPECT_TRUE(tree.Key({'x', 0}));
  EXPECT_EQ(log, "a:key120 ");
  log.clear();
  tree.SetFocus(nullptr);
  EXPECT_FALSE(tree.Key({'y', 0}));
  EXPECT_EQ(log, "a:blur b:key121 panel:key121 ");
}

TEST_F(TreeFixture, HiddenOrRemovedControlsTakeNothingAndLetGoOfTheMouseAndFocus) {
  a.focusable = true;
  tree.MouseDown({{20, 20}}, 0);
  ASSERT_EQ(tree.Captured(), &a);
  ASSERT_EQ(tree.Focused(), &a);
  a.SetVisible(false);
  EXPECT_EQ(tree.Captured(), nullptr);
  EXPECT_EQ(tree.Focused(), nullptr);
  EXPECT_EQ(tree.Root().FindAt({20, 20}), &panel);
  panel.Remove(b);
  EXPECT_EQ(tree.Root().FindAt({60, 20}), &panel);
}

TEST_F(TreeFixture, ARepaintPaintsTheDirtyControlsAndAnythingInsideThemOnly) {
  EXPECT_FALSE(tree.NeedsPaint());
  b.Invalidate();
  EXPECT_EQ(tree.DirtyArea(), b.Bounds());
  EXPECT_EQ(tree.Paint(drawer), b.Bounds());
  EXPECT_EQ(log, "b:paint ");
  log.clear();
  EXPECT_TRUE(tree.Paint(drawer).IsEmpty());
  EXPECT_EQ(log, "");
  panel.Invalidate();
  tree.Paint(drawer);
  EXPECT_EQ(log, "panel:paint a:paint b:paint ");
}

TEST_F(TreeFixture, APopUpOverARepaintedControlIsPaintedAgainAndItsLeavingRepaintsWhatItCovered) {
  Probe& popup = tree.Root().Emplace<Probe>(KRect{40, 30, 120, 60}, "popup", log);
  tree.Paint(drawer);
  log.clear();
  a.Invalidate();
  tree.Paint(drawer);
  EXPECT_EQ(log, "a:paint popup:paint ");
  log.clear();
  tree.Dismiss(popup);
  tree.Tick();  // the dismissal lands after the dispatch
  EXPECT_EQ(tree.Root().ChildCount(), 1);
  tree.Paint(drawer);
  EXPECT_NE(log.find("a:paint"), std::string::npos);
  EXPECT_NE(log.find("b:paint"), std::string::npos);
}

}  // namespace
