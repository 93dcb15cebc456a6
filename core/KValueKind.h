#pragma once

#include <cstdint>
#include <span>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// How the travel of a control (the normalised value, 0..1) spreads over a kind's range.
enum class KValueCurve : uint8_t {
  kLinear,
  kSquare,       // half travel a quarter of the way up: the lower part gets most of the travel
  kCube,         // half travel an eighth of the way up
  kLogarithmic,  // equal travel per doubling: half travel is the geometric mean of the ends
  kWhole,        // linear, in whole numbers
};

// How a parameter's normalised value (0..1, what hosts automate) maps to its working value
// (the unit the plug-in computes with: dB, seconds, Hz, an index) and to the text a user reads
// and types. The mapping is the kind's curve, the text its own: any curve goes with any text.
// Kinds are immutable and shared by every instance, so parameter tables are data.
class TORVANE_API KValueKind {
public:
  constexpr KValueKind(double minimum, double maximum, const char* unit, KValueCurve curve)
      : minimum_(minimum), maximum_(maximum), unit_(unit), curve_(curve) {}
  KValueKind(const KValueKind&) = delete;
  KValueKind& operator=(const KValueKind&) = delete;
  virtual ~KValueKind() = default;

  double Minimum() const noexcept { return minimum_; }
  double Maximum() const noexcept { return maximum_; }
  KString Unit() const noexcept { return KString::Static(unit_); }
  KValueCurve Curve() const noexcept { return curve_; }
  // Number of discrete steps above the first value (0: continuous), as hosts count them.
  int32_t Steps() const noexcept {
    return curve_ == KValueCurve::kWhole ? static_cast<int32_t>(maximum_ - minimum_) : 0;
  }

  // Both directions clamp: no input puts a value outside the kind's range.
  double ToWorking(double normalized) const noexcept;
  double ToNormalized(double working) const noexcept;
  virtual KString ToText(double working) const = 0;
  // Accepts what ToText writes and what a user would type (with or without the unit).
  // False when the text is not a value of this kind; `working` is then unchanged.
  virtual bool FromText(const KString& text, double& working) const = 0;
  // The name a control shows for a parameter of this kind when it follows what the parameter
  // stands for at the moment (a pipeline slot shows its module's parameter); false keeps the
  // table's name. User-interface thread.
  virtual bool CurrentName(KString& /*name*/) const { return false; }

protected:
  double Clamp(double working) const noexcept;

  double minimum_;
  double maximum_;
  const char* unit_;
  KValueCurve curve_;
};

// A number shown with a format pattern such as "{0.2}", on any curve.
class TORVANE_API KNumberKind : public KValueKind {
public:
  constexpr KNumberKind(double minimum, double maximum, const char* unit, const char* pattern,
                        KValueCurve curve = KValueCurve::kLinear)
      : KValueKind(minimum, maximum, unit, curve), pattern_(pattern) {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;

private:
  const char* pattern_;
};

// Gain in decibels, linear in dB across the range, one decimal.
class TORVANE_API KDecibelKind : public KNumberKind {
public:
  constexpr KDecibelKind(double minimum, double maximum) : KNumberKind(minimum, maximum, "dB", "{0.1}") {}
};

// A ratio shown as "<r> : 1", on the square curve. "4", "4:1" and "4 : 1" are all understood.
class TORVANE_API KRatioKind : public KValueKind {
public:
  constexpr KRatioKind(double minimum, double maximum) : KValueKind(minimum, maximum, "", KValueCurve::kSquare) {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// Time in seconds on the cube curve, so that short times get resolution. Shown in milliseconds.
class TORVANE_API KTimeKind : public KValueKind {
public:
  constexpr KTimeKind(double minimum, double maximum) : KValueKind(minimum, maximum, "ms", KValueCurve::kCube) {}
  KString ToText(double working) const override;
  // "12", "12 ms" and "0.5 s" are all understood.
  bool FromText(const KString& text, double& working) const override;
};

// Frequency in Hz on the logarithmic curve (equal travel per octave); "1.5k", "1.5 kHz" and
// "1500 Hz" are all understood.
class TORVANE_API KFrequencyKind : public KValueKind {
public:
  constexpr KFrequencyKind(double minimum, double maximum)
      : KValueKind(minimum, maximum, "Hz", KValueCurve::kLogarithmic) {}
  KString ToText(double working) const override;
  bool FromText(const KString& text, double& working) const override;
};

// Whole numbers from minimum to maximum.
class TORVANE_API KIntegerKind : public KValueKind {
public:
  constexpr KIntegerKind(int32_t minimum, int32_t maximum, const char* unit = "")
      : KValueKind(minimum, maximum, unit, KValueCurve::kWhole) {}
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
class TORVANE_API KBalanceKind : public KNumberKind {
public:
  constexpr KBalanceKind() : KNumberKind(-100.0, 100.0, "", "{0.0}") {}
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
