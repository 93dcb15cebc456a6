// Value kinds, one row per kind: normalised <-> working (skew, steps, clamping), working <-> text.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "core/KValueKind.h"

namespace {
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN(), kInfinity = std::numeric_limits<double>::infinity();
constexpr const char* kDetectorNames[] = {"Peak", "RMS", "Envelope"};

std::string Text(const KValueKind& kind, double working) { return kind.ToText(working).ToUtf8(); }

struct KKindRow {
  const KValueKind& kind;
  const char* unit;
  int32_t steps;
  std::vector<std::pair<double, double>> curve;         // normalised, working
  std::vector<std::pair<double, const char*>> written;  // working, its text
  std::vector<std::pair<const char*, double>> read;     // texts apart by '|', their working value
  const char* rejected;                                 // texts apart by '|' (the first may be empty)
};

const KKindRow kRows[] = {
    {KNumberKind(0.0, 200.0, "%", "{0.1}"), "%", 0, {{0.5, 100.0}}, {{12.345, "12.3"}}, {{"50|50%|50 %", 50.0}}, "50 dB|% 50"},
    // Any curve with a number's text: a logarithmic Q, a squared fader in decibels.
    {KNumberKind(0.1, 20.0, "", "{0.2}", KValueCurve::kLogarithmic), "", 0, {{0.5, std::sqrt(2.0)}, {0.0, 0.1}}, {{0.71, "0.71"}},
     {{"0.71| 0.71 ", 0.71}}, "Q|0.71 Hz"},
    {KNumberKind(-60.0, 0.0, "dB", "{0.1}", KValueCurve::kSquare), "dB", 0, {{0.5, -45.0}}, {{-6.0, "-6.0"}}, {{"-6|-6 dB", -6.0}}, "-6 Hz"},
    {KDecibelKind(-60.0, 24.0), "dB", 0, {{0.5, -18.0}}, {{-6.0, "-6.0"}, {-0.04, "0.0"}},
     {{"-6|-6.0|-6 dB|-6dB|  -6 db |-6e0", -6.0}, {"+3|3", 3.0}, {"100", 24.0}}, "| |abc|-6 Hz|-6 dBs|+-6|--6|nan|inf|dB"},
    {KRatioKind(1.0, 21.0), "", 0, {{0.5, 6.0}}, {{4.0, "4.00 : 1"}, {1.5, "1.50 : 1"}},  // quadratic
     {{"4|4:1|4 : 1|4.00 : 1|4 :1| 4: 1 ", 4.0}}, "4:2|4 :|4 : 1 : 1|: 1|four|4 x 1"},
    {KTimeKind(0.0, 2.0), "ms", 0, {{0.5, 0.25}, {0.1, 0.002}}, {{0.005, "5.00"}, {0.0123, "12.3"}, {0.25, "250"}, {1.5, "1500"}},
     {{"5|5 ms|5ms|5 MS|0.005 s|0.005s|0.005 S", 0.005}, {"1.5 s|1500", 1.5}, {"-5", 0.0}}, "5 min|5 sec|5 m|ms|s"},
    {KFrequencyKind(20.0, 20000.0), "Hz", 0, {{0.5, std::sqrt(20.0 * 20000.0)}, {1.0 / 3.0, 200.0}}, {{1000.0, "1000"}, {63.4, "63.4"}},
     {{"1k|1K|1 kHz|1000|1000 Hz|1000hz", 1000.0}, {"1.5k|1.5 kHz|1500 Hz|1.5 k Hz", 1500.0}, {"100k", 20000.0}}, "1.5 kg|1 MHz|k|Hz|1 kk"},
    {KIntegerKind(1, 16, "voices"), "voices", 15, {{0.5, 9.0}}, {{4.4, "4"}, {4.6, "5"}},
     {{"4|4.0|4 voices|4 Voices", 4.0}, {"99", 16.0}}, "4.5|4 notes|four"},
    {KListKind(kDetectorNames), "", 2, {{0.74, 1.0}, {0.76, 2.0}}, {{1.0, "RMS"}, {1.4, "RMS"}, {0.0, "Peak"}},
     {{"rms|RMS| Rms |1", 1.0}, {"ENVELOPE|2", 2.0}, {"peak|0", 0.0}}, "|3|-1|1.5|Pea|Peaks"},
    {KSwitchKind(), "", 1, {{0.49, 0.0}, {0.51, 1.0}}, {{0.0, "Off"}, {1.0, "On"}},
     {{"on|ON|true|True|yes|YES|1", 1.0}, {"off|Off|false|FALSE|no|No|0", 0.0}}, "2|-1|maybe|o|yess"},
    {KBalanceKind(), "", 0, {{0.35, -30.0}}, {{0.0, "C"}, {-0.4, "C"}, {-30.0, "30 L"}, {30.0, "30 R"}, {150.0, "100 R"}},
     {{"C|c|centre|Center|0|0 L", 0.0}, {"30 L|30L|L30|-30|-30 %", -30.0}, {"30 R|R 30|30r|30|+30", 30.0}}, "-30 L|L|R|30 LR|X30|30 dB"},
};

}  // namespace

TEST(KValueKind, NormalizedValuesFollowTheCurveRoundTripAndAreClamped) {
  for (const KKindRow& row : kRows) {
    const KValueKind& kind = row.kind;
    const double low = kind.Minimum(), high = kind.Maximum();
    SCOPED_TRACE(Text(kind, high));
    EXPECT_EQ(kind.Steps(), row.steps);
    EXPECT_EQ(kind.Unit().ToUtf8(), row.unit);
    for (const auto& [normalized, working] : row.curve) {
      EXPECT_NEAR(kind.ToWorking(normalized), working, 1e-12 * (1.0 + std::fabs(working))) << normalized;
      EXPECT_NEAR(kind.ToNormalized(working), row.steps ? std::round(normalized * row.steps) / row.steps : normalized, 1e-12);
    }
    for (double n : {0.0, 0.1, 0.25, 0.5, 0.7, 0.9, 1.0}) {
      const double onGrid = row.steps > 0 ? std::round(n * row.steps) / row.steps : n;  // steps hold no other
      EXPECT_NEAR(kind.ToNormalized(kind.ToWorking(onGrid)), onGrid, 1e-12) << onGrid;
    }
    for (double below : {0.0, -0.5, -kInfinity, kNaN}) EXPECT_EQ(kind.ToWorking(below), low) << below;
    for (double above : {1.0, 1.5, kInfinity}) EXPECT_DOUBLE_EQ(kind.ToWorking(above), high) << above;
    EXPECT_EQ(std::pair(kind.ToNormalized(low - 1000.0), kind.ToNormalized(kNaN)), std::pair(0.0, 0.0));
    EXPECT_DOUBLE_EQ(kind.ToNormalized(high + 1000.0), 1.0);
    EXPECT_EQ(Text(kind, kNaN), Text(kind, low));
    EXPECT_EQ(Text(kind, high * 10.0 + 1.0), Text(kind, high));
  }
}

TEST(KValueKind, TextsBothWaysAndRejectedTextsLeaveTheValueAlone) {
  constexpr double kUntouched = 12345.678;
  for (const KKindRow& row : kRows) {
    SCOPED_TRACE(Text(row.kind, row.kind.Maximum()));
    for (const auto& [working, text] : row.written) {
      EXPECT_EQ(Text(row.kind, working), text) << working;
    }
    for (const auto& [texts, expected] : row.read) {
      std::istringstream stream(texts);
      for (std::string text; std::getline(stream, text, '|');) {
        double read = kUntouched;
        EXPECT_TRUE(row.kind.FromText(KString::FromUtf8(text), read)) << '"' << text << '"';
        EXPECT_NEAR(read, expected, 1e-12 * (1.0 + std::fabs(expected))) << '"' << text << '"';
      }
    }
    std::istringstream stream(row.rejected);
    for (std::string text; std::getline(stream, text, '|');) {
      double read = kUntouched;
      EXPECT_FALSE(row.kind.FromText(KString::FromUtf8(text), read)) << '"' << text << '"';
      EXPECT_EQ(read, kUntouched) << '"' << text << '"';
    }
  }
}
