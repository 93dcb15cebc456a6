#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "core/Element.h"
#include "kernel/KArray.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

// Builds a settings tree from XML text in UTF-8, with or without a byte-order mark (malformed
// UTF-8 becomes U+FFFD, whatever encoding the declaration names).
//
// Accepted: the declaration and other processing instructions and comments (all skipped),
// elements, attributes in double or single quotes, character data, CDATA sections, the five
// named entities and decimal or hexadecimal character references (any character but a
// surrogate, U+0000 included, so that everything the writer escapes reads back). Line ends are
// normalised to line feeds, and tabs and line ends inside attribute values to spaces, as XML
// prescribes. A run of character data between two pieces of markup that holds nothing but
// literal whitespace is formatting and dropped; all other character data and CDATA of an
// element, wherever it stands among the children, is joined into the element's text. A
// document type declaration is refused: settings never carry one, and refusing it keeps
// entity definitions out of the reader.
//
// The work is one pass, linear in the text apart from sorting the attributes of an element
// that arrive unsorted. Parsing keeps its own stack of open elements instead of recursing and
// refuses more than Element::kMaxDepth levels.
//
// Malformed text throws KException "Invalid file contents. " followed by one of
//   Special character found where attribute was expected. '{0}'   (punctuation such as " or =)
//   Invalid character found where attribute was expected. '{0}'   (a digit, a missing blank,
//                                                                  "=" or quote)
//   No element name found. '{0}'
//   Invalid closing element syntax. '{0}'
//   Invalid element finishing sequence. '{0}'                      ("/" not followed by ">")
//   Invalid special element sequence. '{0}'                        ("<!" or "<?" constructs)
//   Invalid character found in attribute value. '{0}'              (a literal "<")
//   XML entity cannot have empty name. '{0}'                       ("&;")
//   Invalid entity reference. '{0}'
//   Attribute found twice. '{0}'                                   (the attribute's name)
//   Closing element does not match. '{0}'
//   Content found outside the root element. '{0}'
//   Elements nested more than 256 deep. '{0}'
//   Unexpected end of text. '{0}'                                  (inside a tag, comment,
//                                                                  CDATA section or instruction)
//   Element is not closed. '{0}'                                   (the innermost open name)
//   No root element found.
// where '{0}' holds up to 20 characters of the text from the point of failure: the offending
// character, or the start of the construct that is malformed or unfinished.
class TORVANE_API KXMLReader {
public:
  static constexpr int32_t kExcerptCharacters = 20;

  // The tree, or an exception; nothing outside is touched either way.
  static Element Read(std::string_view text);

private:
  struct OpenElement {
    Element* element;
    const char* name;  // in the text, to match the closing tag byte for byte
    size_t nameLength;
  };

  explicit KXMLReader(std::string_view text) noexcept : at_(text.data()), end_(text.data() + text.size()) {}

  Element Parse();
  void ReadStartTag();
  void ReadAttribute(Element& element, const char* tag);
  void SortAttributes(Element& element) const;
  void ReadClosingTag();
  void ReadSpecial();
  void ReadProcessingInstruction();
  void ReadCharacterData();
  // Decodes character data up to `stop` (or the end) into scratch_; answers whether any of it
  // was more than literal whitespace.
  bool Decode(char stop, bool attribute);
  void ReadReference();
  // Moves past the next occurrence of `terminator`, and answers where it began.
  const char* SkipPast(std::string_view terminator, const char* construct);

  bool LookingAt(std::string_view text) const noexcept;
  bool SkipSpace() noexcept;
  void SkipName() noexcept;
  KString Excerpt(const char* from) const;
  [[noreturn]] void Fail(const KString& message) const;
  [[noreturn]] void FailAt(const KString& pattern, const char* from) const;

  const char* at_;
  const char* const end_;
  Element root_;
  bool rooted_ = false;  // the root element has begun
  KArray<OpenElement> open_;
  std::string scratch_;
};
