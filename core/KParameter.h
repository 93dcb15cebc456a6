#pragma once

#include <atomic>

#include "core/KAudioPluginBase.h"
#include "kernel/KExport.h"

// The value object of a parameter: holds the normalised value (atomic, so any thread may read
// it) and derives the working value from it; setting marks the plug-in's update
// pending so that the audio thread recomputes what depends on it before the next sub-block.
class TORVANE_API KParameterValue {
public:
  KParameterValue(KAudioPluginBase& owner, const KValueKind& kind, double normalized) noexcept;
  KParameterValue(const KParameterValue&) = delete;
  KParameterValue& operator=(const KParameterValue&) = delete;
  virtual ~KParameterValue() = default;

  // Takes a normalised value (clamped to 0..1); an unchanged value marks nothing.
  virtual void SetNormalized(double normalized) noexcept;
  double Normalized() const noexcept { return normalized_.load(std::memory_order_acquire); }
  // What a modulator (an LFO) adds to the normalised value, for the working value alone: hosts,
  // states and editors go on seeing the value set. Audio thread; a change marks an update.
  void SetModulation(double offset) noexcept;
  double Modulation() const noexcept { return modulation_.load(std::memory_order_relaxed); }
  // The value processing uses: the set value moved by the modulation, within the kind's range.
  // Derived on every read, so that it always belongs to the normalised value beside it even
  // while two threads set the parameter at once.
  double Working() const noexcept { return kind_.ToWorking(Normalized() + Modulation()); }
  // The working value of the set value, unmodulated: what states keep and editors show.
  double UnmodulatedWorking() const noexcept { return kind_.ToWorking(Normalized()); }

private:
  KAudioPluginBase& owner_;
  const KValueKind& kind_;
  std::atomic<double> normalized_;
  std::atomic<double> modulation_{0.0};
};

class TORVANE_API KAudioPluginBase::Parameter {
public:
  // Gesture notices a plug-in sends to its host around a user's edit.
  static constexpr int32_t kTouch = 0;
  static constexpr int32_t kRelease = 3;

  Parameter(KAudioPluginBase& owner, int32_t index, const KParameterInfo& info);

  int32_t Index() const noexcept { return index_; }
  const KParameterInfo& Info() const noexcept { return info_; }
  KString Key() const noexcept { return KString::Static(info_.key); }
  KString Name() const noexcept { return KString::Static(info_.name); }
  KString Unit() const noexcept { return info_.kind->Unit(); }
  const KValueKind& Kind() const noexcept { return *info_.kind; }
  int32_t Steps() const noexcept { return info_.kind->Steps(); }
  bool IsAutomatable() const noexcept { return (info_.flags & KParameterInfo::kAutomatable) != 0; }

  KParameterValue& Value() noexcept { return value_; }
  double Normalized() const noexcept { return value_.Normalized(); }
  double Working() const noexcept { return value_.Working(); }
  double UnmodulatedWorking() const noexcept { return value_.UnmodulatedWorking(); }
  double DefaultNormalized() const noexcept { return info_.kind->ToNormalized(info_.defaultValue); }
  void SetNormalized(double normalized) noexcept { value_.SetNormalized(normalized); }
  void SetWorking(double working) noexcept { value_.SetNormalized(info_.kind->ToNormalized(working)); }

  // Display text of the present value, or of any normalised value (hosts ask both ways).
  KString Text() const { return info_.kind->ToText(value_.UnmodulatedWorking()); }
  KString TextForNormalized(double normalized) const { return info_.kind->ToText(info_.kind->ToWorking(normalized)); }
  // False when the text names no value of this parameter.
  bool NormalizedFromText(const KString& text, double& normalized) const;

  // Starts (kTouch) or ends (kRelease) a user gesture, forwarded to the host when there is one.
  void TouchAutomation(int32_t kind);

private:
  KAudioPluginBase& owner_;
  int32_t index_;
  const KParameterInfo& info_;
  KParameterValue value_;
};
