#include <gtest/gtest.h>

#include <iterator>
#include <string>

#include "kernel/KString.h"
#include "kernel/KUtf8.h"

namespace {

std::u16string UnitsOf(const KString& s) {
  std::u16string units(static_cast<size_t>(s.Length()), u'\0');
  s.CopyUtf16(units.data());
  return units;
}

std::string Encoded(const std::u16string& units) {
  return KString::FromUtf16(units.data(), static_cast<int32_t>(units.size())).ToUtf8();
}

constexpr char kReplacement[] = "\xEF\xBF\xBD";

}  // namespace

TEST(KUtf8, RoundTripThroughKString) {
  // Boundaries of every encoded length, Latin-1, the euro sign and two non-BMP characters.
  const std::string text = "\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80\xEF\xBF\xBF\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"
                           " Gr\xC3\xB6\xC3\x9F" "e \xE2\x82\xAC \xF0\x9F\x98\x80 \xF0\x9D\x84\x9E";
  const std::u16string units = u"\x7F\x80\u07FF\u0800\uFFFF\U00010000\U0010FFFF Gr\u00F6\u00DFe \u20AC \U0001F600 \U0001D11E";
  const KString decoded = KString::FromUtf8(text);
  EXPECT_EQ(UnitsOf(decoded), units);
  EXPECT_EQ(KUtf8::CountUtf16Units(text.data(), text.size()), static_cast<int32_t>(units.size()));
  EXPECT_EQ(decoded.ToUtf8(), text);

  std::string longText;
  for (int i = 0; i < 20; ++i) longText += text;
  const KString heapText = KString::FromUtf8(longText);
  EXPECT_EQ(heapText.GetStorage(), KString::kHeap);
  EXPECT_EQ(heapText.ToUtf8(), longText);
  EXPECT_EQ(KStringT<16>::FromUtf8(text).ToUtf8(), text);
  EXPECT_EQ(KString::Static("caf\xE9").ToUtf8(), "caf\xC3\xA9");  // 8-bit texts are Latin-1
}

TEST(KUtf8, MalformedInputBecomesReplacement) {
  const struct {
    const char* utf8;
    std::u16string units;
  } cases[] = {
      {"\xC0\xAF", u"\uFFFD"},          // overlong "/"
      {"\xE0\x80\xAF", u"\uFFFD"},      // overlong "/" in three bytes
      {"\xF0\x82\x82\xAC", u"\uFFFD"},  // overlong euro sign in four bytes
      {"\xED\xA0\x80", u"\uFFFD"},      // the surrogate code point U+D800
      {"\xED\xBF\xBF", u"\uFFFD"},      // U+DFFF
      {"\xF4\x90\x80\x80", u"\uFFFD"},  // above U+10FFFF
      {"a\xE2\x82", u"a\uFFFD"},        // truncated at the end
      {"\xE2\x82z", u"\uFFFDz"},        // truncated: the next character survives
      {"\xF0\x9F\x98z", u"\uFFFDz"},
      {"\x80z", u"\uFFFDz"},  // stray continuation byte
      {"\xFF\xFEz", u"\uFFFD\uFFFDz"},
  };
  for (const auto& c : cases) {
    const std::string utf8 = c.utf8;
    EXPECT_EQ(UnitsOf(KString::FromUtf8(utf8)), c.units) << utf8;
    EXPECT_EQ(KUtf8::CountUtf16Units(utf8.data(), utf8.size()), static_cast<int32_t>(c.units.size())) << utf8;
  }
}

TEST(KUtf8, UnpairedSurrogatesEncodeAsReplacement) {
  const std::string r = kReplacement;
  EXPECT_EQ(Encoded(u"\xD83D"), r);
  EXPECT_EQ(Encoded(u"\xDE00"), r);
  EXPECT_EQ(Encoded(u"\xD83D" u"a"), r + "a");
  EXPECT_EQ(Encoded(u"\xDE00\xD83D"), r + r);                   // a pair in the wrong order
  EXPECT_EQ(Encoded(u"\xD83D\xD83D\xDE00"), r + "\xF0\x9F\x98\x80");  // the second high one pairs
  EXPECT_EQ(Encoded(u"\U0001F600\xD83D"), "\xF0\x9F\x98\x80" + r);
}

TEST(KUtf8, BoundedEncodingWritesWholeCharactersOnly) {
  const std::u16string units = u"a\u20AC\U0001F600b";  // 1 + 3 + 4 + 1 bytes
  const size_t expected[] = {0, 1, 1, 1, 4, 4, 4, 4, 8, 9, 9};
  for (size_t capacity = 0; capacity < std::size(expected); ++capacity) {
    char out[16] = {};
    EXPECT_EQ(KUtf8::EncodeInto(units.data(), static_cast<int32_t>(units.size()), out, capacity), expected[capacity])
        << capacity;
  }
  char out[16] = {};
  ASSERT_EQ(KUtf8::EncodeInto("caf\xE9!", 5, out, 4), 3u);  // the Latin-1 byte needs two
  EXPECT_EQ(std::string(out, 3), "caf");
  ASSERT_EQ(KUtf8::EncodeInto("caf\xE9!", 5, out, sizeof(out)), 6u);
  EXPECT_EQ(std::string(out, 6), "caf\xC3\xA9!");
}
