#include "ui/KRichTextRenderer.h"

#include <utility>

#include "ui/KHelpTexts.h"

namespace {

// What a built-in tag does, in the order in which the handler tests names: the first match wins.
enum class KTagKind : uint8_t { kStyle, kColourIndex, kInvert, kColour, kAlpha, kParagraph, kHeader, kRow, kCell, kImage, kGraphic, kListItem, kSpacer };

struct KBuiltInTag {
  const char* name;
  KTagKind kind;
  int32_t code;  // style, colour index, alignment (-1: unchanged), header level or element kind
};
constexpr KBuiltInTag kBuiltInTags[] = {
    {"b", KTagKind::kStyle, kStyleBold},
    {"i", KTagKind::kStyle, kStyleItalic},
    {"s", KTagKind::kStyle, kStyleSecondary},
    {"l1", KTagKind::kStyle, kStyleLarge1},
    {"l2", KTagKind::kStyle, kStyleLarge2},
    {"l3", KTagKind::kStyle, kStyleLarge3},
    {"l4", KTagKind::kStyle, kStyleLarge4},
    {"normal", KTagKind::kStyle, kStyleNormal},
    {"cd", KTagKind::kColourIndex, kColourDefault},
    {"cred", KTagKind::kColourIndex, kColourRed},
    {"cgreen", KTagKind::kColourIndex, kColourGreen},
    {"cblue", KTagKind::kColourIndex, kColourBlue},
    {"ci", KTagKind::kInvert, 0},
    {"c", KTagKind::kColour, 0},
    {"alpha", KTagKind::kAlpha, 0},
    {"left", KTagKind::kParagraph, kParagraphLeft},
    {"center", KTagKind::kParagraph, kParagraphCenter},
    {"right", KTagKind::kParagraph, kParagraphRight},
    {"justify", KTagKind::kParagraph, kParagraphJustify},
    {"p", KTagKind::kParagraph, -1},
    {"header1", KTagKind::kHeader, 1},
    {"header2", KTagKind::kHeader, 2},
    {"tr", KTagKind::kRow, 0},
    {"td", KTagKind::kCell, 0},
    {"img", KTagKind::kImage, KRichTextElement::kImage},
    {"hline", KTagKind::kGraphic, KRichTextElement::kHorizontalLine},
    {"rectangle", KTagKind::kGraphic, KRichTextElement::kRectangle},
    {"indicator", KTagKind::kGraphic, KRichTextElement::kIndicator},
    {"li", KTagKind::kListItem, 0},
    {"spacer", KTagKind::kSpacer, 0},
};

const KBuiltInTag* FindBuiltIn(const KString& name) noexcept {
  for (const KBuiltInTag& tag : kBuiltInTags)
    if (name == KString::Static(tag.name)) return &tag;
  return nullptr;
}

uint8_t ByteOf(int32_t value) noexcept { return static_cast<uint8_t>(value < 0 ? 0 : (value > 255 ? 255 : value)); }

KRichTextBackground ReadBackground(const KMarkupAttributes& a) noexcept {
  KRichTextBackground background;
  background.invert = a.Integer("invert", 0) != 0;
  background.fillAlpha = a.HexByte("fillalpha", background.fillAlpha);
  background.fill = a.Colour("fill", background.fill);
  return background;
}

KString ValueOf(const KMarkupAttributes& a, const KString& name) {
  const KString* value = a.Find(name);
  return value ? *value : KString();
}

KRichTextElement ReadElement(KRichTextElement::Kind kind, const KMarkupAttributes& a) {
  KRichTextElement e;
  e.kind = kind;
  e.width = a.Size("width");
  e.height = a.Size("height");
  e.align = ValueOf(a, "align");
  e.valign = ValueOf(a, "valign");
  switch (kind) {
    case KRichTextElement::kImage:
      e.number = a.Integer("number", e.number);
      e.icon = ValueOf(a, "icon");
      e.bitmap = ValueOf(a, "bitmap");
      break;
    case KRichTextElement::kHorizontalLine:
      e.size = a.Integer("size", e.size);
      e.colour = a.Colour("color", e.colour);
      e.alpha = ByteOf(a.Integer("alpha", e.alpha));
      e.hspace = a.Integer("hspace", e.hspace);
      e.vspace = a.Integer("vspace", e.vspace);
      break;
    case KRichTextElement::kIndicator:
      e.value = a.Integer("value", e.value);
      e.middle = a.Integer("middle", e.middle);
      [[fallthrough]];
    case KRichTextElement::kRectangle:
      e.colour = a.Colour("color", e.colour);
      e.borderColour = a.Colour("bordercolor", e.borderColour);
      break;
  }
  return e;
}

}  // namespace

KRichTextRenderer::KRichTextRenderer() { Reset(); }
KRichTextRenderer::~KRichTextRenderer() = default;

void KRichTextRenderer::Reset() {
  document_ = KRichTextDocument();
  styles_ = Stack<int32_t>(kStyleNormal);
  colourIndices_ = Stack<int32_t>(kColourDefault);
  colours_ = Stack<uint32_t>(0);
  opacities_ = Stack<uint8_t>(255);
  playedSets_ = Stack<KString>(KString());
  inversions_ = 0;
  alignment_ = kParagraphLeft;
  heading_ = 0;
  blocks_.assign(1, &document_.body);
  paragraph_.assign(1, -1);
  row_.assign(1, -1);
  tooDeep_ = 0;
  defining_ = -1;
  played_ = 0;
}

KRichTextDocument KRichTextRenderer::TakeDocument() {
  KRichTextDocument taken = std::move(document_);
  Reset();
  return taken;
}

KRichTextParagraph* KRichTextRenderer::CurrentParagraph() noexcept {
  const int32_t index = paragraph_.back();
  return index < 0 ? nullptr : &std::get<KRichTextParagraph>(Block().items[static_cast<size_t>(index)]);
}

KRichTextRow* KRichTextRenderer::CurrentRow() noexcept {
  const int32_t index = row_.back();
  return index < 0 ? nullptr : &std::get<KRichTextRow>(Block().items[static_cast<size_t>(index)]);
}

template <class Item>
Item& KRichTextRenderer::AddItem(Item item) {
  KRichTextBlock& block = Block();
  block.items.emplace_back(std::move(item));
  paragraph_.back() = -1;
  row_.back() = -1;
  return std::get<Item>(block.items.back());
}

KRichTextParagraph& KRichTextRenderer::StartParagraph() {
  KRichTextParagraph paragraph;
  paragraph.alignment = alignment_;
  paragraph.heading = heading_;
  AddItem(std::move(paragraph));
  paragraph_.back() = static_cast<int32_t>(Block().items.size()) - 1;
  RecomputeFormat();
  return *CurrentParagraph();
}

// A format change never alters text already emitted: it goes to a new run, unless the last run
// is still empty, so consecutive changes leave one empty run.
void KRichTextRenderer::RecomputeFormat() {
  KRichTextParagraph* paragraph = CurrentParagraph();
  if (!paragraph) return;
  if (paragraph->runs.empty() || !paragraph->runs.back().text.IsEmpty()) paragraph->runs.emplace_back();
  KRichTextFormat& format = paragraph->runs.back().format;
  format.style = styles_.Top();
  format.colourIndex = colourIndices_.Top();
  format.colour = colours_.Top();
  format.opacity = opacities_.Top();
  format.inverted = inversions_ > 0;
  format.tagSet = playedSets_.Top();
}

void KRichTextRenderer::Append(const KString& text) {
  KRichTextParagraph* paragraph = CurrentParagraph();
  if (!paragraph) paragraph = &StartParagraph();
  paragraph->runs.back().text.Append(text);
}

void KRichTextRenderer::HandleText(const KString& text) { Append(text); }

void KRichTextRenderer::HandleTag(const KString& name, const KMarkupAttributes& attributes, bool closing) {
  if (name == KString("tagset")) {
    if (closing) {
      defining_ = -1;
    } else {
      tagSets_.push_back({ValueOf(attributes, "name"), {}});
      defining_ = static_cast<int32_t>(tagSets_.size()) - 1;
    }
    return;
  }
  if (defining_ >= 0) {
    tagSets_[static_cast<size_t>(defining_)].tags.push_back({name, attributes, closing});
    return;
  }
  const KBuiltInTag* tag = FindBuiltIn(name);
  if (!tag) {
    PlayTagSets(name, closing);
    return;
  }
  switch (tag->kind) {
    case KTagKind::kStyle:
      closing ? styles_.Pop() : styles_.Push(tag->code);
      break;
    case KTagKind::kColourIndex:
      if (closing) {
        colourIndices_.Pop();
        colours_.Pop();
      } else {
        colourIndices_.Push(tag->code);
        colours_.Push(0);
      }
      break;
    case KTagKind::kInvert:
      inversions_ += closing ? -1 : 1;
      break;
    case KTagKind::kColour:
      // Once per color attribute: a closing tag without one leaves the colour as it is.
      for (const KMarkupAttribute& a : attributes) {
        if (!(a.name == KString("color"))) continue;
        if (closing) {
          colourIndices_.Pop();
          colours_.Pop();
        } else {
          colourIndices_.Push(kColourDefault);
          colours_.Push(KMarkupAttributes::ParseColour(a.value));
        }
      }
      break;
    case KTagKind::kAlpha:
      closing ? opacities_.Pop() : opacities_.Push(ByteOf(attributes.Integer("value", 255)));
      break;
    case KTagKind::kParagraph:
      ParagraphTag(tag->code, attributes, closing);
      return;
    case KTagKind::kHeader:
      HeaderTag(tag->code, closing);
      return;
    case KTagKind::kRow:
      RowTag(attributes, closing);
      return;
    case KTagKind::kCell:
      CellTag(attributes, closing);
      return;
    case KTagKind::kImage:
      if (!closing) ImageTag(attributes);
      return;
    case KTagKind::kGraphic:
      if (!closing) GraphicTag(static_cast<KRichTextElement::Kind>(tag->code), attributes);
      return;
    case KTagKind::kListItem:
      ListItemTag(attributes, closing);
      return;
    case KTagKind::kSpacer:
      if (!closing) HandleText(" ");
      return;
  }
  RecomputeFormat();
}

void KRichTextRenderer::ParagraphTag(int32_t alignment, const KMarkupAttributes& attributes, bool closing) {
  if (closing) {
    EndParagraph();
    return;
  }
  if (alignment >= 0) alignment_ = alignment;
  KRichTextParagraph& paragraph = StartParagraph();
  paragraph.singleLine = attributes.Integer("singleline", 0) != 0;
  paragraph.background = ReadBackground(attributes);
}

// A blank line above the header when text stands before it, and one below it.
void KRichTextRenderer::HeaderTag(int32_t level, bool closing) {
  const int32_t style = level == 1 ? kStyleLarge1 : kStyleLarge2;
  if (!closing) {
    if (CurrentParagraph()) {
      StartParagraph();
      StartParagraph();
    }
    heading_ = level;
    if (KRichTextParagraph* title = CurrentParagraph()) title->heading = level;
    styles_.Push(style);
    RecomputeFormat();
    return;
  }
  heading_ = 0;
  styles_.Pop();
  RecomputeFormat();
  StartParagraph();
  StartParagraph();
}

void KRichTextRenderer::RowTag(const KMarkupAttributes& attributes, bool closing) {
  if (closing) {
    if (Block().kind == KRichTextBlock::kCell && tooDeep_ == 0) CloseBlock(KRichTextBlock::kCell);
    row_.back() = -1;
    return;
  }
  KRichTextRow row;
  row.height = attributes.Size("height");
  row.padding = attributes.Integer("padding", row.padding);
  row.cellSpaces = attributes.Integer("cellspaces", row.cellSpaces);
  row.border = attributes.Integer("border", row.border);
  row.borderAlpha = attributes.HexByte("borderalpha", row.borderAlpha);
  AddItem(std::move(row));
  row_.back() = static_cast<int32_t>(Block().items.size()) - 1;
}

void KRichTextRenderer::CellTag(const KMarkupAttributes& attributes, bool closing) {
  if (closing) {
    CloseBlock(KRichTextBlock::kCell);
    return;
  }
  auto cell = std::make_unique<KRichTextBlock>();
  cell->kind = KRichTextBlock::kCell;
  cell->width = attributes.Size("width");
  cell->valign = ValueOf(attributes, "valign");
  cell->padding = attributes.Integer("padding", cell->padding);
  cell->autoSize = attributes.Integer("autosize", 0) != 0;
  cell->border = attributes.Integer("border", cell->border);
  cell->borderAlpha = attributes.HexByte("borderalpha", cell->borderAlpha);
  cell->background = ReadBackground(attributes);
  OpenBlock(std::move(cell));
}

void KRichTextRenderer::ListItemTag(const KMarkupAttributes& attributes, bool closing) {
  if (closing) {
    CloseBlock(KRichTextBlock::kListItem);
    return;
  }
  auto item = std::make_unique<KRichTextBlock>();
  item->kind = KRichTextBlock::kListItem;
  item->indent = attributes.Integer("size", 16);
  OpenBlock(std::move(item));
}

void KRichTextRenderer::OpenBlock(std::unique_ptr<KRichTextBlock> block) {
  if (tooDeep_ > 0 || static_cast<int32_t>(blocks_.size()) > kMaxBlockDepth) {
    ++tooDeep_;
    return;
  }
  KRichTextBlock* opened = block.get();
  if (opened->kind == KRichTextBlock::kCell) {
    KRichTextRow* row = CurrentRow();
    if (!row) {
      AddItem(KRichTextRow());
      row_.back() = static_cast<int32_t>(Block().items.size()) - 1;
      row = CurrentRow();
    }
    paragraph_.back() = -1;
    row->cells.push_back(std::move(block));
  } else {
    AddItem(std::move(block));
  }
  blocks_.push_back(opened);
  paragraph_.push_back(-1);
  row_.push_back(-1);
}

void KRichTextRenderer::CloseBlock(KRichTextBlock::Kind kind) {
  if (tooDeep_ > 0) {
    --tooDeep_;
    return;
  }
  for (size_t open = blocks_.size() - 1; open >= 1; --open) {
    if (blocks_[open]->kind != kind) continue;
    blocks_.resize(open);
    paragraph_.resize(open);
    row_.resize(open);
    return;
  }
}

void KRichTextRenderer::ImageTag(const KMarkupAttributes& attributes) {
  document_.elements.push_back(ReadElement(KRichTextElement::kImage, attributes));
  KRichTextParagraph* paragraph = CurrentParagraph();
  if (!paragraph) paragraph = &StartParagraph();
  // A one-character placeholder, so that line breaking treats the image as a word; the text
  // after it goes to a run of its own.
  if (!paragraph->runs.back().text.IsEmpty()) {
    KRichTextRun run;
    run.format = paragraph->runs.back().format;  // current: a format change would have left an empty run
    paragraph->runs.push_back(std::move(run));
  }
  KRichTextRun next;
  next.format = paragraph->runs.back().format;
  paragraph->runs.back().text = " ";
  paragraph->runs.back().element = static_cast<int32_t>(document_.elements.size()) - 1;
  paragraph->runs.push_back(std::move(next));
}

void KRichTextRenderer::GraphicTag(KRichTextElement::Kind kind, const KMarkupAttributes& attributes) {
  document_.elements.push_back(ReadElement(kind, attributes));
  AddItem(KRichTextGraphic{static_cast<int32_t>(document_.elements.size()) - 1});
}

// Opening plays every set of that name in order of definition; closing plays them back to
// front, each set's opening tags in reverse order as closing tags.
bool KRichTextRenderer::PlayTagSets(const KString& name, bool closing) {
  std::vector<size_t> sets;
  for (size_t i = 0; i < tagSets_.size(); ++i)
    if (tagSets_[i].name == name && !tagSets_[i].playing) sets.push_back(i);
  if (sets.empty()) return false;
  if (!closing) playedSets_.Push(name);
  auto play = [&](size_t set, size_t index, bool asClosing) {
    if (played_ >= kMaxPlayedTags) return;
    ++played_;
    tagSets_[set].playing = true;
    const KMarkupTagSet::Tag& tag = tagSets_[set].tags[index];  // no tag set is defined while playing
    HandleTag(tag.name, tag.attributes, asClosing);
    tagSets_[set].playing = false;
  };
  if (!closing) {
    for (const size_t set : sets)
      for (size_t t = 0; t < tagSets_[set].tags.size(); ++t) play(set, t, tagSets_[set].tags[t].closing);
  } else {
    for (auto set = sets.rbegin(); set != sets.rend(); ++set)
      for (size_t t = tagSets_[*set].tags.size(); t-- > 0;)
        if (!tagSets_[*set].tags[t].closing) play(*set, t, true);
    playedSets_.Pop();
  }
  RecomputeFormat();
  return true;
}

KRichTextDocument KRenderHelpMarkup(const KString& markup) {
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::SemanticTagSets());
  renderer.Render(markup);
  return renderer.TakeDocument();
}
