#include "ui/KRichTextLayout.h"

#include <algorithm>
#include <cmath>
#include <type_traits>

#include "ui/KVectorIcons.h"

namespace {

int32_t Ceil(double v) noexcept { return static_cast<int32_t>(std::ceil(v - 1e-9)); }
int32_t Round(double v) noexcept { return static_cast<int32_t>(std::lround(v)); }

// A horizontal position word of an element: 0 left, 1 centre, 2 right.
int32_t Position(const KString& word) noexcept {
  if (word == KString("center") || word == KString("centre") || word == KString("middle")) return 1;
  if (word == KString("right") || word == KString("bottom")) return 2;
  return 0;
}

}  // namespace

// A word, a run of blanks, a line break or an inline image of one run, measured.
struct KRichTextLayout::Token {
  enum Kind : uint8_t { kWord, kSpace, kBreak, kImage };
  Kind kind;
  const KRichTextRun* run;
  KString text;
  double width;
  double ascent, descent;  // an image stands on the baseline: all ascent
  KFont font;
};

struct KRichTextLayout::Line {
  std::vector<const Token*> tokens;  // without the blanks at its ends
  double width = 0;
  int32_t spaces = 0;  // blank tokens inside the line (justification stretches them)
  bool broken = false; // ends in a line break
  double ascent = 0, descent = 0;
};

KFont KRichTextLayout::FontOf(int32_t style) noexcept {
  switch (style) {
    case kStyleBold: return KFont::Bold();
    case kStyleItalic: return KFont::Italic();
    case kStyleSecondary: return KFont::Small();
    case kStyleLarge1: case kStyleLarge2: case kStyleLarge3: case kStyleLarge4: return KFont::Large(style - kStyleLarge1 + 1);
    default: return KFont::Normal();
  }
}

KRichTextLayout::KRichTextLayout(const KRichTextDocument& document, int32_t width, double scale, KRichTextLook look)
    : document_(document), width_(std::max(width, 1)), scale_(scale), look_(look) {
  height_ = Block(document.body, 0, 0, width_);
}

KColor KRichTextLayout::ColourOf(const KRichTextFormat& format, bool inverted) const noexcept {
  if (format.colourIndex > kColourDefault && format.colourIndex < 5 && kRichTextPalette[format.colourIndex] != 0)
    return kRichTextPalette[format.colourIndex];
  if (format.colourIndex == kColourDefault && format.colour != 0) return format.colour;
  return inverted ? look_.paper : look_.text;
}

void KRichTextLayout::Shift(size_t first, int32_t dy) noexcept {
  for (size_t i = first; i < pieces_.size(); ++i) {
    pieces_[i].rect.top += dy;
    pieces_[i].rect.bottom += dy;
  }
}

int32_t KRichTextLayout::Block(const KRichTextBlock& block, int32_t x, int32_t y, int32_t width) {
  for (const KRichTextItem& item : block.items) {
    std::visit(
        [&](const auto& value) {
          using T = std::decay_t<decltype(value)>;
          if constexpr (std::is_same_v<T, KRichTextParagraph>) {
            y = Paragraph(value, x, y, width);
          } else if constexpr (std::is_same_v<T, KRichTextRow>) {
            y = Row(value, x, y, width);
          } else if constexpr (std::is_same_v<T, KRichTextGraphic>) {
            y = Graphic(document_.elements[static_cast<size_t>(value.element)], x, y, width);
          } else {
            // A list item: a bullet in the indent, beside the middle of the first line.
            const int32_t indent = std::clamp(value->indent, 0, width / 2);
            const KFont font = KFont::Normal();
            const int32_t middle = y + Round(font.LineHeight(scale_) / 2);
            pieces_.push_back({Piece::kBullet, {x + indent / 2 - 2, middle - 2, x + indent / 2 + 2, middle + 2}, look_.text, 255, font, {}});
            y = Block(*value, x + indent, y, width - indent);
          }
        },
        item);
  }
  return y;
}

int32_t KRichTextLayout::Paragraph(const KRichTextParagraph& paragraph, int32_t x, int32_t y, int32_t width) {
  const bool inverted = paragraph.background.invert;
  // The background goes under the text: its pieces come first and get their size at the end.
  const size_t background = pieces_.size();
  if (inverted) pieces_.push_back({Piece::kFill, {}, look_.text, 255, {}, {}});
  if (paragraph.background.fillAlpha != 0) pieces_.push_back({Piece::kFill, {}, paragraph.background.fill, paragraph.background.fillAlpha, {}, {}});
  const size_t backgrounds = pieces_.size() - background;

  // Measure every word, blank, break and image.
  std::vector<Token> tokens;
  const KRichTextRun* firstRun = paragraph.runs.empty() ? nullptr : &paragraph.runs.front();
  for (const KRichTextRun& run : paragraph.runs) {
    const KFont font = FontOf(run.format.style);
    const double ascent = font.Ascent(scale_), descent = std::fabs(font.Descent(scale_));
    if (run.element >= 0) {
      const KRichTextElement& e = document_.elements[static_cast<size_t>(run.element)];
      const int32_t side = Round(ascent + descent);
      const int32_t w = e.width.Resolve(width, 1, side), h = e.height.Resolve(width, 1, side);
      tokens.push_back({Token::kImage, &run, {}, double(w), double(h) - descent, descent, font});
      continue;
    }
    int32_t start = 0;
    const int32_t length = run.text.Length();
    while (start < length) {
      const char16_t c = run.text.CharAt(start);
      const Token::Kind kind = c == '\n' ? Token::kBreak : (c == ' ' || c == '\t' ? Token::kSpace : Token::kWord);
      int32_t end = start + 1;
      if (kind != Token::kBreak)
        while (end < length) {
          const char16_t d = run.text.CharAt(end);
          const bool blank = d == ' ' || d == '\t';
          if (d == '\n' || blank != (kind == Token::kSpace)) break;
          ++end;
        }
      KString text = run.text.SubString(start, end - start);
      const double w = kind == Token::kBreak ? 0 : font.TextWidth(kind == Token::kSpace ? KString(" ") : text, scale_) * (kind == Token::kSpace ? end - start : 1);
      tokens.push_back({kind, &run, std::move(text), w, ascent, descent, font});
      start = end;
    }
  }

  // Break into lines: words glued to each other (across runs) move to the next line together.
  std::vector<Line> lines(1);
  double pendingSpace = 0;
  int32_t pendingSpaces = 0;
  std::vector<const Token*> pending;
  for (size_t i = 0; i < tokens.size();) {
    const Token& t = tokens[i];
    if (t.kind == Token::kBreak) {
      lines.back().broken = true;
      lines.emplace_back();
      pending.clear();
      pendingSpace = 0;
      pendingSpaces = 0;
      ++i;
      continue;
    }
    if (t.kind == Token::kSpace) {
      if (!lines.back().tokens.empty()) {
        pending.push_back(&t);
        pendingSpace += t.width;
        ++pendingSpaces;
      }
      ++i;
      continue;
    }
    size_t end = i;
    double group = 0;
    while (end < tokens.size() && (tokens[end].kind == Token::kWord || tokens[end].kind == Token::kImage)) group += tokens[end++].width;
    Line* line = &lines.back();
    if (!line->tokens.empty() && !paragraph.singleLine && line->width + pendingSpace + group > width) {
      lines.emplace_back();
      line = &lines.back();
    } else {
      line->tokens.insert(line->tokens.end(), pending.begin(), pending.end());
      line->width += pendingSpace;
      line->spaces += pendingSpaces;
    }
    pending.clear();
    pendingSpace = 0;
    pendingSpaces = 0;
    for (; i < end; ++i) {
      line->tokens.push_back(&tokens[i]);
      line->width += tokens[i].width;
    }
  }

  // Stack the lines; an empty line is as high as the paragraph's first font.
  const KFont first = FontOf(firstRun ? firstRun->format.style : kStyleNormal);
  int32_t top = y;
  for (size_t l = 0; l < lines.size(); ++l) {
    Line& line = lines[l];
    line.ascent = first.Ascent(scale_);
    line.descent = std::fabs(first.Descent(scale_));
    if (!line.tokens.empty()) line.ascent = line.descent = 0;
    for (const Token* t : line.tokens) {
      line.ascent = std::max(line.ascent, t->ascent);
      line.descent = std::max(line.descent, t->descent);
    }
    PlaceLine(paragraph, line, x, top, width, l + 1 == lines.size());
    top += std::max(Ceil(line.ascent + line.descent) + 1, Ceil(first.LineHeight(scale_)));
  }
  for (size_t b = 0; b < backgrounds; ++b) pieces_[background + b].rect = {x, y, x + width - 1, top - 1};
  return top;
}

void KRichTextLayout::PlaceLine(const KRichTextParagraph& paragraph, const Line& line, int32_t x, int32_t top, int32_t width, bool last) {
  const bool inverted = paragraph.background.invert;
  const double room = width - line.width;
  double at = x, stretch = 0;
  switch (paragraph.alignment) {
    case kParagraphCenter: at += std::max(0.0, room / 2); break;
    case kParagraphRight: at += std::max(0.0, room); break;
    case kParagraphJustify:
      if (!last && !line.broken && line.spaces > 0 && room > 0) stretch = room / line.spaces;
      break;
    default: break;
  }
  const int32_t baseline = top + Ceil(line.ascent);
  const KRichTextRun* previous = nullptr;
  size_t textPiece = 0, fillPiece = 0;
  for (const Token* t : line.tokens) {
    const double w = t->width + (t->kind == Token::kSpace ? stretch : 0);
    const int32_t left = Round(at), right = Round(at + w) - 1;
    at += w;
    if (paragraph.singleLine && right >= x + width) break;  // kept on one line: what does not fit is cut
    const KRichTextFormat& f = t->run->format;
    if (f.inverted) {
      // The run in the inverted scheme: a band of the text colour behind it.
      const int32_t bandTop = top, bandBottom = top + Ceil(line.ascent + line.descent);
      if (previous == t->run && pieces_[fillPiece].rect.right == left - 1) pieces_[fillPiece].rect.right = right;
      else {
        fillPiece = pieces_.size();
        pieces_.push_back({Piece::kFill, {left, bandTop, right, bandBottom}, inverted ? look_.paper : look_.text, 255, {}, {}});
      }
    }
    const bool swapped = inverted != f.inverted;
    const KColor colour = ColourOf(f, swapped);
    if (t->kind == Token::kImage) {
      const KRichTextElement& e = document_.elements[static_cast<size_t>(t->run->element)];
      const KRect box{left, baseline - Round(t->ascent), right, baseline + Round(t->descent) - 1};
      pieces_.push_back({KVectorIcons::Has(e.icon) ? Piece::kIcon : Piece::kImage, box, colour, f.opacity, t->font, e.icon});
      previous = nullptr;
      continue;
    }
    // Words and blanks of one run in a row become one piece, unless blanks are stretched.
    if (previous == t->run && stretch == 0 && pieces_[textPiece].kind == Piece::kText) {
      pieces_[textPiece].text.Append(t->text);
      pieces_[textPiece].rect.right = right;
      continue;
    }
    previous = t->run;
    if (t->kind == Token::kSpace) {
      previous = nullptr;  // a stretched blank is only room
      continue;
    }
    const int32_t textTop = baseline - Round(t->font.Ascent(scale_));
    textPiece = pieces_.size();
    pieces_.push_back({Piece::kText, {left, textTop, right, textTop + Ceil(t->font.LineHeight(scale_)) - 1}, colour, f.opacity, t->font, t->text});
  }
}

int32_t KRichTextLayout::Row(const KRichTextRow& row, int32_t x, int32_t y, int32_t width) {
  const int32_t count = static_cast<int32_t>(row.cells.size());
  if (count == 0) return y;
  const int32_t spacing = std::max(row.cellSpaces, 0);
  const int32_t available = std::max(width - spacing * (count - 1), count);
  std::vector<int32_t> widths(static_cast<size_t>(count), -1);
  int32_t used = 0, open = 0;
  for (int32_t c = 0; c < count; ++c) {
    const KRichTextBlock& cell = *row.cells[static_cast<size_t>(c)];
    int32_t w = cell.width.unit == KMarkupSize::kAuto || cell.width.value <= 0 ? -1 : cell.width.Resolve(available, 1, -1);
    if (w < 0 && cell.autoSize && measuring_ == 0) {
      // As wide as its content laid out in what is left. Cells inside it are not measured in
      // turn, so nested automatic cells cost linear, not exponential, work.
      const size_t mark = pieces_.size();
      const int32_t padding = cell.padding >= 0 ? cell.padding : row.padding;
      ++measuring_;
      Block(cell, 0, 0, std::max(available - used, 1));
      --measuring_;
      int32_t right = 0;
      for (size_t i = mark; i < pieces_.size(); ++i) right = std::max(right, pieces_[i].rect.right + 1);
      pieces_.resize(mark);
      w = right + 2 * padding;
    }
    if (w >= 0) {
      w = std::clamp(w, 1, std::max(available - used, 1));
      used += w;
    } else {
      ++open;
    }
    widths[static_cast<size_t>(c)] = w;
  }
  const int32_t share = open ? std::max((available - used) / open, 1) : 0;

  struct Placed {
    size_t background, content;
    int32_t left, width, height, padding, border;
    uint8_t borderAlpha;
  };
  std::vector<Placed> placed;
  int32_t left = x, rowHeight = row.height.unit == KMarkupSize::kPixels ? row.height.value : 0;
  for (int32_t c = 0; c < count; ++c) {
    const KRichTextBlock& cell = *row.cells[static_cast<size_t>(c)];
    const int32_t w = widths[static_cast<size_t>(c)] >= 0 ? widths[static_cast<size_t>(c)] : share;
    const int32_t padding = std::max(cell.padding >= 0 ? cell.padding : row.padding, 0);
    const int32_t border = std::max(cell.border >= 0 ? cell.border : row.border, 0);
    Placed p{pieces_.size(), 0, left, w, 0, padding, border, cell.border >= 0 ? cell.borderAlpha : row.borderAlpha};
    if (cell.background.invert) pieces_.push_back({Piece::kFill, {}, look_.text, 255, {}, {}});
    if (cell.background.fillAlpha != 0) pieces_.push_back({Piece::kFill, {}, cell.background.fill, cell.background.fillAlpha, {}, {}});
    p.content = pieces_.size();
    const int32_t inset = padding + border;
    p.height = Block(cell, left + inset, y + inset, std::max(w - 2 * inset, 1)) - y + inset;
    rowHeight = std::max(rowHeight, p.height);
    placed.push_back(p);
    left += w + spacing;
  }
  for (size_t c = 0; c < placed.size(); ++c) {
    const Placed& p = placed[c];
    const KRect box{p.left, y, p.left + p.width - 1, y + rowHeight - 1};
    for (size_t i = p.background; i < p.content; ++i) pieces_[i].rect = box;
    const int32_t valign = Position(row.cells[c]->valign);
    const size_t end = c + 1 < placed.size() ? placed[c + 1].background : pieces_.size();
    const int32_t dy = valign == 1 ? (rowHeight - p.height) / 2 : (valign == 2 ? rowHeight - p.height : 0);
    for (size_t i = p.content; i < end; ++i) {
      pieces_[i].rect.top += dy;
      pieces_[i].rect.bottom += dy;
    }
    for (int32_t b = 0; b < p.border; ++b)
      pieces_.push_back({Piece::kFrame, {box.left + b, box.top + b, box.right - b, box.bottom - b}, look_.text, p.borderAlpha, {}, {}});
  }
  return y + rowHeight;
}

int32_t KRichTextLayout::Graphic(const KRichTextElement& e, int32_t x, int32_t y, int32_t width) {
  const int32_t hspace = std::max(e.hspace, 0), vspace = std::max(e.vspace, 0);
  const int32_t room = std::max(width - 2 * hspace, 1);
  int32_t w, h;
  switch (e.kind) {
    case KRichTextElement::kHorizontalLine: w = e.width.Resolve(room, 1, room), h = std::max(e.size, 1); break;
    case KRichTextElement::kIndicator: w = e.width.Resolve(room, 1, 100), h = e.height.Resolve(room, 1, 10); break;
    default: w = e.width.Resolve(room, 1, 12), h = e.height.Resolve(room, 1, 12); break;
  }
  w = std::clamp(w, 1, room);
  h = std::clamp(h, 1, 4096);
  const int32_t position = Position(e.align);
  const int32_t left = x + hspace + (position == 1 ? (room - w) / 2 : (position == 2 ? room - w : 0));
  const KRect box{left, y + vspace, left + w - 1, y + vspace + h - 1};
  const KColor colour = e.colour ? e.colour : look_.text;
  switch (e.kind) {
    case KRichTextElement::kHorizontalLine: pieces_.push_back({Piece::kFill, box, colour, e.alpha, {}, {}}); break;
    case KRichTextElement::kRectangle:
      pieces_.push_back({Piece::kFill, box, colour, 255, {}, {}});
      if (e.borderColour) pieces_.push_back({Piece::kFrame, box, e.borderColour, 255, {}, {}});
      break;
    case KRichTextElement::kIndicator:
      pieces_.push_back({Piece::kIndicator, box, e.colour ? e.colour : kRichTextPalette[kColourGreen], 255, {}, {}, std::clamp(e.value, 0, 100),
                         std::clamp(e.middle, 0, 100)});
      pieces_.push_back({Piece::kFrame, box, e.borderColour ? e.borderColour : look_.text, 255, {}, {}});
      break;
    case KRichTextElement::kImage: break;
  }
  return y + h + 2 * vspace;
}

void KRichTextLayout::Draw(KDrawer& drawer, KPoint origin) const {
  drawer.FillRectangle({origin.x, origin.y, origin.x + width_ - 1, origin.y + height_ - 1}, look_.paper, 255, kDrawCopy);
  for (const Piece& p : pieces_) {
    const KRect r{p.rect.left + origin.x, p.rect.top + origin.y, p.rect.right + origin.x, p.rect.bottom + origin.y};
    switch (p.kind) {
      case Piece::kText: drawer.AlignedTextOut(r, p.text, p.font, p.colour, kAlignLeft | kAlignTop, p.opacity, kDrawBlend); break;
      case Piece::kFill: drawer.FillRectangle(r, p.colour, p.opacity, kDrawBlend); break;
      case Piece::kFrame: drawer.Rectangle(r, p.colour, p.opacity, kDrawBlend); break;
      case Piece::kIcon: KVectorIcons::Paint(drawer, p.text, r, p.colour, p.opacity); break;
      case Piece::kImage: drawer.RoundRectangle(r, 2, p.colour, p.opacity, kDrawBlend); break;
      case Piece::kBullet:
        drawer.FillCircle({(r.left + r.right) / 2.0, (r.top + r.bottom) / 2.0}, r.Width() / 2.0, p.colour, p.opacity, kDrawBlend);
        break;
      case Piece::kIndicator: {
        const int32_t from = r.left + static_cast<int32_t>(r.Width() * std::min(p.middle, p.value) / 100);
        const int32_t to = r.left + static_cast<int32_t>(r.Width() * std::max(p.middle, p.value) / 100) - 1;
        if (to >= from) drawer.FillRectangle({from, r.top, to, r.bottom}, p.colour, p.opacity, kDrawBlend);
        break;
      }
    }
  }
}
