#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <limits>
#include <string>

#include "kernel/KException.h"
#include "kernel/KFormat.h"

namespace {

template <class... Args>
std::string Format(const KString& pattern, const Args&... args) {
  return KFormatText(pattern, args...).ToUtf8();
}

std::string Printed(const char* format, int precision, double value) {
  char buffer[512];
  std::snprintf(buffer, sizeof(buffer), format, precision, value);
  return buffer;
}

}  // namespace

TEST(KFormat, BracesAndLiteralText) {
  EXPECT_EQ(KFormat("{{0}}").SlotCount(), 0);
  EXPECT_EQ(Format("{{0}}"), "{0}");
  EXPECT_EQ(Format("{{0}}{0}", KString("x")), "{0}x");  // the escaped one takes no argument
  EXPECT_EQ(Format("a}}b"), "a}b");
  EXPECT_EQ(Format("a}b"), "ab");
  EXPECT_EQ(Format("end}"), "end");
  EXPECT_EQ(Format("abc{{"), "abc{");
  EXPECT_EQ(KFormat("No placeholders.").Text().GetStorage(), KString::kLiteral);
}

TEST(KFormat, UnterminatedPlaceholderThrows) {
  for (const KString& pattern : {KString("abc{1"), KString("abc{"), KString("{0 5"), KString("x{0.")}) {
    try {
      KFormat format(pattern);
      ADD_FAILURE() << pattern.ToUtf8();
    } catch (const KException& e) {
      EXPECT_EQ(e.Message().ToUtf8(), "Formatting string ends in an argument specification.");
    }
  }
}

TEST(KFormat, WidthFillAndAlignment) {
  EXPECT_EQ(Format("{0 5}", 42), "   42");
  EXPECT_EQ(Format("{0 5}", -42), "  -42");
  EXPECT_EQ(Format("{0;05}", -42), "-0042");
  EXPECT_EQ(Format("{0 2}", 12345), "12345");
  const KFormat left("{0 -5}|");
  EXPECT_EQ(left.GetSlot(0).width, -5);
  EXPECT_EQ(left.GetSlot(0).fill, ' ');
  EXPECT_EQ(Format("{0 -5}|", 42), "42   |");
  EXPECT_EQ(Format("{0;0-5}|", 42), "42   |");  // left alignment never pads with zeros
  const KFormat zero("{0}:{1;02}");
  EXPECT_EQ(zero.GetSlot(1).fill, '0');
  EXPECT_EQ(zero.GetSlot(1).width, 2);
  EXPECT_EQ(Format("{0}:{1;02}", 7, 5), "7:05");
  EXPECT_EQ(KFormat("{1;5}").GetSlot(1).width, 0);  // a width follows only a blank or "0"
  EXPECT_EQ(Format("{0 5}", KString("ab")), "ab");   // texts go in as they are
}

TEST(KFormat, IntegersSignsAndHexadecimal) {
  EXPECT_EQ(Format("{0+}", 3), "+3");
  EXPECT_EQ(Format("{0+}", 0), "0");
  EXPECT_EQ(Format("{0+}", -3), "-3");
  EXPECT_EQ(Format("{0+}", uint64_t{0}), "0");
  EXPECT_EQ(Format("{0+}", uint64_t{5}), "+5");
  EXPECT_EQ(Format("{0x}", 255), "FF");
  EXPECT_EQ(Format("{0x}", -255), "-FF");
  EXPECT_EQ(Format("{0+x}", 160), "+A0");
  EXPECT_EQ(Format("{0;04x}", 10), "000A");
  EXPECT_EQ(Format("{0}", std::numeric_limits<uint64_t>::max()), "18446744073709551615");
  EXPECT_EQ(Format("{0x}", std::numeric_limits<uint64_t>::max()), "FFFFFFFFFFFFFFFF");
  EXPECT_EQ(Format("{0}", std::numeric_limits<int64_t>::min()), "-9223372036854775808");
  EXPECT_EQ(Format("{0x}", std::numeric_limits<int64_t>::min()), "-8000000000000000");
  EXPECT_EQ(Format("{0}", std::numeric_limits<int64_t>::max()), "9223372036854775807");
}

TEST(KFormat, FloatingPoint) {
  EXPECT_EQ(KFormat("{0.4}").GetSlot(0).precision, 4);
  EXPECT_EQ(Format("{0.4}", 0.5), "0.5000");
  EXPECT_EQ(Format("{0.2}", 2.675), "2.67");  // the double lies just below the tie
  EXPECT_EQ(Format("{0.0}", 2.5), "2");       // exact ties go to even
  EXPECT_EQ(Format("{0+.1}", 0.25), "+0.2");
  // Without a precision: at most six decimals, trailing zeros dropped, no "-0".
  EXPECT_EQ(Format("{0}", 0.5), "0.5");
  EXPECT_EQ(Format("{0}", 2.0), "2");
  EXPECT_EQ(Format("{0}", 1.0 / 3.0), "0.333333");
  EXPECT_EQ(Format("{0}", 2.0 / 3.0), "0.666667");
  EXPECT_EQ(Format("{0}", 0.1 + 0.2), "0.3");
  EXPECT_EQ(Format("{0}", 0.1f), "0.1");
  EXPECT_EQ(Format("{0}", -1.25), "-1.25");
  EXPECT_EQ(Format("{0}", 1e20), "100000000000000000000");
  EXPECT_EQ(Format("{0}", -0.0), "0");
  EXPECT_EQ(Format("{0}", -1e-9), "0");
  EXPECT_EQ(Format("{0.2}", -0.001), "0.00");
  EXPECT_EQ(Format("{0+.2}", 0.001), "0.00");
  EXPECT_EQ(Format("{0}", std::nan("")), "nan");
  EXPECT_EQ(Format("{0+}", std::nan("")), "nan");
  EXPECT_EQ(Format("{0}", HUGE_VAL), "inf");
  EXPECT_EQ(Format("{0+}", HUGE_VAL), "+inf");
  EXPECT_EQ(Format("{0 6}", -HUGE_VAL), "  -inf");

  // Correct rounding at every precision, up to the widest renderings there are.
  for (const double value : {DBL_MAX, -DBL_MAX, 123.456, 0.5, 1e-300, 5e-324, 9.9999995}) {
    for (const int precision : {0, 1, 2, 6, 7, 17, 99}) {
      const std::string pattern = "{0." + std::to_string(precision) + "}";
      EXPECT_EQ(Format(KString::FromUtf8(pattern), value), Printed("%.*f", precision, value)) << pattern << value;
    }
  }
  EXPECT_EQ(Format("{0}", DBL_MAX), Printed("%.*f", 0, DBL_MAX));
}

TEST(KFormat, PlaceholdersAtOnePositionComeOutInWrittenOrder) {
  const KFormat swapped("{1}{0}");
  EXPECT_EQ(swapped.GetSlot(0).position, 0u);
  EXPECT_EQ(swapped.GetSlot(1).position, 0u);
  EXPECT_EQ(swapped.GetSlot(1).before, 0);
  EXPECT_EQ(swapped.GetSlot(0).before, 1);
  EXPECT_EQ(Format("{1}{0}", KString("a"), KString("b")), "ba");
  EXPECT_EQ(Format("{2}{0}{1}", KString("a"), KString("b"), KString("c")), "cab");
  EXPECT_EQ(Format("x{0}y{1}z", 1, 2), "x1y2z");
  EXPECT_EQ(Format("{1}", KString("a"), KString("b")), "b");
  EXPECT_EQ(Format("{0}-{1}", KString("a")), "a-");  // a missing argument leaves nothing
}

TEST(KFormat, ThirtyTwoSlotsAndIndicesBeyond) {
  std::string pattern, expected;
  for (int i = 0; i < 32; ++i) {
    pattern += "{" + std::to_string(i) + "},";
    expected += std::to_string(i * 3) + ",";
  }
  KFormat format(KString::FromUtf8(pattern));
  EXPECT_EQ(format.SlotCount(), 32);
  for (int i = 0; i < 33; ++i) format.Arg(i * 3);  // the 33rd has no slot and is dropped
  EXPECT_EQ(format.Text().ToUtf8(), expected);

  const KFormat beyond("a{32}b{-1}c{0}");
  EXPECT_EQ(beyond.SlotCount(), 1);
  EXPECT_EQ(Format("a{32}b{-1}c{0}", KString("x")), "abcx");
}

TEST(KFormat, Utf16PatternsAndArguments) {
  const KString pattern = KString::FromUtf8("Gr\xC3\xB6\xC3\x9F" "e {0}: {1} \xE2\x82\xAC");
  EXPECT_EQ(Format(pattern, KString("x"), KString::FromUtf8("\xF0\x9F\x98\x80")),
            "Gr\xC3\xB6\xC3\x9F" "e x: \xF0\x9F\x98\x80 \xE2\x82\xAC");
  EXPECT_EQ(Format("Name: {0}.", KString::FromUtf8("K\xC3\xB6ln")), "Name: K\xC3\xB6ln.");

  // Literal text longer than the parser's staging buffer, with placeholders on both sides.
  const std::string head(255, 'h'), tail(300, 't');
  const KFormat split(KString::FromUtf8(head + "{0}" + tail + "\xC3\xBC{1}"));
  EXPECT_EQ(split.GetSlot(0).position, 255u);
  EXPECT_EQ(split.GetSlot(1).position, 556u);
  EXPECT_EQ(Format(KString::FromUtf8(head + "{0}" + tail + "\xC3\xBC{1}"), 1, 2), head + "1" + tail + "\xC3\xBC" "2");
}
