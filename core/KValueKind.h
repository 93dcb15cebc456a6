#pragma once

#include <cstdint>
#include <span>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// How a parameter's normalised value (0..1, what hosts automate) maps to its working value
// (the unit the plug-in computes with: dB, seconds, Hz, an index) and to the text a user reads
// and types. Kinds are immutable and shared by every instance, so parameter tables are data.
class TORVANE_API KValueKind {
public:
  constexpr KValueKind(double minimum, double maximum, const char* unit) : minimum_(minimum), maximum_(maximum), unit_(unit) {}
  KValueKind(const KValueKind&) = delete;
  KValueKind& operator=(const KValueKind&) = delete;
  virtual ~KValueKind() = default;

  double Minimum() const noexcept { return minimum_; }
  double Maximum() const noexcept { return maximum_; }
  KString Unit() const noexcept { return KString::Static(unit_); }
  // Number of discrete steps above the first value (0: continuous), as hosts count them.
  virtual int32_t Steps() const noexcept { return 0; }

  // Both directions clamp: no input puts a value outside the kind's range.
  virtual double ToWorking(double normalized) const noexcept = 0;
  virtual double ToNormalized(double working) const noexcept = 0;
  virtual KString ToText(double working) const = 0;
  // Accepts what ToText writes and what a user would type (with or without the unit).
  // False when the text is not a value of this kind; `working` is then unchanged.
  virtual bool FromText(const KString& text, double& working) const = 0;

protected:
  double Clamp(double working) const noexcept;

  double minimum_;
  double maximum_;
  const char* unit_;
};

// A plain linear range, shown with a format pattern such as "{0.2}".
class TORVANE_API KLinearKind : public KValueKind {
public:
  constexpr KLinearKind(double minimum, double maximum, const char* unit, const char* pattern)
      : KValueKind(minimum, maximum, unit), pattern_(pattern) {}
  double ToWorking(double normalized) const noexcept override;
  double ToNormalized(double working) const noexcept override;
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;

private:
  const char* pattern_;
};

// Gain in decibels, linear in dB across the range, one decimal.
class TORVANE_API KDecibelKind : public KLinearKind {
public:
  constexpr KDecibelKind(double minimum, double maximum) : KLinearKind(minimum, maximum, "dB", "{0.1}") {}
};

// A ratio shown as "<r> : 1"; quadratic, so that the lower part of the range gets most of the
// travel: half travel lies a quarter of the way up the range. "4", "4:1" and "4 : 1" are all
// understood.
class TORVANE_API KRatioKind : public KValueKind {
public:
  constexpr KRatioKind(double minimum, double maximum) : KValueKind(minimum, maximum, "") {}
  double ToWorking(double normalized) const noexcept override;
  double ToNormalized(double working) const noexcept override;
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// Time in seconds, skewed (cubic) so that short times get resolution: half travel lies an
// eighth of the way up the range. Shown in milliseconds.
class TORVANE_API KTimeKind : public KValueKind {
public:
  constexpr KTimeKind(double minimum, double maximum) : KValueKind(minimum, maximum, "ms") {}
  double ToWorking(double normalized) const noexcept override;
  double ToNormalized(double working) const noexcept override;
  KString ToText(double working) const override;
  // "12", "12 ms" and "0.5 s" are all understood.
  bool FromText(const KString& text, double& working) const override;
};

// Frequency in Hz on a logarithmic scale (equal travel per octave, so half travel is the
// geometric mean of the ends); "1.5k", "1.5 kHz" and "1500 Hz" are all understood.
class TORVANE_API KFrequencyKind : public KValueKind {
public:
  constexpr KFrequencyKind(double minimum, double maximum) : KValueKind(minimum, maximum, "Hz") {}
  double ToWorking(double normalized) const noexcept override;
  double ToNormalized(double working) const noexcept override;
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// Whole numbers from minimum to maximum.
class TORVANE_API KIntegerKind : public KValueKind {
public:
  constexpr KIntegerKind(int32_t minimum, int32_t maximum, const char* unit = "") : KValueKind(minimum, maximum, unit) {}
  int32_t Steps() const noexcept override { return static_cast<int32_t>(maximum_ - minimum_); }
  double ToWorking(double normalized) const noexcept override;
  double ToNormalized(double working) const noexcept override;
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// A choice among names; the working value is the index. Text matches a name ignoring letter
// case, or gives the index itself; an index outside the list is not a choice.
class TORVANE_API KListKind : public KIntegerKind {
public:
  constexpr explicit KListKind(std::span<const char* const> names)
      : KIntegerKind(0, static_cast<int32_t>(names.size()) - 1), names_(names) {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;

private:
  std::span<const char* const> names_;
};

// A position between full left (-100 %) and full right (+100 %), shown as "30 L", "C" and
// "30 R"; "-30", "30 L", "L30", "C" and "centre" are all understood.
class TORVANE_API KBalanceKind : public KLinearKind {
public:
  constexpr KBalanceKind() : KLinearKind(-100.0, 100.0, "", "{0.0}") {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// Off / On; also understands "0"/"1", "false"/"true", "no"/"yes".
class TORVANE_API KSwitchKind : public KListKind {
public:
  constexpr KSwitchKind() : KListKind(kNames) {}
  bool FromText(const KString& text, double& working) const override;

private:
  static constexpr const char* kNames[] = {"Off", "On"};
};
