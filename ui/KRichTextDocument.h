#pragma once

#include <cstdint>
#include <memory>
#include <variant>
#include <vector>

#include "kernel/KString.h"
#include "ui/KMarkupAttributes.h"

// What the rich-text renderer builds from mark-up: blocks of paragraphs, table rows, list items
// and graphic elements; paragraphs of styled runs. Layout and the HTML export read it.

// Style codes of the style stack.
enum KRichTextStyle : int32_t {
  kStyleNormal = 0,
  kStyleBold = 1,
  kStyleItalic = 2,
  kStyleSecondary = 3,  // annotations such as "(2 of 3)"
  kStyleLarge1 = 4,
  kStyleLarge2 = 5,
  kStyleLarge3 = 6,
  kStyleLarge4 = 7,
};

// Colour indices: 0 is the default text colour, or the explicit colour value beside it.
enum KRichTextColourIndex : int32_t { kColourDefault = 0, kColourRed = 2, kColourGreen = 3, kColourBlue = 4 };

enum KRichTextAlignment : int32_t { kParagraphLeft = 0, kParagraphCenter = 1, kParagraphRight = 2, kParagraphJustify = 3 };

struct KRichTextFormat {
  int32_t style = kStyleNormal;
  int32_t colourIndex = kColourDefault;
  uint32_t colour = 0;  // 0xAARRGGBB with index 0; 0 is the default text colour
  uint8_t opacity = 255;
  bool inverted = false;
  KString tagSet;  // the innermost tag set played around the run (the HTML export's class)
};

// A run of text in one format. An inline image is a run of one blank whose `element` names it.
struct KRichTextRun {
  KString text;  // "\n" is a line break
  KRichTextFormat format;
  int32_t element = -1;  // index into KRichTextDocument::elements
};

// The background of a paragraph or cell.
struct KRichTextBackground {
  bool invert = false;      // drawn in the inverted colour scheme
  uint8_t fillAlpha = 0;    // opacity of the fill
  uint32_t fill = 0xFF000000;
};

struct KRichTextParagraph {
  int32_t alignment = kParagraphLeft;
  bool singleLine = false;  // kept on one line, clipped rather than broken
  KRichTextBackground background;
  int32_t heading = 0;  // 1 or 2 inside header1 / header2, else 0
  std::vector<KRichTextRun> runs;
};

// Inline images and the graphic elements of a block, with their attribute sets.
struct KRichTextElement {
  enum Kind : uint8_t { kImage, kHorizontalLine, kRectangle, kIndicator };
  Kind kind = kImage;
  // common
  KMarkupSize width, height;
  KString align, valign;
  // img
  int32_t number = -1;
  KString icon, bitmap;
  // hline
  int32_t size = 1;
  int32_t hspace = 0, vspace = 0;
  uint8_t alpha = 255;
  // hline, rectangle, indicator
  uint32_t colour = 0;  // 0: the text colour
  uint32_t borderColour = 0;  // 0: none
  // indicator: the filled share, and where the fill starts (a middle of 50 fills from the centre)
  int32_t value = 0, middle = 0;
};

struct KRichTextBlock;

struct KRichTextRow {
  KMarkupSize height;
  int32_t padding = 2;
  int32_t cellSpaces = 0;
  int32_t border = 0;
  uint8_t borderAlpha = 0xFF;
  std::vector<std::unique_ptr<KRichTextBlock>> cells;
};

// A graphic element standing in a block (hline, rectangle, indicator).
struct KRichTextGraphic {
  int32_t element;  // index into KRichTextDocument::elements
};

using KRichTextItem = std::variant<KRichTextParagraph, KRichTextRow, std::unique_ptr<KRichTextBlock>, KRichTextGraphic>;

// The document, a table cell or a list item.
struct KRichTextBlock {
  enum Kind : uint8_t { kDocument, kCell, kListItem };
  Kind kind = kDocument;
  std::vector<KRichTextItem> items;
  // cell
  KMarkupSize width;
  KString valign;
  int32_t padding = -1;  // -1: the row's
  bool autoSize = false;
  int32_t border = -1;  // -1: the row's
  uint8_t borderAlpha = 0xFF;
  KRichTextBackground background;
  // list item: the indent in pixels at scale 1
  int32_t indent = 0;
};

struct KRichTextDocument {
  KRichTextBlock body;
  std::vector<KRichTextElement> elements;
};

// The colours of the palette indices red, green and blue (index 0 is the text colour).
constexpr uint32_t kRichTextPalette[5] = {0, 0, 0xFF880000, 0xFF008800, 0xFF000088};
