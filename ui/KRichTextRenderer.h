#pragma once

#include <cstdint>
#include <vector>

#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "ui/KMarkupTagSet.h"
#include "ui/KMarkupTokenizer.h"
#include "ui/KRichTextDocument.h"

// Builds a KRichTextDocument from help-text mark-up. The renderer keeps stacks of style, colour
// (index and value), opacity and played tag sets, the current block and paragraph and the
// alignment; every tag changes that state, and text is appended to the current paragraph in the
// format the stacks give.
//
// Mark-up never fails: unknown tags are ignored, surplus closing tags never remove the bottom
// entry of a stack, and a closing tag pops its own stack whatever was pushed last.
//
// Bounds, so that no text can exhaust the machine: tables and list items nest at most
// kMaxBlockDepth deep (deeper ones are read as their content alone), tag sets are not played
// from inside themselves, and at most kMaxPlayedTags recorded tags are played per text.
class TORVANE_API KRichTextRenderer : public KMarkupTokenizer {
public:
  static constexpr int32_t kMaxBlockDepth = 32;
  static constexpr int32_t kMaxPlayedTags = 1 << 16;

  KRichTextRenderer();
  ~KRichTextRenderer() override;

  // Adds the text to the document, in the state the previous texts left (so that a text of tag
  // set definitions can go first).
  void Render(const KString& text) { Tokenize(text); }

  const KRichTextDocument& Document() const noexcept { return document_; }
  // Hands the document over and starts an empty one; tag sets stay defined.
  KRichTextDocument TakeDocument();
  int32_t Alignment() const noexcept { return alignment_; }
  const std::vector<KMarkupTagSet>& TagSets() const noexcept { return tagSets_; }

protected:
  void HandleText(const KString& text) override;
  void HandleTag(const KString& name, const KMarkupAttributes& attributes, bool closing) override;

private:
  // A stack whose bottom entry is never popped.
  template <class T>
  class Stack {
  public:
    explicit Stack(T bottom) { items_.push_back(std::move(bottom)); }
    void Push(T value) { items_.push_back(std::move(value)); }
    void Pop() noexcept {
      if (items_.size() >= 2) items_.pop_back();
    }
    const T& Top() const noexcept { return items_.back(); }

  private:
    std::vector<T> items_;
  };

  void Reset();
  KRichTextBlock& Block() noexcept { return *blocks_.back(); }
  KRichTextParagraph* CurrentParagraph() noexcept;
  KRichTextParagraph& StartParagraph();
  void EndParagraph() noexcept { paragraph_.back() = -1; }
  void RecomputeFormat();
  void Append(const KString& text);
  void ParagraphTag(int32_t alignment, const KMarkupAttributes& attributes, bool closing);
  void HeaderTag(int32_t level, bool closing);
  void RowTag(const KMarkupAttributes& attributes, bool closing);
  void CellTag(const KMarkupAttributes& attributes, bool closing);
  void ListItemTag(const KMarkupAttributes& attributes, bool closing);
  void ImageTag(const KMarkupAttributes& attributes);
  void GraphicTag(KRichTextElement::Kind kind, const KMarkupAttributes& attributes);
  // Opens a sub-block item in the current block (or counts it as too deep).
  void OpenBlock(std::unique_ptr<KRichTextBlock> block);
  // Closes blocks up to and including the innermost one of that kind, if any is open.
  void CloseBlock(KRichTextBlock::Kind kind);
  KRichTextRow* CurrentRow() noexcept;
  bool PlayTagSets(const KString& name, bool closing);
  template <class Item>
  Item& AddItem(Item item);

  KRichTextDocument document_;
  Stack<int32_t> styles_{kStyleNormal};
  Stack<int32_t> colourIndices_{kColourDefault};
  Stack<uint32_t> colours_{0};
  Stack<uint8_t> opacities_{255};
  Stack<KString> playedSets_{KString()};
  int32_t inversions_ = 0;  // depth of ci
  int32_t alignment_ = kParagraphLeft;
  int32_t heading_ = 0;
  // The open blocks, innermost last, with each one's current paragraph and row (item indices,
  // -1 for none), and how many more were opened beyond the depth limit.
  std::vector<KRichTextBlock*> blocks_;
  std::vector<int32_t> paragraph_;
  std::vector<int32_t> row_;
  int32_t tooDeep_ = 0;
  std::vector<KMarkupTagSet> tagSets_;
  int32_t defining_ = -1;  // index of the tag set under definition
  int32_t played_ = 0;
};

// Help mark-up read after the semantic tag sets (name, value, control, ...) that every help text uses.
TORVANE_API KRichTextDocument KRenderHelpMarkup(const KString& markup);
