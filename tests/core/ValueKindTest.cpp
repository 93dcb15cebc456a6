// Value kinds: normalised <-> working <-> text, clamping, skews and steps.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "core/KValueKind.h"

namespace {
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kUntouched = 12345.678;

const KLinearKind kPercent(0.0, 200.0, "%", "{0.1}");
const KDecibelKind kGain(-60.0, 24.0);
const KRatioKind kRatio(1.0, 21.0);
const KTimeKind kTime(0.0, 2.0);
const KFrequencyKind kFrequency(20.0, 20000.0);
const KIntegerKind kVoices(1, 16, "voices");
constexpr const char* kDetectorNames[] = {"Peak", "RMS", "Envelope"};
const KListKind kDetector(kDetectorNames);
const KSwitchKind kSwitch;
const KBalanceKind kBalance;

struct NamedKind {
  const char* name;
  const KValueKind& kind;
  int32_t steps;
};
const NamedKind kAllKinds[] = {{"linear", kPercent, 0},  {"dB", kGain, 0},           {"ratio", kRatio, 0},
                               {"time", kTime, 0},       {"frequency", kFrequency, 0}, {"integer", kVoices, 15},
                               {"list", kDetector, 2},   {"switch", kSwitch, 1},     {"balance", kBalance, 0}};

std::string Text(const KValueKind& kind, double working) { return kind.ToText(working).ToUtf8(); }

// Parses over a sentinel: a rejected text must leave the working value untouched.
std::optional<double> Parse(const KValueKind& kind, const char* text) {
  double working = kUntouched;
  if (kind.FromText(KString::FromUtf8(text), working)) return working;
  EXPECT_EQ(working, kUntouched) << "rejected \"" << text << "\" but wrote a value";
  return std::nullopt;
}

void ExpectParses(const KValueKind& kind, const std::vector<const char*>& texts, double expected) {
  for (const char* text : texts) {
    const std::optional<double> value = Parse(kind, text);
    ASSERT_TRUE(value.has_value()) << "\"" << text << "\"";
    EXPECT_NEAR(*value, expected, 1e-12 * (1.0 + std::fabs(expected))) << "\"" << text << "\"";
  }
}

void ExpectRejects(const KValueKind& kind, const std::vector<const char*>& texts) {
  for (const char* text : texts) EXPECT_FALSE(Parse(kind, text).has_value()) << "\"" << text << "\"";
}
}  // namespace

TEST(KValueKind, NormalizedRoundTripsAtTheEndsAndInside) {
  for (const NamedKind& k : kAllKinds) {
    SCOPED_TRACE(k.name);
    EXPECT_EQ(k.kind.ToWorking(0.0), k.kind.Minimum());
    EXPECT_DOUBLE_EQ(k.kind.ToWorking(1.0), k.kind.Maximum());
    const int32_t steps = k.steps;
    for (double n : {0.0, 0.1, 0.25, 0.5, 0.7, 0.9, 1.0}) {
      // A stepped kind only holds values on its steps.
      const double onGrid = steps > 0 ? std::round(n * steps) / steps : n;
      EXPECT_NEAR(k.kind.ToNormalized(k.kind.ToWorking(onGrid)), onGrid, 1e-12) << onGrid;
    }
  }
  // Working -> normalised -> working as well, where the skew is strongest.
  EXPECT_NEAR(kTime.ToWorking(kTime.ToNormalized(0.0005)), 0.0005, 1e-15);
  EXPECT_NEAR(kFrequency.ToWorking(kFrequency.ToNormalized(21.0)), 21.0, 1e-10);
  EXPECT_NEAR(kRatio.ToWorking(kRatio.ToNormalized(1.01)), 1.01, 1e-12);
}

TEST(KValueKind, EveryInputIsClampedAndNaNMeansTheBottom) {
  for (const NamedKind& k : kAllKinds) {
    SCOPED_TRACE(k.name);
    const double low = k.kind.Minimum(), high = k.kind.Maximum();
    EXPECT_EQ(k.kind.ToWorking(-0.5), low);
    EXPECT_DOUBLE_EQ(k.kind.ToWorking(1.5), high);
    EXPECT_EQ(k.kind.ToWorking(kNaN), low);
    EXPECT_EQ(k.kind.ToWorking(-kInfinity), low);
    EXPECT_DOUBLE_EQ(k.kind.ToWorking(kInfinity), high);
    EXPECT_EQ(k.kind.ToNormalized(low - 1000.0), 0.0);
    EXPECT_DOUBLE_EQ(k.kind.ToNormalized(high + 1000.0), 1.0);
    EXPECT_EQ(k.kind.ToNormalized(kNaN), 0.0);
    EXPECT_EQ(Text(k.kind, kNaN), Text(k.kind, low));
    EXPECT_EQ(Text(k.kind, high * 10.0 + 1.0), Text(k.kind, high));
  }
  // Typed values beyond the range land on its ends.
  EXPECT_EQ(Parse(kGain, "100"), 24.0);
  EXPECT_EQ(Parse(kFrequency, "100k"), 20000.0);
  EXPECT_EQ(Parse(kTime, "-5"), 0.0);
  EXPECT_EQ(Parse(kVoices, "99"), 16.0);
}

TEST(KValueKind, SkewsPutHalfTravelWhereDocumented) {
  EXPECT_DOUBLE_EQ(kPercent.ToWorking(0.5), 100.0);
  // Time is cubic: half travel is an eighth of the range, the first tenth covers a thousandth.
  EXPECT_DOUBLE_EQ(kTime.ToWorking(0.5), 0.25);
  EXPECT_DOUBLE_EQ(kTime.ToWorking(0.1), 0.002);
  EXPECT_NEAR(kTime.ToNormalized(0.005), std::cbrt(0.0025), 1e-12);
  // Frequency is logarithmic: half travel is the geometric mean, each decade a third.
  EXPECT_NEAR(kFrequency.ToWorking(0.5), std::sqrt(20.0 * 20000.0), 1e-9);
  EXPECT_NEAR(kFrequency.ToNormalized(200.0), 1.0 / 3.0, 1e-12);
  EXPECT_NEAR(kFrequency.ToNormalized(2000.0), 2.0 / 3.0, 1e-12);
  // Ratio is quadratic: half travel is a quarter of the range.
  EXPECT_DOUBLE_EQ(kRatio.ToWorking(0.5), 6.0);
}

TEST(KValueKind, StepsPerKind) {
  for (const NamedKind& k : kAllKinds) EXPECT_EQ(k.kind.Steps(), k.steps) << k.name;
  // Stepped kinds snap to the nearest step.
  EXPECT_EQ(kVoices.ToWorking(0.5), 9.0);  // 1 + round(7.5)
  EXPECT_EQ(kDetector.ToWorking(0.74), 1.0);
  EXPECT_EQ(kDetector.ToWorking(0.76), 2.0);
  EXPECT_EQ(kSwitch.ToWorking(0.49), 0.0);
  EXPECT_EQ(kSwitch.ToWorking(0.51), 1.0);
  EXPECT_EQ(kVoices.ToNormalized(4.4), 3.0 / 15.0);
}

TEST(KValueKind, LinearAndDecibelText) {
  EXPECT_EQ(Text(kGain, -6.0), "-6.0");
  EXPECT_EQ(Text(kGain, -0.04), "0.0");  // never "-0.0"
  EXPECT_EQ(Text(kPercent, 12.345), "12.3");
  EXPECT_EQ(kGain.Unit().ToUtf8(), "dB");
  ExpectParses(kGain, {"-6", "-6.0", "-6 dB", "-6dB", "  -6 db ", "-6e0"}, -6.0);
  ExpectParses(kGain, {"+3", "3"}, 3.0);
  ExpectParses(kPercent, {"50", "50%", "50 %"}, 50.0);
  ExpectRejects(kGain, {"", " ", "abc", "-6 Hz", "-6 dBs", "+-6", "--6", "nan", "inf", "-inf", "dB"});
  ExpectRejects(kPercent, {"50 dB", "% 50"});
  for (double value : {-60.0, -6.0, 0.0, 23.9}) EXPECT_EQ(Parse(kGain, Text(kGain, value).c_str()), value);
}

TEST(KValueKind, RatioText) {
  EXPECT_EQ(Text(kRatio, 4.0), "4.00 : 1");
  EXPECT_EQ(Text(kRatio, 1.5), "1.50 : 1");
  ExpectParses(kRatio, {"4", "4:1", "4 : 1", "4.00 : 1", "4 :1", " 4: 1 "}, 4.0);
  ExpectRejects(kRatio, {"4:2", "4 :", "4 : 1 : 1", ": 1", "four", "4 x 1"});
}

TEST(KValueKind, TimeTextIsInMilliseconds) {
  EXPECT_EQ(kTime.Unit().ToUtf8(), "ms");
  EXPECT_EQ(Text(kTime, 0.005), "5.00");
  EXPECT_EQ(Text(kTime, kTime.ToWorking(kTime.ToNormalized(0.005))), "5.00");
  EXPECT_EQ(Text(kTime, 0.0123), "12.3");
  EXPECT_EQ(Text(kTime, 0.25), "250");
  EXPECT_EQ(Text(kTime, 1.5), "1500");
  ExpectParses(kTime, {"5", "5 ms", "5ms", "5 MS", "0.005 s", "0.005s", "0.005 S"}, 0.005);
  ExpectParses(kTime, {"1.5 s", "1500"}, 1.5);
  ExpectRejects(kTime, {"5 min", "5 sec", "5 m", "ms", "s"});
}

TEST(KValueKind, FrequencyTextUnderstandsKilohertz) {
  EXPECT_EQ(kFrequency.Unit().ToUtf8(), "Hz");
  EXPECT_EQ(Text(kFrequency, 1000.0), "1000");
  EXPECT_EQ(Text(kFrequency, 63.4), "63.4");
  ExpectParses(kFrequency, {"1k", "1K", "1 k", "1 kHz", "1000", "1000 Hz", "1000hz"}, 1000.0);
  ExpectParses(kFrequency, {"1.5k", "1.5 kHz", "1500 Hz", "1.5 k Hz"}, 1500.0);
  ExpectRejects(kFrequency, {"1.5 kg", "1 MHz", "k", "Hz", "1 kk"});
}

TEST(KValueKind, IntegerText) {
  EXPECT_EQ(Text(kVoices, 4.4), "4");
  EXPECT_EQ(Text(kVoices, 4.6), "5");
  ExpectParses(kVoices, {"4", "4.0", "4 voices", "4 Voices"}, 4.0);
  ExpectRejects(kVoices, {"4.5", "4 notes", "four"});
}

TEST(KValueKind, ListByNameIgnoringCaseOrByIndex) {
  EXPECT_EQ(Text(kDetector, 1.0), "RMS");
  EXPECT_EQ(Text(kDetector, 1.4), "RMS");
  EXPECT_EQ(Text(kDetector, 0.0), "Peak");
  ExpectParses(kDetector, {"rms", "RMS", " Rms ", "1"}, 1.0);
  ExpectParses(kDetector, {"ENVELOPE", "2"}, 2.0);
  ExpectParses(kDetector, {"peak", "0"}, 0.0);
  // An index outside the list is not one of its choices.
  ExpectRejects(kDetector, {"3", "-1", "1.5", "Pea", "Peaks", ""});
}

TEST(KValueKind, SwitchUnderstandsTheUsualWords) {
  EXPECT_EQ(Text(kSwitch, 0.0), "Off");
  EXPECT_EQ(Text(kSwitch, 1.0), "On");
  ExpectParses(kSwitch, {"on", "ON", "true", "True", "yes", "YES", "1"}, 1.0);
  ExpectParses(kSwitch, {"off", "Off", "false", "FALSE", "no", "No", "0"}, 0.0);
  ExpectRejects(kSwitch, {"2", "-1", "maybe", "o", "yess"});
}

TEST(KValueKind, BalanceNamesTheSide) {
  EXPECT_EQ(Text(kBalance, 0.0), "C");
  EXPECT_EQ(Text(kBalance, -0.4), "C");
  EXPECT_EQ(Text(kBalance, -30.0), "30 L");
  EXPECT_EQ(Text(kBalance, 30.0), "30 R");
  EXPECT_EQ(Text(kBalance, 150.0), "100 R");
  ExpectParses(kBalance, {"C", "c", "centre", "Center", "0", "0 L"}, 0.0);
  ExpectParses(kBalance, {"30 L", "30L", "L30", "l 30", "-30", "-30 %"}, -30.0);
  ExpectParses(kBalance, {"30 R", "R 30", "30r", "30", "+30"}, 30.0);
  ExpectRejects(kBalance, {"-30 L", "L", "R", "30 LR", "X30", "30 dB"});
  for (double value : {-100.0, -30.0, 0.0, 7.0, 100.0}) EXPECT_EQ(Parse(kBalance, Text(kBalance, value).c_str()), value);
}
