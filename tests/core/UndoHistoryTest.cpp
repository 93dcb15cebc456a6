// The undo history against a fake plug-in: merging by the time window, the step limit, the
// carried-over entries, settings snapshots, the buttons and failures. Time is hand-driven.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <utility>
#include <vector>

#include "core/KUndoHistory.h"
#include "kernel/KException.h"
#include "tests/core/TraceCapture.h"

namespace {
using Values = std::vector<double>;
using Entries = std::vector<std::pair<int32_t, double>>;

class KManualClock final : public KClock {
public:
  uint64_t Milliseconds() const noexcept override { return now; }
  uint64_t now = 1000;
};

// Four parameters; its settings are those values as attributes.
class KFakeTarget final : public KUndoTarget {
public:
  int32_t GetParameterCount() const override { return static_cast<int32_t>(values.size()); }
  double GetParameterValue(int32_t index) const override { return values.at(static_cast<size_t>(index)); }
  void SetParameterValue(int32_t index, double value) override {
    if (reportTo) reportTo->UndoStore(index, GetParameterValue(index));
    values.at(static_cast<size_t>(index)) = value;
  }
  void StoreSettings(Element& settings) override {
    if (failStore) throw KException("Cannot store.");
    char text[100];
    std::snprintf(text, sizeof text, "%.17g %.17g %.17g %.17g", values[0], values[1], values[2], values[3]);
    settings.SetText(KString::FromUtf8(text));
  }
  void LoadSettings(const Element& settings) override {
    if (failLoad) throw KException("Cannot load.");
    std::sscanf(settings.GetText().ToUtf8().c_str(), "%lg %lg %lg %lg", &values[0], &values[1], &values[2], &values[3]);
  }
  void UpdateUndoButtons(bool canUndo, bool canRedo) override { buttons.emplace_back(canUndo, canRedo); }

  Values values{0.1, 0.2, 0.3, 0.4};
  std::vector<std::pair<bool, bool>> buttons;
  bool failStore = false;
  bool failLoad = false;
  KUndoHistory* reportTo = nullptr;  // a plug-in whose setters record their changes
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

  KManualClock clock;
  KFakeTarget target;
  KUndoHistory history{target, clock};
};
}  // namespace

TEST_F(UndoHistoryTest, ChangesWithinTheMovingWindowMergeKeepingTheFirstValue) {
  for (int i = 1; i <= 10; ++i) Change(0, 0.1 + i / 100.0, 100);
  Change(1, 0.9, 249);
  ASSERT_EQ(history.Count(), 1);
  EXPECT_EQ(StepEntries(0), (Entries{{0, 0.1}, {1, 0.2}}));

  Change(0, 0.5, 250);  // the deadline is not later than now: a new step
  EXPECT_EQ(history.Count(), 2);
}

TEST_F(UndoHistoryTest, KeepsTheNewestThirtyTwoSteps) {
  target.values[0] = 0.0;
  for (int i = 1; i <= 33; ++i) Change(0, i / 100.0);
  ASSERT_EQ(history.Count(), 32);
  EXPECT_EQ(history.Position(), 32);
  EXPECT_EQ(StepEntries(0), (Entries{{0, 0.01}}));
  EXPECT_EQ(StepEntries(31), (Entries{{0, 0.32}}));
}

TEST_F(UndoHistoryTest, UndoAndRedoWalkBetweenTheRecordedStatesAndThePresent) {
  Change(0, 0.5);
  Change(1, 0.7);
  history.Undo();  // records the present first
  EXPECT_EQ(history.Count(), 3);
  EXPECT_EQ(target.values, (Values{0.5, 0.2, 0.3, 0.4}));
  history.Undo();
  EXPECT_EQ(target.values, (Values{0.1, 0.2, 0.3, 0.4}));
  history.Redo();  // parameter 0 comes back through the entry carried into the second step
  EXPECT_EQ(target.values, (Values{0.5, 0.2, 0.3, 0.4}));
  history.Redo();
  EXPECT_EQ(target.values, (Values{0.5, 0.7, 0.3, 0.4}));
  EXPECT_FALSE(history.CanRedo());

  history.Undo();  // after a redo to the end the present record is replaced, not stacked
  EXPECT_EQ(history.Count(), 3);
  EXPECT_EQ(target.values[1], 0.2);

  history.Redo();
  Change(2, 0.9);  // at the end the present record stays: only it brings parameter 1 back
  for (int i = 0; i < 3; ++i) history.Undo();
  EXPECT_EQ(target.values, (Values{0.5, 0.2, 0.3, 0.4}));
  history.Redo();
  EXPECT_EQ(target.values[1], 0.7);

  Change(3, 0.8);  // drops the redo steps
  ASSERT_EQ(history.Count(), 4);
  EXPECT_EQ(history.Position(), 4);
  EXPECT_FALSE(history.CanRedo());
  EXPECT_EQ(StepEntries(3), (Entries{{3, 0.4}}));

  history.Undo();
  Change(3, 0.9, 10);  // inside the window, yet undo closed the step: a step of its own
  EXPECT_FALSE(history.CanRedo());
}

TEST_F(UndoHistoryTest, ANewStepCarriesOverWhatMovedSinceTheStepBehindTheCursor) {
  target.values = {0.1, 0.2, 0.0, 0.0};
  Change(0, 0.5);
  Change(1, 0.6, 10);
  Change(2, 9e-7, 10);  // closer than 1e-6 to its record: dropped
  Change(3, 1e-6, 10);  // exactly 1e-6 away: carried
  history.UndoStore(7, 0.9);  // no such parameter: never carried
  Change(1, 0.8);
  ASSERT_EQ(history.Count(), 2);
  // The changed parameter's entry is replaced in place by the new pair, not appended.
  EXPECT_EQ(StepEntries(1), (Entries{{0, 0.5}, {1, 0.6}, {3, 1e-6}}));
}

TEST_F(UndoHistoryTest, SettingsStepsSkipRepeatsAndRestoreSnapshots) {
  history.UndoStoreSettings();
  history.UndoStoreSettings();
  history.Undo();  // the present equals the only snapshot: nothing appended, nothing to apply
  EXPECT_EQ(history.Count(), 1);
  EXPECT_EQ(history.Position(), 0);
  history.Redo();
  target.values = {0.9, 0.9, 0.9, 0.9};
  history.UndoStoreSettings();
  target.values = {0.5, 0.5, 0.5, 0.5};
  history.Undo();
  EXPECT_EQ(history.Count(), 3);
  EXPECT_EQ(target.values, (Values{0.9, 0.9, 0.9, 0.9}));
  history.Undo();
  EXPECT_EQ(target.values, (Values{0.1, 0.2, 0.3, 0.4}));
  history.Redo();
  history.Redo();
  EXPECT_EQ(target.values, (Values{0.5, 0.5, 0.5, 0.5}));
}

TEST_F(UndoHistoryTest, ButtonsFollowEveryOperationAndUndoStopsAtPositionOne) {
  using Buttons = std::vector<std::pair<bool, bool>>;
  Change(0, 0.5);  // position 1 of 1: undo is possible
  Change(0, 0.6);
  Change(0, 0.7);
  history.Undo();
  history.Undo();
  history.Undo();  // position 1 of 4: nothing behind the first step
  EXPECT_EQ(target.buttons, (Buttons{{true, false}, {true, false}, {true, false}, {true, true}, {true, true}, {false, true}}));
  history.Undo();
  EXPECT_EQ(target.buttons.size(), 6u);
  EXPECT_EQ(target.values[0], 0.1);

  for (int i = 0; i < 4; ++i) history.Redo();
  EXPECT_EQ(target.buttons.size(), 9u);
  EXPECT_EQ(target.buttons.back(), std::make_pair(true, false));
  EXPECT_EQ(target.values[0], 0.7);
}

TEST_F(UndoHistoryTest, DisabledRecordsNoChangeButUndoStillRecordsThePresent) {
  history.SetUndoEnabled(false);
  Change(0, 0.5);
  history.UndoStoreSettings();
  EXPECT_EQ(history.Count(), 0);
  EXPECT_TRUE(target.buttons.empty());

  history.SetUndoEnabled(true);
  Change(1, 0.6);
  history.UndoStoreSettings();
  target.values[2] = 0.7;
  history.SetUndoEnabled(false);
  history.Undo();  // both kinds of present record are still taken
  EXPECT_EQ(target.values, (Values{0.5, 0.6, 0.3, 0.4}));
  history.Undo();
  EXPECT_EQ(target.values[1], 0.2);
  history.Redo();
  history.Redo();
  EXPECT_EQ(target.values, (Values{0.5, 0.6, 0.7, 0.4}));
}

TEST_F(UndoHistoryTest, ChangesReportedBackWhileApplyingAreNotRecorded) {
  target.reportTo = &history;
  Change(0, 0.5);
  clock.now += 1000;  // what is reported back would start a step of its own
  history.Undo();
  EXPECT_EQ(history.Count(), 2);
  EXPECT_TRUE(history.CanRedo());
  history.Redo();
  EXPECT_EQ(target.values[0], 0.5);
}

TEST_F(UndoHistoryTest, AFailingTargetIsTracedAndTheCallerCarriesOn) {
  KTraceCapture capture;
  history.UndoStoreSettings();
  target.values[0] = 0.5;
  history.UndoStoreSettings();
  target.failLoad = true;
  history.Undo();
  target.failStore = true;
  history.UndoStoreSettings();
  EXPECT_EQ(KTraceCapture::Lines(), (std::vector<std::string>{"SYSTEM EXCEPTION! KAudioPluginBase::Undo",
                                                              "SYSTEM EXCEPTION! KAudioPluginBase::UndoStoreSettings"}));
  EXPECT_EQ(history.Position(), 1);  // what the body did stays: no rollback
  EXPECT_EQ(history.Count(), 2);
  EXPECT_EQ(target.values[0], 0.5);

  target.failLoad = target.failStore = false;
  history.Redo();
  history.Undo();
  EXPECT_EQ(target.values[0], 0.1);
}
