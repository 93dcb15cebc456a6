#include <gtest/gtest.h>

#include <random>
#include <string>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"

namespace {

// Random trees whose names and values draw on everything the text form must carry: markup
// characters, every control character, whitespace-only and leading-space texts, non-ASCII
// text and characters outside the Basic Multilingual Plane.
class KRandomTree {
public:
  KRandomTree(uint32_t seed, bool asciiNames) : random_(seed), asciiNames_(asciiNames) {}

  Element Make(int depth = 1) {
    Element element(Name());
    for (int n = Below(7); n > 0; --n) element.SetAttribute(Name(), Value());
    if (Below(3) == 0) element.SetText(Value(1));
    if (depth < 5)
      for (int n = Below(4); n > 0; --n) element.AddChild(Make(depth + 1));
    return element;
  }

private:
  int Below(int n) { return static_cast<int>(random_() % static_cast<uint32_t>(n)); }

  void AppendOneOf(std::u16string& out, const std::u16string& pool) {
    const char16_t c = pool[static_cast<size_t>(Below(static_cast<int>(pool.size())))];
    out += c;
    if (c >= 0xD800 && c <= 0xDBFF) out += static_cast<char16_t>(0xDC00 + Below(0x400));  // completes a pair
  }

  KString Name() {
    static const std::u16string start = u"abcXYZ_:", wide = u"\u00E9\u00DF\u0416\u4E2D\uFFFD\xD83C";
    static const std::u16string part = start + u"09-.";
    std::u16string name;
    AppendOneOf(name, asciiNames_ || Below(2) ? start : wide);
    for (int n = Below(6); n > 0; --n) AppendOneOf(name, asciiNames_ || Below(3) ? part : wide);
    return KString::FromUtf16(name.data(), static_cast<int32_t>(name.size()));
  }

  KString Value(int minimum = 0) {
    static const std::u16string pool = [] {
      std::u16string p = u"&<>\"';=/?!#[]-  \t\n\r\t  aZ9\u007F\u00A0\u00E9\u20AC\uFFFE\uFFFF\xD83D\xDBFF";
      for (char16_t c = 0; c < 0x20; ++c) p += c;
      return p;
    }();
    std::u16string value;
    for (int n = minimum + Below(10); n > 0; --n) AppendOneOf(value, pool);
    return KString::FromUtf16(value.data(), static_cast<int32_t>(value.size()));
  }

  std::mt19937 random_;
  const bool asciiNames_;
};

}  // namespace

TEST(KXMLRoundTrip, RandomTreesSurviveWriteReadWriteInBothLayouts) {
  for (uint32_t seed = 1; seed <= 1000; ++seed) {
    const Element tree = KRandomTree(seed, false).Make();
    const std::string compact = KXMLWriter::Write(tree, "utf-8", KXMLWriter::kCompact);
    for (const auto layout : {KXMLWriter::kIndented, KXMLWriter::kCompact}) {
      const std::string text = KXMLWriter::Write(tree, "utf-8", layout);
      const Element read = KXMLReader::Read(text);
      ASSERT_TRUE(read == tree) << "seed " << seed << ", layout " << layout << ":\n" << text;
      ASSERT_EQ(KXMLWriter::Write(read, "utf-8", layout), text) << "seed " << seed;
      ASSERT_EQ(KXMLWriter::Write(read, "utf-8", KXMLWriter::kCompact), compact) << "seed " << seed;
    }
  }
}

TEST(KXMLRoundTrip, AsciiOnlyEncodingCarriesEveryValueAsReferences) {
  for (uint32_t seed = 1; seed <= 300; ++seed) {
    const Element tree = KRandomTree(seed, true).Make();
    const std::string text = KXMLWriter::Write(tree, "us-ascii", KXMLWriter::kIndented);
    for (const char byte : text) ASSERT_LT(static_cast<unsigned char>(byte), 0x80) << "seed " << seed;
    ASSERT_TRUE(KXMLReader::Read(text) == tree) << "seed " << seed << ":\n" << text;
  }
}
