#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>

#include "kernel/KException.h"
#include "kernel/KFormat.h"

template <class... Args>
static std::string Format(const KString& pattern, const Args&... args) {
  return KFormatText(pattern, args...).ToUtf8();
}

TEST(KFormat, BracesWidthFillSignAndHexadecimal) {
  EXPECT_EQ(Format("{{0}}"), "{0}");
  EXPECT_EQ(Format("{{0}}{0}", KString("x")), "{0}x");  // the escaped one takes no argument
  EXPECT_EQ(Format("a}}b}c end}"), "a}bc end");         // "}" yields the character after it
  EXPECT_EQ(Format("{0 5}", 42), "   42");
  // Blanks go before the sign and zeros after it; a width follows only a blank or "0".
  EXPECT_EQ(Format("{0 5}|{1;05}|{2 2}|{3;5}|{4 5}", -42, -42, 12345, 7, KString("ab")), "  -42|-0042|12345|7|ab");
  EXPECT_EQ(Format("{0 -5}|{1;0-5}|", 42, 42), "42   |42   |");  // left alignment never pads with zeros
  EXPECT_EQ(Format("{0+} {1+} {2+} {3+}", 3, 0, -3, uint64_t{5}), "+3 0 -3 +5");
  EXPECT_EQ(Format("{0x} {1x} {2+x} {3;04x}", 255, -255, 160, 10), "FF -FF +A0 000A");
  EXPECT_EQ(Format("{0} {1x}", UINT64_MAX, UINT64_MAX), "18446744073709551615 FFFFFFFFFFFFFFFF");
  EXPECT_EQ(Format("{0} {1x}", INT64_MIN, INT64_MIN), "-9223372036854775808 -8000000000000000");
}

TEST(KFormat, PatternEndingInsideAPlaceholderThrows) {
  for (const KString& pattern : {KString("abc{1"), KString("abc{"), KString("{0 5"), KString("x{0.")}) {
    try {
      KFormat format(pattern);
      ADD_FAILURE() << pattern.ToUtf8();
    } catch (const KException& e) {
      EXPECT_EQ(e.Message().ToUtf8(), "Formatting string ends in an argument specification.");
    }
  }
}

TEST(KFormat, FloatingPoint) {
  EXPECT_EQ(Format("{0.4}", 0.5), "0.5000");
  // 2.675 lies just below the tie; exact ties go to even.
  EXPECT_EQ(Format("{0.2} {1.0} {2+.1}", 2.675, 2.5, 0.25), "2.67 2 +0.2");
  // Without a precision: at most six decimals, trailing zeros dropped, no "-0".
  EXPECT_EQ(Format("{0} {1} {2} {3} {4}", 0.5, 2.0, 1.0 / 3.0, 2.0 / 3.0, 0.1 + 0.2), "0.5 2 0.333333 0.666667 0.3");
  EXPECT_EQ(Format("{0} {1} {2}", 0.1f, -1.25, 1e20), "0.1 -1.25 100000000000000000000");
  EXPECT_EQ(Format("{0} {1} {2.2} {3+.2}", -0.0, -1e-9, -0.001, 0.001), "0 0 0.00 0.00");
  EXPECT_EQ(Format("{0} {1+} {2+} {3 6}", std::nan(""), std::nan(""), HUGE_VAL, -HUGE_VAL), "nan nan +inf   -inf");
  // Correctly rounded at every precision, up to the widest rendering there is (DBL_MAX, 99 decimals).
  char printed[512];
  for (const double value : {DBL_MAX, -DBL_MAX, 123.456, 1e-300, 5e-324, 9.9999995}) {
    for (const int precision : {0, 1, 2, 7, 17, 99}) {
      const std::string pattern = std::string("{0.").append(std::to_string(precision)).append("}");
      std::snprintf(printed, sizeof(printed), "%.*f", precision, value);
      EXPECT_EQ(Format(KString::FromUtf8(pattern), value), printed) << pattern << " " << value;
    }
  }
  std::snprintf(printed, sizeof(printed), "%.0f", DBL_MAX);
  EXPECT_EQ(Format("{0}", DBL_MAX), printed);
}

TEST(KFormat, PlaceholdersAtOnePositionComeOutInWrittenOrder) {
  EXPECT_EQ(Format("{2}{0}{1}", KString("a"), KString("b"), KString("c")), "cab");
  EXPECT_EQ(Format("{0}-{1}", KString("a")), "a-");  // a missing argument leaves nothing
  EXPECT_EQ(Format("a{32}b{-1}c{0}", KString("x")), "abcx");  // indices beyond the 32 slots produce nothing
  std::string pattern, expected;
  for (int i = 0; i < 32; ++i) {
    pattern.append("{").append(std::to_string(i)).append("},");
    expected += std::to_string(i * 3) + ",";
  }
  KFormat format(KString::FromUtf8(pattern));
  for (int i = 0; i < 33; ++i) format.Arg(i * 3);  // the 33rd has no slot and is dropped
  EXPECT_EQ(format.Text().ToUtf8(), expected);
  // UTF-16 text, and literal text longer than the parser's staging buffer on both sides of a placeholder.
  EXPECT_EQ(Format(KString::FromUtf8("Gr\xC3\xB6\xC3\x9F" "e {0} \xE2\x82\xAC"), KString::FromUtf8("\xF0\x9F\x98\x80")),
            "Gr\xC3\xB6\xC3\x9F" "e \xF0\x9F\x98\x80 \xE2\x82\xAC");
  const std::string head(255, 'h'), tail(300, 't');
  EXPECT_EQ(Format(KString::FromUtf8(head + "{0}" + tail + "}}\xC3\xBC{1}"), 1, 2), head + "1" + tail + "}\xC3\xBC" "2");
}
