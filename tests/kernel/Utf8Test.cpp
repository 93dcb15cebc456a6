#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "kernel/KString.h"
#include "kernel/KUtf8.h"

static std::u16string UnitsOf(const KString& s) {
  std::u16string units(static_cast<size_t>(s.Length()), u'\0');
  s.CopyUtf16(units.data());
  return units;
}

TEST(KUtf8, RoundTripThroughEveryStorage) {
  // The first and last character of every encoded length, Latin-1, the euro sign and two non-BMP characters.
  const std::string text = "\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80\xEF\xBF\xBF\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"
                           " Gr\xC3\xB6\xC3\x9F" "e \xE2\x82\xAC \xF0\x9F\x98\x80 \xF0\x9D\x84\x9E";
  const std::u16string units = u"\x7F\x80\u07FF\u0800\uFFFF\U00010000\U0010FFFF Gr\u00F6\u00DFe \u20AC \U0001F600 \U0001D11E";
  EXPECT_EQ(UnitsOf(KString::FromUtf8(text)), units);
  EXPECT_EQ(KUtf8::CountUtf16Units(text.data(), text.size()), static_cast<int32_t>(units.size()));
  EXPECT_EQ(KString::FromUtf8(text).ToUtf8(), text);
  EXPECT_EQ(KStringT<16>::FromUtf8(text).ToUtf8(), text);  // on the heap
  EXPECT_EQ(KString::Static("caf\xE9").ToUtf8(), "caf\xC3\xA9");  // 8-bit texts are Latin-1
}

TEST(KUtf8, MalformedInputBecomesReplacement) {
  const std::pair<const char*, std::u16string> decoded[] = {
      {"\xC0\xAF", u"\uFFFD"}, {"\xE0\x80\xAF", u"\uFFFD"}, {"\xF0\x82\x82\xAC", u"\uFFFD"},  // overlong forms
      {"\xED\xA0\x80", u"\uFFFD"}, {"\xF4\x90\x80\x80", u"\uFFFD"},  // a surrogate code point; above U+10FFFF
      {"a\xE2\x82", u"a\uFFFD"}, {"\xF0\x9F\x98z", u"\uFFFDz"},        // truncated: the next character survives
      {"\x80z", u"\uFFFDz"}, {"\xFF\xFEz", u"\uFFFD\uFFFDz"},            // stray continuation; bytes never valid
  };
  for (const auto& [utf8, units] : decoded) {
    EXPECT_EQ(UnitsOf(KString::FromUtf8(utf8)), units) << utf8;
    EXPECT_EQ(KUtf8::CountUtf16Units(utf8, std::char_traits<char>::length(utf8)), static_cast<int32_t>(units.size())) << utf8;
  }
  const std::string r = "\xEF\xBF\xBD", smile = "\xF0\x9F\x98\x80";
  const std::pair<std::u16string, std::string> encoded[] = {
      {u"\xD83D", r}, {u"\xDE00", r}, {u"\xD83D" u"a", r + "a"}, {u"\xDE00\xD83D", r + r},  // lone or reversed
      {u"\xD83D\xD83D\xDE00", r + smile}, {u"\U0001F600\xD83D", smile + r},                // the second high one pairs
  };
  for (const auto& [units, utf8] : encoded)
    EXPECT_EQ(KString::FromUtf16(units.data(), static_cast<int32_t>(units.size())).ToUtf8(), utf8);
}
