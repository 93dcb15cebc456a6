#include <gtest/gtest.h>

#include <utility>

#include "core/KUndoHistory.h"
#include "tests/core/RecordingPlugin.h"

namespace {
using Values = std::vector<double>;
using Entries = std::vector<std::pair<int32_t, double>>;

// Four parameters, no settings.
class KFakeTarget final : public KUndoTarget {
public:
  int32_t GetParameterCount() const override { return 4; }
  double GetParameterValue(int32_t index) const override { return values.at(static_cast<size_t>(index)); }
  void SetParameterValue(int32_t index, double value) override { values.at(static_cast<size_t>(index)) = value; }
  void StoreSettings(Element&) override {}
  void LoadSettings(const Element&) override {}
  void UpdateUndoButtons(bool canUndo, bool canRedo) override { buttons += canUndo ? canRedo ? "UR " : "U- " : canRedo ? "-R " : "-- "; }

  Values values{0.1, 0.2, 0.3, 0.4};
  std::string buttons;  // the enable states of undo and redo after each operation
};

class UndoHistoryTest : public ::testing::Test {
protected:
  // A change as the plug-in makes it: the value from before goes into the history.
  void Change(int32_t index, double value, uint64_t afterMilliseconds = 1000) {
    clock.now += afterMilliseconds;
    history.UndoStore(index, target.GetParameterValue(index));
    target.values.at(static_cast<size_t>(index)) = value;
  }
  Entries StepEntries(int32_t step) const {
    Entries entries;
    for (const KUndoEntry& entry : history.GetStep(step).entries) entries.emplace_back(entry.index, entry.value);
    return entries;
  }

  KHandDrivenClock clock;
  KFakeTarget target;
  KUndoHistory history{target, clock};
};
}  // namespace

TEST_F(UndoHistoryTest, ChangesWithinTheMovingWindowMergeKeepingTheFirstValue) {
  for (int i = 1; i <= 10; ++i) Change(0, 0.1 + i / 100.0, 100);
  Change(1, 0.9, 249);
  ASSERT_EQ(history.Count(), 1);
  EXPECT_EQ(StepEntries(0), (Entries{{0, 0.1}, {1, 0.2}}));
  Change(0, 0.5, 250);  // the window closed as this arrived: a new step
  EXPECT_EQ(history.Count(), 2);
  for (int i = 1; i <= 31; ++i) Change(0, i / 100.0);
  EXPECT_EQ(history.Count(), 32);  // of 33 steps the newest 32 remain
  EXPECT_EQ(StepEntries(0), (Entries{{0, 0.2}, {1, 0.9}}));
  EXPECT_EQ(StepEntries(31), (Entries{{0, 0.3}}));
}

// Undo at the end records the present first, Redo returns to it; Undo stops at position 1 while
// later steps exist; a change drops the redo steps.
TEST_F(UndoHistoryTest, UndoAndRedoWalkBetweenTheRecordedStatesAndThePresent) {
  Change(0, 0.5);
  Change(1, 0.7);
  history.Undo();
  EXPECT_EQ(history.Count(), 3);
  EXPECT_EQ(target.values, (Values{0.5, 0.2, 0.3, 0.4}));
  history.Undo();
  history.Undo();  // position 1: nothing behind the first step
  EXPECT_EQ(history.Position(), 1);
  EXPECT_EQ(target.values, (Values{0.1, 0.2, 0.3, 0.4}));
  history.Redo();  // parameter 0 comes back through the entry carried into the second step
  history.Redo();
  EXPECT_EQ(target.values, (Values{0.5, 0.7, 0.3, 0.4}));
  history.Undo();  // after a redo to the end the present record is replaced, not stacked
  EXPECT_EQ(history.Count(), 3);
  EXPECT_EQ(target.buttons, "U- U- UR -R UR U- UR ");
  Change(3, 0.8);  // drops the redo step
  ASSERT_EQ(history.Count(), 3);
  EXPECT_EQ(StepEntries(2), (Entries{{3, 0.4}}));
  history.Undo();
  Change(3, 0.9, 10);  // inside the window, yet undo closed the step: a step of its own
  EXPECT_FALSE(history.CanRedo());
}
