#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextRenderer.h"

namespace {

// A run as text with its format, for compact comparisons: "word/b1 c2 #FF0000FF".
struct RunView {
  std::string text;
  int32_t style;
  int32_t colourIndex;
  uint32_t colour;
  uint8_t opacity;
  bool inverted;
};

class Rendered {
public:
  explicit Rendered(const char* text, bool semantic = false) {
    if (semantic) renderer.Render(KHelpTexts::SemanticTagSets());
    renderer.Render(KString::FromUtf8(text));
  }
  const KRichTextBlock& Body() const { return renderer.Document().body; }
  std::vector<const KRichTextParagraph*> Paragraphs(const KRichTextBlock* block = nullptr) const {
    std::vector<const KRichTextParagraph*> out;
    for (const KRichTextItem& item : (block ? *block : Body()).items)
      if (const auto* p = std::get_if<KRichTextParagraph>(&item)) out.push_back(p);
    return out;
  }
  // The runs that hold text, in order over all paragraphs of the body.
  std::vector<RunView> Runs() const {
    std::vector<RunView> out;
    for (const KRichTextParagraph* p : Paragraphs())
      for (const KRichTextRun& r : p->runs)
        if (!r.text.IsEmpty())
          out.push_back({r.text.ToUtf8(), r.format.style, r.format.colourIndex, r.format.colour, r.format.opacity, r.format.inverted});
    return out;
  }
  RunView Run(const std::string& text) const {
    for (const RunView& r : Runs())
      if (r.text == text) return r;
    ADD_FAILURE() << "no run '" << text << "'";
    return {};
  }
  // One string per paragraph: its runs' texts joined by "|".
  std::vector<std::string> Lines() const {
    std::vector<std::string> out;
    for (const KRichTextParagraph* p : Paragraphs()) {
      std::string line;
      for (const KRichTextRun& r : p->runs) {
        if (r.text.IsEmpty()) continue;
        if (!line.empty()) line += "|";
        line += r.text.ToUtf8();
      }
      out.push_back(line);
    }
    return out;
  }

  KRichTextRenderer renderer;
};
using Lines = std::vector<std::string>;

// Records every tag the handler sees, replayed ones included.
class TagLog final : public KRichTextRenderer {
public:
  std::vector<std::string> tags;

protected:
  void HandleTag(const KString& name, const KMarkupAttributes& attributes, bool closing) override {
    tags.push_back((closing ? "/" : "") + name.ToUtf8());
    KRichTextRenderer::HandleTag(name, attributes, closing);
  }
};

TEST(RichTextRenderer, SurplusClosingTagsNeverRemoveTheBottomEntry) {
  const Rendered r("</b></b>word");
  EXPECT_EQ(r.Run("word").style, kStyleNormal);
  const Rendered again("<b></b></b><b>bold</b>plain");
  EXPECT_EQ(again.Run("bold").style, kStyleBold);
  EXPECT_EQ(again.Run("plain").style, kStyleNormal);
  const Rendered colours("</cred></c color=FF0000></alpha>text");
  EXPECT_EQ(colours.Run("text").colourIndex, kColourDefault);
  EXPECT_EQ(colours.Run("text").colour, 0u);
  EXPECT_EQ(colours.Run("text").opacity, 255);
}

TEST(RichTextRenderer, ClosingTagsPopTheirStackWhateverWasPushedLast) {
  const Rendered r("<b><i>both</b>after<cred><cgreen>g</cred>r");
  EXPECT_EQ(r.Run("after").style, kStyleBold);  // </b> removed the italic entry
  EXPECT_EQ(r.Run("g").colourIndex, kColourGreen);
  EXPECT_EQ(r.Run("r").colourIndex, kColourRed);
}

TEST(RichTextRenderer, ColourTagReadsSixOrEightDigits) {
  const Rendered r("<c color=FF000080>half</c color=x><c color=FF0000>opaque");
  EXPECT_EQ(r.Run("half").colour, 0x80FF0000u);
  EXPECT_EQ(r.Run("half").colourIndex, kColourDefault);
  EXPECT_EQ(r.Run("opaque").colour, 0xFFFF0000u);
  // Digits up to the first other character; an empty value is opaque black; eight characters
  // without leading digits give 0.
  EXPECT_EQ(KMarkupAttributes::ParseColour(KString("12GG56")), 0xFF000012u);
  EXPECT_EQ(KMarkupAttributes::ParseColour(KString("")), 0xFF000000u);
  EXPECT_EQ(KMarkupAttributes::ParseColour(KString("zzzzzzzz")), 0x00000000u);
  EXPECT_EQ(KMarkupAttributes::ParseColour(KString("00ff00")), 0xFF00FF00u);
  EXPECT_EQ(KMarkupAttributes::ParseColour(KString("123456789")), 0xFF456789u);  // nine: RRGGBB from the last six
}

TEST(RichTextRenderer, ClosingColourTagWithoutColourKeepsTheColour) {
  const Rendered r("<c color=00FF00>green</c>still green</c color=1>default");
  EXPECT_EQ(r.Run("still green").colour, 0xFF00FF00u);
  EXPECT_EQ(r.Run("default").colour, 0u);
  // Two colour attributes push twice, and a closing tag with two pops twice.
  const Rendered two("<c color=FF0000 color=0000FF>blue</c color=1>red</c color=1 color=2>none");
  EXPECT_EQ(two.Run("blue").colour, 0xFF0000FFu);
  EXPECT_EQ(two.Run("red").colour, 0xFFFF0000u);
  EXPECT_EQ(two.Run("none").colour, 0u);
}

TEST(RichTextRenderer, HeaderPutsBlankLinesAboveOnlyAfterAParagraphAndBelow) {
  const Rendered after("Intro<header1>Title</header1>Body");
  EXPECT_EQ(after.Lines(), (Lines{"Intro", "", "Title", "", "Body"}));
  EXPECT_EQ(after.Run("Title").style, kStyleLarge1);
  EXPECT_EQ(after.Run("Body").style, kStyleNormal);
  EXPECT_EQ(after.Paragraphs()[2]->heading, 1);
  EXPECT_EQ(after.Paragraphs()[4]->heading, 0);
  const Rendered first("<header2>Title</header2>Body");
  EXPECT_EQ(first.Lines(), (Lines{"Title", "", "Body"}));
  EXPECT_EQ(first.Run("Title").style, kStyleLarge2);
  EXPECT_EQ(first.Paragraphs()[0]->heading, 2);
  // A closed paragraph is no open paragraph: no blank line above.
  EXPECT_EQ(Rendered("Intro</p><header1>T</header1>").Lines(), (Lines{"Intro", "T", "", ""}));
}

TEST(RichTextRenderer, ParagraphKeepsTheAlignmentAndAlignmentTagsChangeIt) {
  const Rendered r("a<center>b<p>c<p>d<right>e<justify>f<p>g<left>h");
  std::vector<int32_t> alignments;
  for (const KRichTextParagraph* p : r.Paragraphs()) alignments.push_back(p->alignment);
  EXPECT_EQ(r.Lines(), (Lines{"a", "b", "c", "d", "e", "f", "g", "h"}));
  EXPECT_EQ(alignments, (std::vector<int32_t>{kParagraphLeft, kParagraphCenter, kParagraphCenter, kParagraphCenter, kParagraphRight, kParagraphJustify,
                                              kParagraphJustify, kParagraphLeft}));
  // "<p><p>" leaves a blank line; a closing paragraph tag makes the next text open a new one.
  EXPECT_EQ(Rendered("one<p><p>two</p>three").Lines(), (Lines{"one", "", "two", "three"}));
}

TEST(RichTextRenderer, ParagraphAttributes) {
  const Rendered r("<center invert=1 singleline=1 fillalpha=50 fill=112233><l2>Section</l2><left>text<p fillalpha=-50 invert=x>");
  const auto p = r.Paragraphs();
  ASSERT_EQ(p.size(), 3u);
  EXPECT_EQ(p[0]->alignment, kParagraphCenter);
  EXPECT_TRUE(p[0]->singleLine);
  EXPECT_TRUE(p[0]->background.invert);
  EXPECT_EQ(p[0]->background.fillAlpha, 0x50);
  EXPECT_EQ(p[0]->background.fill, 0xFF112233u);
  EXPECT_EQ(r.Run("Section").style, kStyleLarge2);
  EXPECT_EQ(p[1]->alignment, kParagraphLeft);
  EXPECT_FALSE(p[1]->singleLine);
  EXPECT_EQ(p[2]->background.fillAlpha, 0xB0);  // -0x50 as a byte
  EXPECT_FALSE(p[2]->background.invert);         // non-numeric reads as 0
}

TEST(RichTextRenderer, TagSetsAreRecordedAndReplayed) {
  TagLog r;
  r.Render(KString("<tagset name=warn><cred><b></tagset>x<warn>careful</warn>after"));
  EXPECT_EQ(r.tags, (std::vector<std::string>{"tagset", "cred", "b", "/tagset", "warn", "cred", "b", "/warn", "/b", "/cred"}));
  ASSERT_EQ(r.TagSets().size(), 1u);
  EXPECT_EQ(r.TagSets()[0].tags.size(), 2u);
  const auto& runs = std::get<KRichTextParagraph>(r.Document().body.items[0]).runs;
  ASSERT_GE(runs.size(), 3u);
  EXPECT_EQ(runs[1].text.ToUtf8(), "careful");
  EXPECT_EQ(runs[1].format.style, kStyleBold);
  EXPECT_EQ(runs[1].format.colourIndex, kColourRed);
  EXPECT_EQ(runs[1].format.tagSet.ToUtf8(), "warn");
  EXPECT_EQ(runs[2].text.ToUtf8(), "after");
  EXPECT_EQ(runs[2].format.style, kStyleNormal);
  EXPECT_EQ(runs[2].format.colourIndex, kColourDefault);
  EXPECT_TRUE(runs[2].format.tagSet.IsEmpty());
}

TEST(RichTextRenderer, TagSetReplayDetails) {
  // Closing replays only the opening tags, in reverse, with their attributes; every set of the
  // name is played, the last defined closed first.
  TagLog r;
  r.Render(KString("<tagset name=t><i></i><c color=0000FF></tagset><tagset name=t><b></tagset><t>x</t>"));
  EXPECT_EQ(std::vector<std::string>(r.tags.begin() + 8, r.tags.end()),
            (std::vector<std::string>{"t", "i", "/i", "c", "b", "/t", "/b", "/c", "/i"}));
  const Rendered rendered("<tagset name=t><i></i><c color=0000FF></tagset><tagset name=t><b></tagset><t>x</t>y");
  EXPECT_EQ(rendered.Run("x").colour, 0xFF0000FFu);
  EXPECT_EQ(rendered.Run("x").style, kStyleBold);
  EXPECT_EQ(rendered.Run("y").colour, 0u);
  // The semantic tags are such sets.
  const Rendered semantic("<control>Threshold</control> <example>loud</example> <name>n</name>", true);
  EXPECT_EQ(semantic.Run("Threshold").colour, 0xFF008800u);
  EXPECT_EQ(semantic.Run("Threshold").style, kStyleBold);
  EXPECT_EQ(semantic.Run("loud").style, kStyleItalic);
  EXPECT_EQ(semantic.Run("n").style, kStyleNormal);
}

TEST(RichTextRenderer, UnknownTagChangesNothing) {
  const Rendered r("a<foo x=1>b</foo>c<B>d");
  EXPECT_EQ(r.Lines(), (Lines{"abcd"}));  // one run: not even a format change
  EXPECT_EQ(r.Run("abcd").style, kStyleNormal);
}

TEST(RichTextRenderer, SpacerYieldsExactlyOneBlank) { EXPECT_EQ(Rendered("a<spacer>b<spacer></spacer>c").Lines(), (Lines{"a b c"})); }

TEST(RichTextRenderer, ConsecutiveFormatChangesLeaveOneEmptyRun) {
  const Rendered r("a<b><i><cred><alpha value=128>b</alpha></cred></i></b>");
  const auto& runs = r.Paragraphs()[0]->runs;
  ASSERT_EQ(runs.size(), 3u);
  EXPECT_EQ(runs[0].text.ToUtf8(), "a");
  EXPECT_EQ(runs[1].text.ToUtf8(), "b");
  EXPECT_EQ(runs[1].format.style, kStyleItalic);
  EXPECT_EQ(runs[1].format.colourIndex, kColourRed);
  EXPECT_EQ(runs[1].format.opacity, 128);
  EXPECT_TRUE(runs[2].text.IsEmpty());
  EXPECT_EQ(runs[2].format.style, kStyleNormal);
}

TEST(RichTextRenderer, InvertedRunsWhileCiIsOpen) {
  const Rendered r("<ci>a<ci>b</ci>c</ci>d");
  EXPECT_TRUE(r.Run("a").inverted);
  EXPECT_TRUE(r.Run("c").inverted);
  EXPECT_FALSE(r.Run("d").inverted);
}

TEST(RichTextRenderer, ImagesArePlaceholdersInTheLine) {
  const Rendered r("press <b><img icon=randomize width=20></b> now<img number=3 bitmap=knob align=center>");
  EXPECT_EQ(r.Lines(), (Lines{"press | | now| "}));
  const auto& runs = r.Paragraphs()[0]->runs;
  const auto& elements = r.renderer.Document().elements;
  ASSERT_EQ(elements.size(), 2u);
  EXPECT_EQ(elements[0].icon.ToUtf8(), "randomize");
  EXPECT_EQ(elements[0].width, (KMarkupSize{KMarkupSize::kPixels, 20}));
  EXPECT_EQ(elements[1].number, 3);
  EXPECT_EQ(elements[1].bitmap.ToUtf8(), "knob");
  EXPECT_EQ(elements[1].align.ToUtf8(), "center");
  int32_t images = 0;
  for (const KRichTextRun& run : runs) {
    if (run.element < 0) continue;
    EXPECT_EQ(run.text.ToUtf8(), " ");
    ++images;
  }
  EXPECT_EQ(images, 2);
  EXPECT_EQ(r.Run(" now").style, kStyleNormal);
}

TEST(RichTextRenderer, TablesRowsAndCells) {
  const Rendered r(
      "<tr padding=0 cellspaces=3 height=100% border=2 borderalpha=80><td width=25% valign=center fillalpha=50 fill=FF0000 autosize=1>a"
      "<p>a2</td><td width=MaxStdIconSizeX padding=abc>b</td></tr>after<td width=Unknown>c");
  const KRichTextBlock& body = r.Body();
  ASSERT_EQ(body.items.size(), 3u);
  const auto& row = std::get<KRichTextRow>(body.items[0]);
  EXPECT_EQ(row.height, (KMarkupSize{KMarkupSize::kPercent, 100}));
  EXPECT_EQ(row.padding, 0);
  EXPECT_EQ(row.cellSpaces, 3);
  EXPECT_EQ(row.border, 2);
  EXPECT_EQ(row.borderAlpha, 0x80);
  ASSERT_EQ(row.cells.size(), 2u);
  const KRichTextBlock& a = *row.cells[0];
  EXPECT_EQ(a.width, (KMarkupSize{KMarkupSize::kPercent, 25}));
  EXPECT_EQ(a.valign.ToUtf8(), "center");
  EXPECT_EQ(a.background.fillAlpha, 0x50);
  EXPECT_EQ(a.background.fill, 0xFFFF0000u);
  EXPECT_TRUE(a.autoSize);
  EXPECT_EQ(r.Paragraphs(&a).size(), 2u);
  EXPECT_EQ(row.cells[1]->width, (KMarkupSize{KMarkupSize::kPixels, 32}));
  EXPECT_EQ(row.cells[1]->padding, 0);
  EXPECT_EQ(r.Paragraphs().size(), 1u);  // "after", beside the row
  // A cell without a row opens one; an unknown layout constant is no width.
  const auto& implicit = std::get<KRichTextRow>(body.items[2]);
  ASSERT_EQ(implicit.cells.size(), 1u);
  EXPECT_EQ(implicit.cells[0]->width, (KMarkupSize{KMarkupSize::kPixels, 0}));
}

TEST(RichTextRenderer, ListItemsAndGraphicsAreItemsOfTheirBlock) {
  const Rendered r("intro<li size=20>one</li><li>two<li>nested</li></li>after<hline size=2 color=FF0000 alpha=128><indicator value=70 middle=50>");
  const KRichTextBlock& body = r.Body();
  ASSERT_EQ(body.items.size(), 6u);
  const auto& one = std::get<std::unique_ptr<KRichTextBlock>>(body.items[1]);
  EXPECT_EQ(one->kind, KRichTextBlock::kListItem);
  EXPECT_EQ(one->indent, 20);
  const auto& two = std::get<std::unique_ptr<KRichTextBlock>>(body.items[2]);
  EXPECT_EQ(two->items.size(), 2u);  // "two" and the nested item
  EXPECT_EQ(std::get<KRichTextParagraph>(body.items[3]).runs[0].text.ToUtf8(), "after");
  const auto& elements = r.renderer.Document().elements;
  const KRichTextElement& line = elements[static_cast<size_t>(std::get<KRichTextGraphic>(body.items[4]).element)];
  EXPECT_EQ(line.kind, KRichTextElement::kHorizontalLine);
  EXPECT_EQ(line.size, 2);
  EXPECT_EQ(line.colour, 0xFFFF0000u);
  EXPECT_EQ(line.alpha, 128);
  const KRichTextElement& indicator = elements[static_cast<size_t>(std::get<KRichTextGraphic>(body.items[5]).element)];
  EXPECT_EQ(indicator.value, 70);
  EXPECT_EQ(indicator.middle, 50);
}

TEST(RichTextRenderer, HostileTextStaysBounded) {
  // Nesting beyond the limit is read as content; the closing tags still match up.
  std::string deep;
  for (int i = 0; i < 5000; ++i) deep += "<li><td>";
  deep += "x";
  for (int i = 0; i < 5000; ++i) deep += "</td></li>";
  deep += "after";
  const Rendered nested(deep.c_str());
  EXPECT_EQ(nested.Lines(), (Lines{"after"}));
  // A set that names itself is not played from inside itself; sets that multiply each other stop
  // at the budget of played tags.
  EXPECT_EQ(Rendered("<tagset name=x><x><b></x></tagset><x>y</x>z").Run("y").style, kStyleBold);
  std::string bomb = "<tagset name=s0><spacer></tagset>";
  for (int level = 1; level < 12; ++level) {
    bomb += "<tagset name=s" + std::to_string(level) + ">";
    for (int i = 0; i < 10; ++i) bomb += "<s" + std::to_string(level - 1) + ">";
    bomb += "</tagset>";
  }
  bomb += "<s11>";
  const Rendered exploded(bomb.c_str());
  const size_t blanks = exploded.Lines().at(0).size();
  EXPECT_GT(blanks, 1000u);
  EXPECT_LE(blanks, static_cast<size_t>(KRichTextRenderer::kMaxPlayedTags));
}

}  // namespace
