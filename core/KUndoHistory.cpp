#include "core/KUndoHistory.h"

#include <cmath>
#include <utility>

#include "kernel/KGuard.h"

namespace {
// Holds a flag set for the length of a scope, also when the scope is left by an exception.
class KFlagScope {
public:
  explicit KFlagScope(bool& flag) noexcept : flag_(flag) { flag_ = true; }
  KFlagScope(const KFlagScope&) = delete;
  KFlagScope& operator=(const KFlagScope&) = delete;
  ~KFlagScope() { flag_ = false; }

private:
  bool& flag_;
};
}  // namespace

const KUndoEntry* KUndoStep::Find(int32_t index) const noexcept {
  for (const KUndoEntry& entry : entries)
    if (entry.index == index) return &entry;
  return nullptr;
}

void KUndoHistory::UndoStore(int32_t index, double value) noexcept {
  KGuard("KAudioPluginBase::UndoStore", [&] {
    if (!enabled_ || applying_) return;
    const uint64_t now = clock_.Milliseconds();
    if (current_ == nullptr || deadline_ <= now) {
      StartParameterStep(index, value);
    } else if (current_->Find(index) == nullptr) {
      current_->entries.Append(KUndoEntry{index, value});  // an earlier value of a drag stays
    }
    deadline_ = now + kMergeMilliseconds;  // every change extends the window
    UpdateButtons();
  });
}

void KUndoHistory::StartParameterStep(int32_t index, double value) {
  auto step = std::make_unique<KUndoStep>(KUndoStep::kParameters);
  bool placed = false;
  // The step behind the cursor holds the values from before its changes; redo through the new
  // step must bring those parameters back to where they went, so the ones that moved come along.
  if (CanUndo() && steps_[position_ - 1]->kind == KUndoStep::kParameters) {
    const int32_t parameterCount = target_.GetParameterCount();
    for (const KUndoEntry& entry : steps_[position_ - 1]->entries) {
      if (entry.index == index && !placed) {
        step->entries.Append(KUndoEntry{index, value});
        placed = true;
      } else if (entry.index >= 0 && entry.index < parameterCount) {
        const double present = target_.GetParameterValue(entry.index);
        if (std::fabs(present - entry.value) >= kUnchangedDistance)
          step->entries.Append(KUndoEntry{entry.index, present});
      }
    }
  }
  if (!placed) step->entries.Append(KUndoEntry{index, value});
  current_ = Push(std::move(step), false);
}

void KUndoHistory::UndoStoreSettings() noexcept {
  KGuard("KAudioPluginBase::UndoStoreSettings", [this] {
    // Undo's own record of the present is taken even while recording is disabled: without it
    // Undo would skip a state and Redo could not return.
    if ((!enabled_ && !recordingPresent_) || applying_) return;
    auto snapshot = std::make_unique<KUndoStep>(KUndoStep::kSettings);
    target_.StoreSettings(snapshot->settings);
    Push(std::move(snapshot), true);
    UpdateButtons();
  });
}

KUndoStep* KUndoHistory::Push(StepPointer step, bool compare) {
  if (presentRecorded_ && recordingPresent_ && position_ == steps_.Count()) {
    RemoveStep(steps_.Count() - 1);
  } else {
    while (steps_.Count() > position_) RemoveStep(steps_.Count() - 1);
  }
  presentRecorded_ = false;
  if (compare && step->kind == KUndoStep::kSettings && !steps_.IsEmpty() &&
      steps_.Last()->kind == KUndoStep::kSettings && steps_.Last()->settings == step->settings) {
    position_ = steps_.Count();
    return nullptr;
  }
  KUndoStep* pushed = steps_.Append(std::move(step)).get();
  while (steps_.Count() > kStepLimit) RemoveStep(0);
  position_ = steps_.Count();
  presentRecorded_ = recordingPresent_;
  return pushed;
}

void KUndoHistory::RemoveStep(int32_t index) noexcept {
  if (steps_[index].get() == current_) CloseCurrentStep();
  steps_.RemoveAt(index);
}

void KUndoHistory::Undo() noexcept {
  KGuard("KAudioPluginBase::Undo", [this] {
    if (!CanUndo()) return;
    if (position_ == steps_.Count()) RecordPresent();
    // When the present equalled the last snapshot nothing was appended; the position may then
    // reach 0, with no step behind it to apply.
    if (--position_ > 0) Apply(*steps_[position_ - 1]);
    CloseCurrentStep();
    UpdateButtons();
  });
}

void KUndoHistory::RecordPresent() {
  const KFlagScope recording(recordingPresent_);
  const KUndoStep& last = *steps_.Last();
  if (last.kind == KUndoStep::kSettings) {
    UndoStoreSettings();
    return;
  }
  auto present = std::make_unique<KUndoStep>(KUndoStep::kParameters);
  const int32_t parameterCount = target_.GetParameterCount();
  for (const KUndoEntry& entry : last.entries) {
    const bool known = entry.index >= 0 && entry.index < parameterCount;
    present->entries.Append(KUndoEntry{entry.index, known ? target_.GetParameterValue(entry.index) : 0.0});
  }
  Push(std::move(present), true);
}

void KUndoHistory::Redo() noexcept {
  KGuard("KAudioPluginBase::Redo", [this] {
    if (!CanRedo()) return;
    ++position_;
    Apply(*steps_[position_ - 1]);
    CloseCurrentStep();
    UpdateButtons();
  });
}

void KUndoHistory::Apply(const KUndoStep& step) {
  const KFlagScope applying(applying_);
  if (step.kind == KUndoStep::kSettings) {
    target_.LoadSettings(step.settings);
    return;
  }
  const int32_t parameterCount = target_.GetParameterCount();
  for (const KUndoEntry& entry : step.entries)
    if (entry.index >= 0 && entry.index < parameterCount) target_.SetParameterValue(entry.index, entry.value);
}

void KUndoHistory::CloseCurrentStep() noexcept {
  current_ = nullptr;
  deadline_ = 0;
}

void KUndoHistory::UpdateButtons() { target_.UpdateUndoButtons(CanUndo(), CanRedo()); }
