#include "core/KValueKind.h"

#include <cctype>
#include <charconv>
#include <cmath>
#include <string>
#include <string_view>

#include "kernel/KFormat.h"

namespace {

// NaN counts as the bottom of the range: a host's garbage never becomes a garbage value.
double Clamp01(double v) noexcept { return v > 0.0 ? (v < 1.0 ? v : 1.0) : 0.0; }

std::string_view Trimmed(std::string_view s) noexcept {
  const size_t first = s.find_first_not_of(" \t");
  if (first == std::string_view::npos) return {};
  return s.substr(first, s.find_last_not_of(" \t") - first + 1);
}

bool EqualsIgnoringCase(std::string_view a, std::string_view b) noexcept {
  if (a.size() != b.size()) return false;
  for (size_t i = 0; i < a.size(); ++i) {
    if (std::tolower(static_cast<unsigned char>(a[i])) != std::tolower(static_cast<unsigned char>(b[i]))) return false;
  }
  return true;
}

// Parses a leading decimal number (one optional sign, point, exponent) and answers the rest,
// trimmed. Infinities and NaN are not numbers a user means.
bool ParseNumber(std::string_view text, double& value, std::string_view& rest) noexcept {
  const std::string_view s = Trimmed(text);
  const char* begin = s.data();
  const char* end = s.data() + s.size();
  if (begin != end && *begin == '+') {  // from_chars takes no plus sign
    ++begin;
    if (begin != end && *begin == '-') return false;
  }
  const auto result = std::from_chars(begin, end, value);
  if (result.ec != std::errc() || !std::isfinite(value)) return false;
  rest = Trimmed(std::string_view(result.ptr, static_cast<size_t>(end - result.ptr)));
  return true;
}

// A number, then nothing or the kind's unit (in any letter case).
bool ParseWithUnit(const KString& text, const KString& unit, double& value) {
  const std::string s = text.ToUtf8();
  std::string_view rest;
  return ParseNumber(s, value, rest) && (rest.empty() || EqualsIgnoringCase(rest, unit.ToUtf8()));
}

}  // namespace

double KValueKind::Clamp(double working) const noexcept {
  return working > minimum_ ? (working < maximum_ ? working : maximum_) : minimum_;
}

// ---- curves
double KValueKind::ToWorking(double normalized) const noexcept {
  const double n = Clamp01(normalized), span = maximum_ - minimum_;
  switch (curve_) {
    case KValueCurve::kSquare: return minimum_ + span * n * n;
    case KValueCurve::kCube: return minimum_ + span * n * n * n;
    case KValueCurve::kLogarithmic: return minimum_ * std::pow(maximum_ / minimum_, n);
    case KValueCurve::kWhole: return minimum_ + std::round(n * span);
    case KValueCurve::kLinear: break;
  }
  return minimum_ + span * n;
}
double KValueKind::ToNormalized(double working) const noexcept {
  if (!(maximum_ > minimum_)) return 0.0;
  const double w = Clamp(working), span = maximum_ - minimum_;
  switch (curve_) {
    case KValueCurve::kSquare: return std::sqrt((w - minimum_) / span);
    case KValueCurve::kCube: return std::cbrt((w - minimum_) / span);
    case KValueCurve::kLogarithmic: return std::log(w / minimum_) / std::log(maximum_ / minimum_);
    case KValueCurve::kWhole: return (std::round(w) - minimum_) / span;
    case KValueCurve::kLinear: break;
  }
  return (w - minimum_) / span;
}

// ---- number
KString KNumberKind::ToText(double working) const { return KFormatText(KString::Static(pattern_), Clamp(working)); }
bool KNumberKind::FromText(const KString& text, double& working) const {
  double value;
  if (!ParseWithUnit(text, Unit(), value)) return false;
  working = Clamp(value);
  return true;
}

// ---- ratio
KString KRatioKind::ToText(double working) const { return KFormatText("{0.2} : 1", Clamp(working)); }
bool KRatioKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  double value;
  std::string_view rest;
  if (!ParseNumber(s, value, rest)) return false;
  if (!rest.empty()) {  // ": 1", however spaced
    if (rest[0] != ':' || Trimmed(rest.substr(1)) != "1") return false;
  }
  working = Clamp(value);
  return true;
}

// ---- time
KString KTimeKind::ToText(double working) const {
  const double ms = Clamp(working) * 1000.0;
  const KString pattern = ms < 10.0 ? KString("{0.2}") : (ms < 100.0 ? KString("{0.1}") : KString("{0.0}"));
  return KFormatText(pattern, ms);
}
bool KTimeKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  double value;
  std::string_view unit;
  if (!ParseNumber(s, value, unit)) return false;
  if (unit.empty() || EqualsIgnoringCase(unit, "ms")) value /= 1000.0;
  else if (!EqualsIgnoringCase(unit, "s")) return false;
  working = Clamp(value);
  return true;
}

// ---- frequency
KString KFrequencyKind::ToText(double working) const {
  const double hz = Clamp(working);
  return KFormatText(hz < 100.0 ? KString("{0.1}") : KString("{0.0}"), hz);
}
bool KFrequencyKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  double value;
  std::string_view unit;
  if (!ParseNumber(s, value, unit)) return false;
  if (!unit.empty() && (unit[0] == 'k' || unit[0] == 'K')) {
    value *= 1000.0;
    unit = Trimmed(unit.substr(1));
  }
  if (!unit.empty() && !EqualsIgnoringCase(unit, "Hz")) return false;
  working = Clamp(value);
  return true;
}

// ---- integer
KString KIntegerKind::ToText(double working) const {
  return KFormatText("{0}", static_cast<int64_t>(std::round(Clamp(working))));
}
bool KIntegerKind::FromText(const KString& text, double& working) const {
  double value;
  if (!ParseWithUnit(text, Unit(), value) || value != std::round(value)) return false;
  working = Clamp(value);
  return true;
}

// ---- list
KString KListKind::ToText(double working) const {
  return KString::Static(names_[static_cast<size_t>(std::round(Clamp(working)))]);
}
bool KListKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  const std::string_view wanted = Trimmed(s);
  for (size_t i = 0; i < names_.size(); ++i) {
    if (EqualsIgnoringCase(wanted, names_[i])) {
      working = static_cast<double>(i);
      return true;
    }
  }
  double index;
  if (!ParseWithUnit(text, Unit(), index) || index != std::round(index) || index < minimum_ || index > maximum_)
    return false;
  working = index;
  return true;
}

// ---- balance
KString KBalanceKind::ToText(double working) const {
  const double percent = std::round(Clamp(working));
  if (percent == 0.0) return KString("C");
  KString text = KNumberKind::ToText(std::fabs(percent));
  text.Append(percent < 0.0 ? KString(" L") : KString(" R"));
  return text;
}
bool KBalanceKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  std::string_view number = Trimmed(s);
  if (EqualsIgnoringCase(number, "C") || EqualsIgnoringCase(number, "centre") || EqualsIgnoringCase(number, "center"))
    return (working = 0.0, true);
  auto sideOf = [](char c) { return c == 'L' || c == 'l' ? -1.0 : (c == 'R' || c == 'r' ? 1.0 : 0.0); };
  double side = 0.0;  // 0: a signed number of its own
  if (!number.empty() && (side = sideOf(number.front())) != 0.0) number.remove_prefix(1);
  else if (!number.empty() && (side = sideOf(number.back())) != 0.0) number.remove_suffix(1);
  double value;
  std::string_view rest;
  if (!ParseNumber(number, value, rest) || !(rest.empty() || rest == "%")) return false;
  if (side != 0.0) {
    if (value < 0.0) return false;  // "-30 L" names no side
    value *= side;
  }
  working = Clamp(value);
  return true;
}

// ---- switch
bool KSwitchKind::FromText(const KString& text, double& working) const {
  const std::string s = text.ToUtf8();
  const std::string_view wanted = Trimmed(s);
  for (const char* no : {"false", "no"})
    if (EqualsIgnoringCase(wanted, no)) return (working = 0.0, true);
  for (const char* yes : {"true", "yes"})
    if (EqualsIgnoringCase(wanted, yes)) return (working = 1.0, true);
  return KListKind::FromText(text, working);
}
