#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ui/KMarkupTokenizer.h"

namespace {

// Writes what the tokeniser hands over as one line per call: "T:text", "<name a=v>", "</name>".
class Transcript final : public KMarkupTokenizer {
public:
  std::vector<std::string> lines;

protected:
  void HandleText(const KString& text) override { lines.push_back("T:" + text.ToUtf8()); }
  void HandleTag(const KString& name, const KMarkupAttributes& attributes, bool closing) override {
    std::string line = (closing ? "</" : "<") + name.ToUtf8();
    for (const KMarkupAttribute& a : attributes) line += " " + a.name.ToUtf8() + "=" + a.value.ToUtf8();
    lines.push_back(line + ">");
  }
};

std::vector<std::string> Read(const KString& text) {
  Transcript t;
  t.Tokenize(text);
  return t.lines;
}
std::vector<std::string> Read(const char* utf8) { return Read(KString::FromUtf8(utf8)); }
using Lines = std::vector<std::string>;

TEST(MarkupTokenizer, TagsAttributesAndQuotedValues) {
  EXPECT_EQ(Read("a<center invert=1 singleline=1><l2>Title</l2>b"),
            (Lines{"T:a", "<center invert=1 singleline=1>", "<l2>", "T:Title", "</l2>", "T:b"}));
  EXPECT_EQ(Read("<td width=20 border=1 borderalpha=0 fill=\"FF0000\">"), (Lines{"<td width=20 border=1 borderalpha=0 fill=FF0000>"}));
  // Quoted values keep blanks and ">"; single quotation marks serve as well; extra blanks between
  // attributes, and an attribute without a value.
  EXPECT_EQ(Read("<x a=\"b c>d\"   e='f g' flag>"), (Lines{"<x a=b c>d e=f g flag=>"}));
  EXPECT_EQ(Read("<td valign=center\tautosize=1\n>"), (Lines{"<td valign=center autosize=1>"}));
  // Names are case-sensitive and handed over as written.
  EXPECT_EQ(Read("<B>x</B>"), (Lines{"<B>", "T:x", "</B>"}));
  // The same from an 8-bit literal as from a UTF-16 text.
  EXPECT_EQ(Read(KString("<b>x</b>")), Read(KString::FromUtf8("<b>x</b>")));
}

TEST(MarkupTokenizer, ElementsWithoutContentAndLineBreaks) {
  // Every form of br is a line break in the text; it never reaches the tag handler.
  EXPECT_EQ(Read("a<br/>b<br />c<br>d"), (Lines{"T:a\nb\nc\nd"}));
  EXPECT_EQ(Read("a\r\nb\rc"), (Lines{"T:a\nb\nc"}));
  EXPECT_EQ(Read("<img number=0><img icon=randomize/>x"), (Lines{"<img number=0>", "<img icon=randomize>", "T:x"}));
  EXPECT_EQ(Read("<hline size=2 />"), (Lines{"<hline size=2>"}));
  EXPECT_EQ(Read("<td width=25%/>"), (Lines{"<td width=25%>"}));
}

TEST(MarkupTokenizer, LessThanThatBeginsNoTagIsText) {
  EXPECT_EQ(Read("a < b and c<d"), (Lines{"T:a < b and c<d"}));  // no name after "<", no ">" after "<d"
  EXPECT_EQ(Read("1<2 > 0"), (Lines{"T:1<2 > 0"}));
  EXPECT_EQ(Read("x<!-- note -->y"), (Lines{"T:x<!-- note -->y"}));
  EXPECT_EQ(Read("<b x=\"unterminated>text"), (Lines{"T:<b x=\"unterminated>text"}));
  EXPECT_EQ(Read("a > b"), (Lines{"T:a > b"}));
  EXPECT_EQ(Read("</>"), (Lines{"T:</>"}));
  // A tag longer than the limit is text, so that unfinished tags cost linear time.
  const std::string longTag = "<b a=" + std::string(2000, 'x') + ">";
  EXPECT_EQ(Read(longTag.c_str()), (Lines{"T:" + longTag}));
}

TEST(MarkupTokenizer, Entities) {
  EXPECT_EQ(Read("&lt;b&gt; &amp; &quot;&apos;&nbsp;"), (Lines{"T:<b> & \"'\u00A0"}));
  EXPECT_EQ(Read("&#65;&#x42;&#x1F600;&#0;&#xD800;&#99999999;"), (Lines{"T:AB\U0001F600\uFFFD\uFFFD\uFFFD"}));
  // Anything else beginning with "&" stays as written.
  EXPECT_EQ(Read("R&D &unknown; & ;&#x; &#12a; &lt"), (Lines{"T:R&D &unknown; & ;&#x; &#12a; &lt"}));
  EXPECT_EQ(Read("<c color=\"&#70;F0000\">"), (Lines{"<c color=FF0000>"}));
  // An escaped tag is text, not a tag.
  EXPECT_EQ(Read("&lt;script&gt;"), (Lines{"T:<script>"}));
}

}  // namespace
