#pragma once

#include <cstdint>
#include <vector>

#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "ui/KDrawer.h"
#include "ui/KRichTextDocument.h"

// Lays a rendered document out in a block width and draws it through any drawer. Layout breaks
// paragraphs into lines at blanks (a word longer than the line stands alone), aligns them left,
// centred, right or justified (every line but a paragraph's last and those ending in a line
// break fills the width), sets runs of different sizes on one baseline, and stacks tables, list
// items and graphic elements. The result is a list of pieces in logical units, so that the same
// layout draws at any scale.
// The colours of the page: text on paper; inverted runs and paragraphs swap them.
struct KRichTextLook {
  KColor text = 0xFF000000;
  KColor paper = 0xFFFFFFFF;
};

class TORVANE_API KRichTextLayout {
public:
  struct Piece {
    enum Kind : uint8_t { kText, kFill, kFrame, kIcon, kImage, kBullet, kIndicator };
    Kind kind;
    KRect rect;  // text: the line box of the run's font, its top at baseline − ascent
    KColor colour;
    uint8_t opacity;
    KFont font;
    KString text;       // text; the icon's name
    int32_t value = 0;  // indicator: the filled share from `middle` to `value`, percent
    int32_t middle = 0;
  };

  // `scale` is the scale the layout will be drawn at: font metrics depend on it a little.
  KRichTextLayout(const KRichTextDocument& document, int32_t width, double scale = 1, KRichTextLook look = {});

  int32_t Width() const noexcept { return width_; }
  int32_t Height() const noexcept { return height_; }
  const std::vector<Piece>& Pieces() const noexcept { return pieces_; }

  // Paints the page (paper first) with its top-left corner at `origin`.
  void Draw(KDrawer& drawer, KPoint origin = {}) const;

  // The font of a style code: normal, bold, italic, secondary (small), large 1 to 4.
  static KFont FontOf(int32_t style) noexcept;

private:
  struct Token;
  struct Line;
  int32_t Block(const KRichTextBlock& block, int32_t x, int32_t y, int32_t width);
  int32_t Paragraph(const KRichTextParagraph& paragraph, int32_t x, int32_t y, int32_t width);
  int32_t Row(const KRichTextRow& row, int32_t x, int32_t y, int32_t width);
  int32_t Graphic(const KRichTextElement& element, int32_t x, int32_t y, int32_t width);
  void PlaceLine(const KRichTextParagraph& paragraph, const Line& line, int32_t x, int32_t y, int32_t width, bool last);
  KColor ColourOf(const KRichTextFormat& format, bool inverted) const noexcept;
  // Moves the pieces from `first` on by `dy`.
  void Shift(size_t first, int32_t dy) noexcept;

  const KRichTextDocument& document_;
  int32_t width_;
  double scale_;
  KRichTextLook look_;
  int32_t height_ = 0;
  int32_t measuring_ = 0;  // above 0 while a cell is laid out only to learn its width
  std::vector<Piece> pieces_;
};
