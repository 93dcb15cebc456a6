#include <gtest/gtest.h>

#include <random>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"

namespace {
// Random trees of markup characters, every control, whitespace-only and leading-space texts,
// non-ASCII and non-BMP characters (in names too, unless `asciiNames`).
class KRandomTree {
public:
  KRandomTree(uint32_t seed, bool asciiNames) : random_(seed), asciiNames_(asciiNames) {}

  Element Make(int depth = 1) {
    Element element(Name());
    for (int n = Below(7); n > 0; --n) element.SetAttribute(Name(), From(Draw(Value(), Below(10))));
    if (Below(3) == 0) element.SetText(From(Draw(Value(), 1 + Below(10))));
    for (int n = depth < 5 ? Below(4) : 0; n > 0; --n) element.AddChild(Make(depth + 1));
    return element;
  }

private:
  int Below(int n) { return static_cast<int>(random_() % static_cast<uint32_t>(n)); }
  // `count` characters of `pool`; a high surrogate is completed to a pair.
  std::u16string Draw(const std::u16string& pool, int count) {
    std::u16string text;
    while (count-- > 0) {
      text += pool[static_cast<size_t>(Below(static_cast<int>(pool.size())))];
      if (text.back() >= 0xD800 && text.back() <= 0xDBFF) text += static_cast<char16_t>(0xDC00 + Below(0x400));
    }
    return text;
  }
  static KString From(const std::u16string& text) { return KString::FromUtf16(text.data(), static_cast<int32_t>(text.size())); }
  // A character that may start a name, then up to five that may follow it.
  KString Name() {
    const std::u16string start = asciiNames_ || Below(2) ? u"abcXYZ_:" : u"\u00E9\u00DF\u0416\u4E2D\uFFFD\xD83C";
    return From(Draw(start, 1) + Draw(start + u"09-.", Below(6)));
  }
  static const std::u16string& Value() {
    static const std::u16string pool = [] {
      std::u16string p = u"&<>\"';=/?!#[]-  \t\n\r\t  aZ9\u007F\u00A0\u00E9\u20AC\uFFFE\uFFFF\xD83D\xDBFF";
      for (char16_t c = 0; c < 0x20; ++c) p += c;
      return p;
    }();
    return pool;
  }

  std::mt19937 random_;
  const bool asciiNames_;
};
}  // namespace

// Every tree reads back equal and writes again byte for byte, in both layouts; every third in ASCII.
TEST(KXMLRoundTrip, RandomTreesSurviveWriteReadWrite) {
  for (uint32_t seed = 1; seed <= 1500; ++seed) {
    const bool ascii = seed % 3 == 0;
    const KString encoding = ascii ? KString("us-ascii") : KString("utf-8");
    const Element tree = KRandomTree(seed, ascii).Make();
    for (const auto layout : {KXMLWriter::kIndented, KXMLWriter::kCompact}) {
      const std::string text = KXMLWriter::Write(tree, encoding, layout);
      const Element read = KXMLReader::Read(text);
      ASSERT_TRUE(read == tree) << "seed " << seed << ", layout " << layout << ":\n" << text;
      ASSERT_EQ(KXMLWriter::Write(read, encoding, layout), text) << "seed " << seed;
      for (const char byte : text) ASSERT_TRUE(!ascii || static_cast<unsigned char>(byte) < 0x80) << "seed " << seed;
    }
  }
}
