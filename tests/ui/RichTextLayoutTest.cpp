// Layout of rendered mark-up: line breaking, the four alignments, baselines, inverted runs and
// paragraphs, tables, list items and graphic elements, checked on the pieces the layout places.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <map>
#include <memory>
#include <set>
#include <string>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextLayout.h"
#include "ui/KRichTextRenderer.h"

namespace {

using Piece = KRichTextLayout::Piece;

struct Laid {
  Laid(const char* markup, int32_t width, double scale = 1) {
    KRichTextRenderer renderer;
    renderer.Render(KHelpTexts::SemanticTagSets());
    renderer.Render(KString::FromUtf8(markup));
    document = renderer.TakeDocument();
    layout = std::make_unique<KRichTextLayout>(document, width, scale);
  }
  std::vector<Piece> Of(Piece::Kind kind) const {
    std::vector<Piece> out;
    for (const Piece& p : layout->Pieces())
      if (p.kind == kind) out.push_back(p);
    return out;
  }
  const Piece& Text(const std::string& text) const {
    for (const Piece& p : layout->Pieces())
      if (p.kind == Piece::kText && p.text.ToUtf8() == text) return p;
    ADD_FAILURE() << "no piece '" << text << "'";
    return layout->Pieces().front();
  }
  KRichTextDocument document;
  std::unique_ptr<KRichTextLayout> layout;
};

const char* const kLorem =
    "Short times catch every peak; longer times let the start of each note through before the gain comes down, "
    "and the compressor then follows the loudness you hear rather than the waveform.";

TEST(RichTextLayout, LinesBreakAtBlanksWithinTheWidth) {
  const Laid laid(kLorem, 200);
  const auto texts = laid.Of(Piece::kText);
  ASSERT_GT(texts.size(), 3u);
  std::set<int32_t> tops;
  for (const Piece& p : texts) {
    EXPECT_GE(p.rect.left, 0);
    EXPECT_LE(p.rect.right, 199) << p.text.ToUtf8();
    tops.insert(p.rect.top);
    EXPECT_NE(p.text.CharAt(0), u' ');  // no line starts with a blank
  }
  EXPECT_EQ(tops.size(), texts.size());  // one piece per line: a run's words share it
  // A word longer than the line stands alone and overflows rather than vanishing.
  const Laid narrow("a Supercalifragilisticexpialidocious b", 40);
  EXPECT_EQ(narrow.Of(Piece::kText).size(), 3u);
  // A line break starts a new line; a single-line paragraph never breaks.
  EXPECT_GT(Laid("one<br>two", 400).Text("two").rect.top, Laid("one<br>two", 400).Text("one").rect.top);
  const Laid single((std::string("<p singleline=1>") + kLorem).c_str(), 200);
  for (const Piece& p : single.Of(Piece::kText)) EXPECT_EQ(p.rect.top, single.Of(Piece::kText)[0].rect.top);
  EXPECT_LT(single.layout->Height(), laid.layout->Height());
}

TEST(RichTextLayout, FourAlignments) {
  const int32_t width = 300;
  const Piece left = Laid("word", width).Text("word");
  const Piece centre = Laid("<center>word", width).Text("word");
  const Piece right = Laid("<right>word", width).Text("word");
  EXPECT_EQ(left.rect.left, 0);
  EXPECT_NEAR(centre.rect.left, width - 1 - centre.rect.right, 1);
  EXPECT_EQ(right.rect.right, width - 1);
  // Justified lines reach both edges, except the last line of the paragraph.
  const Laid justified((std::string("<justify>") + kLorem).c_str(), 220);
  std::map<int32_t, std::pair<int32_t, int32_t>> lines;  // top -> leftmost, rightmost
  for (const Piece& p : justified.Of(Piece::kText)) {
    auto [it, fresh] = lines.try_emplace(p.rect.top, p.rect.left, p.rect.right);
    it->second = {std::min(it->second.first, p.rect.left), std::max(it->second.second, p.rect.right)};
  }
  ASSERT_GT(lines.size(), 2u);
  for (auto it = lines.begin(); std::next(it) != lines.end(); ++it) {
    EXPECT_EQ(it->second.first, 0);
    EXPECT_EQ(it->second.second, 219);
  }
  // The last line stays as left alignment sets it.
  const auto plain = Laid(kLorem, 220).Of(Piece::kText);
  EXPECT_EQ(lines.rbegin()->second.second, plain.back().rect.right);
}

TEST(RichTextLayout, RunsOfDifferentSizesShareABaseline) {
  const Laid laid("small <l1>Large</l1> <s>note</s>", 400);
  const Piece& small = laid.Text("small ");
  const Piece& large = laid.Text("Large");
  const Piece& note = laid.Text("note");
  const double scale = 1;
  const int32_t baseSmall = small.rect.top + int32_t(std::lround(small.font.Ascent(scale)));
  const int32_t baseLarge = large.rect.top + int32_t(std::lround(large.font.Ascent(scale)));
  const int32_t baseNote = note.rect.top + int32_t(std::lround(note.font.Ascent(scale)));
  EXPECT_EQ(baseSmall, baseLarge);
  EXPECT_EQ(baseSmall, baseNote);
  EXPECT_GT(large.font.Size(), small.font.Size());
  EXPECT_LT(note.font.Size(), small.font.Size());
  EXPECT_EQ(large.font.Style(), KFontStyle::Bold);
}

TEST(RichTextLayout, InvertedSectionHeaderAndRuns) {
  const Laid laid("<center invert=1 singleline=1><l2>Attack</l2><left>text <ci>inverted</ci> <cred>red</cred>", 300);
  const auto fills = laid.Of(Piece::kFill);
  ASSERT_GE(fills.size(), 2u);
  // The header's band spans the width in the text colour; its title is in the paper colour.
  EXPECT_EQ(fills[0].rect.left, 0);
  EXPECT_EQ(fills[0].rect.right, 299);
  EXPECT_EQ(fills[0].colour, KRichTextLook().text);
  EXPECT_EQ(laid.Text("Attack").colour, KRichTextLook().paper);
  EXPECT_GE(laid.Text("Attack").rect.top, fills[0].rect.top);
  EXPECT_LE(laid.Text("Attack").rect.bottom, fills[0].rect.bottom);
  // An inverted run: a band behind the word, the word in paper colour.
  const Piece& inverted = laid.Text("inverted");
  EXPECT_EQ(inverted.colour, KRichTextLook().paper);
  EXPECT_EQ(fills[1].rect.left, inverted.rect.left);
  EXPECT_EQ(fills[1].rect.right, inverted.rect.right);
  EXPECT_EQ(laid.Text("red").colour, kRichTextPalette[kColourRed]);
  EXPECT_EQ(laid.Text("text ").colour, KRichTextLook().text);
}

TEST(RichTextLayout, TablesListsImagesAndElements) {
  const Laid table("<tr padding=4 border=1><td width=25%>left</td><td valign=center>right<p>two<p>lines</td><td width=40 autosize=1 fillalpha=80 fill=FF0000>x</td></tr>",
                   400);
  const Piece& left = table.Text("left");
  const Piece& right = table.Text("right");
  EXPECT_EQ(left.rect.left, 5);    // padding and border
  EXPECT_EQ(right.rect.left, 105);  // after a quarter of the width
  EXPECT_LT(table.Text("x").rect.left, 400 - 40 + 6);
  EXPECT_GE(table.Text("x").rect.left, 400 - 40);
  // The fill lies under the third cell over the whole row; each cell has its frame.
  const auto fills = table.Of(Piece::kFill);
  ASSERT_EQ(fills.size(), 1u);
  EXPECT_EQ(fills[0].rect.left, 360);
  EXPECT_EQ(fills[0].opacity, 0x80);
  EXPECT_EQ(fills[0].rect.bottom + 1, table.layout->Height());
  EXPECT_EQ(table.Of(Piece::kFrame).size(), 3u);
  // "left" stays at the top of its cell; "right" is centred: the three lines of the middle
  // cell are the row's height, so it starts at the top as well.
  EXPECT_EQ(left.rect.top, right.rect.top);

  const Laid list("intro<li size=30>one</li><li size=30>two</li>", 300);
  EXPECT_EQ(list.Text("one").rect.left, 30);
  ASSERT_EQ(list.Of(Piece::kBullet).size(), 2u);
  EXPECT_LT(list.Of(Piece::kBullet)[0].rect.right, 30);
  EXPECT_GT(list.Text("two").rect.top, list.Text("one").rect.top);

  const Laid images("press <img icon=randomize> or <img number=2 width=30> now<hline size=3><indicator value=75 middle=25 width=50%>", 300);
  ASSERT_EQ(images.Of(Piece::kIcon).size(), 1u);
  EXPECT_EQ(images.Of(Piece::kIcon)[0].text.ToUtf8(), "randomize");
  EXPECT_GT(images.Of(Piece::kIcon)[0].rect.left, images.Text("press ").rect.right);
  ASSERT_EQ(images.Of(Piece::kImage).size(), 1u);
  EXPECT_EQ(images.Of(Piece::kImage)[0].rect.Width(), 30);
  const auto line = images.Of(Piece::kFill);
  ASSERT_EQ(line.size(), 1u);
  EXPECT_EQ(line[0].rect.Width(), 300);
  EXPECT_EQ(line[0].rect.Height(), 3);
  const auto indicator = images.Of(Piece::kIndicator);
  ASSERT_EQ(indicator.size(), 1u);
  EXPECT_EQ(indicator[0].rect.Width(), 150);
  EXPECT_EQ(indicator[0].value, 75);
}

TEST(RichTextLayout, LayoutInLogicalUnitsHoldsAtEveryScale) {
  const Laid one(kLorem, 250, 1), two(kLorem, 250, 2);
  EXPECT_EQ(one.Of(Piece::kText).size(), two.Of(Piece::kText).size());
  // Hinted metrics differ by up to a unit per line between scales.
  EXPECT_NEAR(one.layout->Height(), two.layout->Height(), double(one.Of(Piece::kText).size()));
}

TEST(RichTextLayout, HostileDocumentsTakeBoundedWork) {
  // Automatic cells nested as deep as the renderer allows, and a row of thousands of cells.
  std::string nested;
  for (int i = 0; i < 40; ++i) nested += "<tr><td autosize=1 padding=1 border=1>word ";
  const auto start = std::chrono::steady_clock::now();
  const Laid deep(nested.c_str(), 600);
  std::string wide = "<tr>";
  for (int i = 0; i < 5000; ++i) wide += "<td>x</td>";
  const Laid cells(wide.c_str(), 300);
  const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  EXPECT_LT(seconds, 20.0);  // exponential work would not end at all
  EXPECT_EQ(deep.Of(Piece::kText).size(), 40u);  // cells beyond the depth limit are read as content
  EXPECT_EQ(cells.Of(Piece::kText).size(), 5000u);
  for (const Piece& p : cells.Of(Piece::kText)) EXPECT_GE(p.rect.left, 0);
}

}  // namespace
