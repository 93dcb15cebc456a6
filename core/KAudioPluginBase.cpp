#include "core/KAudioPluginBase.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "core/KParameter.h"

namespace {
constexpr double kNoValue = std::numeric_limits<double>::quiet_NaN();

// Value of a ramp at the current position (time 0 of the current sub-block).
double RampValue(const ParameterRamp& ramp) noexcept {
  const ParameterRamp::Point& p0 = ramp.points[0];
  const ParameterRamp::Point& p1 = ramp.points[1];
  if (p0.time > 0) return p0.value;  // the segment has not begun
  // A segment that has reached its corner lands on it exactly, not on a rounded interpolation.
  if (p1.time <= 0) return p1.value;
  const double length = static_cast<double>(p1.time) - static_cast<double>(p0.time);
  return p0.value + (p1.value - p0.value) * -static_cast<double>(p0.time) / length;
}

void Fill(ParameterRamp& ramp, int32_t parameter, std::span<const ParameterRamp::Point> points, bool fine, bool modulation = false) noexcept {
  ramp.parameter = parameter;
  for (size_t i = 0; i < points.size(); ++i) ramp.points[i] = points[i];
  ramp.pointCount = static_cast<int8_t>(points.size());
  ramp.fine = fine ? 1 : 0;
  ramp.modulation = modulation ? 1 : 0;
}
}  // namespace

KAudioPluginBase::KAudioPluginBase(std::span<const KParameterInfo> table)
    : records_(new ParameterRamp[kAudioRampCapacity + kPostedRampCapacity]),
      overflowValues_(new std::atomic<double>[table.size()]) {
  parameters_.Reserve(static_cast<int32_t>(table.size()));
  for (size_t i = 0; i < table.size(); ++i) {
    parameters_.Append(new Parameter(*this, static_cast<int32_t>(i), table[i]));
    overflowValues_[i].store(kNoValue, std::memory_order_relaxed);
  }
  for (int32_t i = 0; i < kAudioRampCapacity; ++i) spare_.PushBack(&records_[i]);
  for (int32_t i = kAudioRampCapacity; i < kAudioRampCapacity + kPostedRampCapacity; ++i) {
    records_[i].posted = 1;
    postedFree_.PushBack(&records_[i]);
  }
}

KAudioPluginBase::~KAudioPluginBase() {
  for (Parameter* parameter : parameters_) delete parameter;
}

KAudioPluginBase::Parameter* KAudioPluginBase::FindParameter(const KString& key) noexcept {
  for (Parameter* parameter : parameters_)
    if (parameter->Key() == key) return parameter;
  return nullptr;
}

void KAudioPluginBase::Apply(int32_t parameter, double normalized) noexcept {
  parameters_[parameter]->SetNormalized(normalized > 1.0 ? 1.0 : (normalized < 0.0 ? 0.0 : normalized));
}
void KAudioPluginBase::Apply(const ParameterRamp& ramp, double value) noexcept {
  if (!ramp.modulation) Apply(ramp.parameter, value);
  else parameters_[ramp.parameter]->Value().SetModulation(value > 1.0 ? 1.0 : (value < -1.0 ? -1.0 : value));
}
void KAudioPluginBase::ApplyCurrent(ParameterRamp& ramp) noexcept { Apply(ramp, RampValue(ramp)); }
void KAudioPluginBase::ApplyLast(ParameterRamp& ramp) noexcept { Apply(ramp, ramp.points[ramp.pointCount - 1].value); }

int32_t KAudioPluginBase::NextBreak(const ParameterRamp& ramp) const noexcept {
  if (ramp.fine) return ToGrid();
  return ramp.points[0].time > 0 ? ramp.points[0].time : ramp.points[1].time;
}

bool KAudioPluginBase::Settle(ParameterRamp* ramp) noexcept {
  // Drops the corners already passed, so that points 0 and 1 hold the present position.
  while (ramp->points[1].time < 1 && ramp->pointCount >= 3) {
    for (int32_t i = 1; i < ramp->pointCount; ++i) ramp->points[i - 1] = ramp->points[i];
    --ramp->pointCount;
  }
  // A fine ramp moves only on the grid: between lines its parameter keeps the value of the last.
  if (ramp->fine && !OnGrid()) return false;
  ApplyCurrent(*ramp);
  if (ramp->points[1].time >= 1) return false;
  Retire(ramp);
  return true;
}

void KAudioPluginBase::Retire(ParameterRamp* ramp) noexcept {
  active_.Remove(ramp);
  (ramp->posted ? postedReturns_ : spare_).PushBack(ramp);
}

void KAudioPluginBase::RetireRampsOf(int32_t parameter, bool modulation) noexcept {
  for (ParameterRamp* ramp = active_.Head(); ramp;) {
    ParameterRamp* next = ramp->next;
    if (ramp->parameter == parameter && (ramp->modulation != 0) == modulation) Retire(ramp);
    ramp = next;
  }
}

bool KAudioPluginBase::AddRamp(int32_t parameter, std::span<const RampPoint> points, bool fine, bool modulation) noexcept {
  if (parameter < 0 || parameter >= ParameterCount() || points.empty()) return false;
  ParameterRamp* ramp = points.size() >= 2 && points.size() <= ParameterRamp::kMaxPoints ? spare_.PopFront() : nullptr;
  RetireRampsOf(parameter, modulation);
  if (!ramp) {
    ParameterRamp last;
    Fill(last, parameter, points.last(1), false, modulation);
    ApplyLast(last);
    return false;
  }
  Fill(*ramp, parameter, points, fine, modulation);
  active_.PushBack(ramp);
  rampsAdded_ = true;
  return true;
}

void KAudioPluginBase::StretchToBlockEnd(int32_t blockLength) noexcept {
  for (ParameterRamp* ramp = active_.Head(); ramp; ramp = ramp->next)
    if (ramp->points[1].time == ParameterRamp::kBlockEnd) ramp->points[1].time = blockLength;
}

int32_t KAudioPluginBase::PrepareRamps(int32_t blockLength, int32_t& subBlockCap, int32_t fineCap) noexcept {
  int32_t limit = blockLength < subBlockCap ? blockLength : subBlockCap;
  grid_ = fineCap > 0 ? fineCap : 1;
  // Values must land at once: every ramp jumps to its end and retires. Modulation moves on from
  // here, as it would have from the start of the stream. Both pools belong to the audio thread,
  // so this needs no lock.
  if ((stateFlags_.load(std::memory_order_acquire) & kJump) != 0) {
    stateFlags_.fetch_and(~kJump, std::memory_order_acq_rel);
    for (ParameterRamp* ramp = active_.Head(); ramp;) {
      ParameterRamp* next = ramp->next;
      if (!ramp->modulation) {
        ApplyLast(*ramp);
        Retire(ramp);
      }
      ramp = next;
    }
    position_ = 0;  // the grid starts again where values landed at once
  }
  if (!active_.IsEmpty()) {
    ResolveBlockEnd(blockLength);
    rampsAdded_ = false;
    bool anyFine = false;
    for (ParameterRamp* ramp = active_.Head(); ramp;) {
      ParameterRamp* next = ramp->next;
      if (!Settle(ramp)) {
        limit = std::min(limit, NextBreak(*ramp));
        anyFine |= ramp->fine != 0;
      }
      ramp = next;
    }
    if (anyFine) {
      subBlockCap = fineCap;
      if (fineCap < limit) limit = fineCap;
    }
    return limit;
  }
  rampsAdded_ = false;
  return limit;
}

int32_t KAudioPluginBase::AdvanceRamps(int32_t processedLength, int32_t remainingLength) noexcept {
  int32_t limit = remainingLength;
  for (ParameterRamp* ramp = active_.Head(); ramp;) {
    ParameterRamp* next = ramp->next;
    for (int32_t i = 0; i < ramp->pointCount; ++i) ramp->points[i].time -= processedLength;
    if (!Settle(ramp)) limit = std::min(limit, NextBreak(*ramp));
    ramp = next;
  }
  return limit;
}

void KAudioPluginBase::SettleRamps() noexcept {
  for (ParameterRamp* ramp = active_.Head(); ramp;) {
    ParameterRamp* next = ramp->next;
    Settle(ramp);
    ramp = next;
  }
}

void KAudioPluginBase::ApplyOverflowValues() noexcept {
  for (int32_t p = 0; p < ParameterCount(); ++p) {
    const double value = overflowValues_[p].exchange(kNoValue, std::memory_order_acq_rel);
    if (std::isnan(value)) continue;
    RetireRampsOf(p);
    Apply(p, value);
  }
}

void KAudioPluginBase::TakePostedRamps() noexcept {
  if (overflowPending_.load(std::memory_order_relaxed) && overflowPending_.exchange(false, std::memory_order_acq_rel))
    ApplyOverflowValues();
  // With nothing posted and nothing to give back, no lock is taken.
  if (!rampsPosted_.load(std::memory_order_acquire) && postedReturns_.IsEmpty()) return;
  if (!rampMutex_.try_lock()) return;
  rampsPosted_.store(false, std::memory_order_relaxed);
  postedFree_.Splice(postedReturns_);
  while (ParameterRamp* ramp = posted_.PopFront()) {
    RetireRampsOf(ramp->parameter);
    active_.PushBack(ramp);
    rampsAdded_ = true;
  }
  rampMutex_.unlock();
}

void KAudioPluginBase::PostRamp(int32_t parameter, std::span<const RampPoint> points, bool fine) {
  if (parameter < 0 || parameter >= ParameterCount() || points.empty()) return;
  if (points.size() < 2 || points.size() > ParameterRamp::kMaxPoints) {
    PostValue(parameter, points.back().value, 1);
    return;
  }
  std::lock_guard<std::mutex> lock(rampMutex_);
  for (ParameterRamp* ramp = posted_.Head(); ramp; ramp = ramp->next) {
    if (ramp->parameter == parameter) {  // not taken yet: the newer ramp replaces it
      Fill(*ramp, parameter, points, fine);
      return;
    }
  }
  if (ParameterRamp* ramp = postedFree_.PopFront()) {
    Fill(*ramp, parameter, points, fine);
    posted_.PushBack(ramp);
    rampsPosted_.store(true, std::memory_order_release);
    return;
  }
  overflowValues_[parameter].store(points.back().value, std::memory_order_release);
  overflowPending_.store(true, std::memory_order_release);
}

void KAudioPluginBase::PostValue(int32_t parameter, double normalized, int32_t glideSamples) {
  if (parameter < 0 || parameter >= ParameterCount()) return;
  const RampPoint points[2] = {{0, parameters_[parameter]->Normalized()}, {glideSamples > 1 ? glideSamples : 1, normalized}};
  PostRamp(parameter, points, true);
}
