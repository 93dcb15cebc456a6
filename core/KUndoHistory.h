#pragma once

#include <cstdint>
#include <memory>
#include <type_traits>

#include "core/Element.h"
#include "core/KClock.h"
#include "kernel/KArray.h"

// What the undo history needs of its plug-in. Values are normalised (0..1); indices passed
// in are always below GetParameterCount.
class KUndoTarget {
public:
  virtual ~KUndoTarget() = default;
  virtual int32_t GetParameterCount() const = 0;
  virtual double GetParameterValue(int32_t index) const = 0;
  virtual void SetParameterValue(int32_t index, double value) = 0;
  // The whole settings, as saved with a project or a preset.
  virtual void StoreSettings(Element& settings) = 0;
  virtual void LoadSettings(const Element& settings) = 0;
  // Called after every operation that acted, with the enable states of the editor's buttons.
  virtual void UpdateUndoButtons(bool canUndo, bool canRedo) = 0;
};

// One recorded parameter value.
struct KUndoEntry {
  int32_t index;
  double value;
};

// One step of the history: either a snapshot of the whole settings or a list of parameter
// values. Applying a step sets the plug-in to what the step holds.
struct KUndoStep {
  enum Kind : int32_t { kSettings = 0, kParameters = 1 };

  explicit KUndoStep(Kind stepKind) noexcept : kind(stepKind) {}
  // The entry for that parameter, or null.
  const KUndoEntry* Find(int32_t index) const noexcept;

  Kind kind;
  Element settings;            // kSettings
  KArray<KUndoEntry> entries;  // kParameters, in the order recorded
};

template <>
struct KIsRelocatable<std::unique_ptr<KUndoStep>> : std::true_type {};  // a single owning pointer

// The undo history of one plug-in: at most 32 steps and a cursor. Changes reported within
// 250 ms of each other merge into one open parameter step (one mouse drag, one step).
//
// A parameter step is recorded with the values from before the change, so applying it takes
// the plug-in back to that moment; a settings step is a snapshot taken when reported. The
// position counts the steps behind the cursor and the plug-in stands at the step just behind
// it (slot position - 1): Undo moves the position back one and applies the new slot
// position - 1, Redo moves it forward one and applies the same slot. Undo at the end first
// appends the present state, so that a later Redo can return to it.
class KUndoHistory {
public:
  static constexpr int32_t kStepLimit = 32;
  static constexpr uint64_t kMergeMilliseconds = 250;
  // A carried-over value closer than this to its recorded one counts as unchanged.
  static constexpr double kUnchangedDistance = 1e-6;

  explicit KUndoHistory(KUndoTarget& target, const KClock& clock = KClock::System()) noexcept
      : target_(target), clock_(clock) {}
  KUndoHistory(const KUndoHistory&) = delete;
  KUndoHistory& operator=(const KUndoHistory&) = delete;

  // While disabled, changes reported by the plug-in are not recorded.
  void SetUndoEnabled(bool enabled) noexcept { enabled_ = enabled; }
  bool IsUndoEnabled() const noexcept { return enabled_; }

  // Records one parameter change; `value` is the parameter's value from before the change.
  void UndoStore(int32_t index, double value) noexcept;
  // Records a snapshot of the whole settings, unless it equals the last settings step.
  void UndoStoreSettings() noexcept;
  void Undo() noexcept;
  void Redo() noexcept;

  // Undo is refused at position 1 while later steps exist: that first step is where the
  // plug-in stands, and nothing lies behind it.
  bool CanUndo() const noexcept { return position_ >= 2 || (position_ == 1 && steps_.Count() == 1); }
  bool CanRedo() const noexcept { return position_ < steps_.Count(); }

  int32_t Count() const noexcept { return steps_.Count(); }
  int32_t Position() const noexcept { return position_; }
  const KUndoStep& GetStep(int32_t index) const noexcept { return *steps_[index]; }

private:
  using StepPointer = std::unique_ptr<KUndoStep>;

  // Opens a new parameter step, carrying over what the step behind the cursor still needs.
  void StartParameterStep(int32_t index, double value);
  // The one way in: answers the appended step, or null when `compare` found it a repeat.
  KUndoStep* Push(StepPointer step, bool compare);
  void RemoveStep(int32_t index) noexcept;
  // Appends the present state of what the last step holds, before Undo leaves the end.
  void RecordPresent();
  void Apply(const KUndoStep& step);
  void CloseCurrentStep() noexcept;
  void UpdateButtons();

  KUndoTarget& target_;
  const KClock& clock_;
  KArray<StepPointer> steps_;
  int32_t position_ = 0;
  // The two flag bytes of a push. The first says the last step is the present state that an
  // Undo recorded; any push clears it. The second is set while Undo records the present
  // state: with both set at the end, the earlier record is replaced rather than stacked, so
  // that Undo, Redo, Undo never leaves a step that changes nothing.
  bool presentRecorded_ = false;
  bool recordingPresent_ = false;
  // Set while a step is applied: what the plug-in reports back then is the history's own doing.
  bool applying_ = false;
  bool enabled_ = true;
  KUndoStep* current_ = nullptr;  // the parameter step open for merging, owned by steps_
  uint64_t deadline_ = 0;
};
