#pragma once

#include <string>

#include "core/Element.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

// Turns a settings tree into XML text.
//
// The text starts with the declaration <?xml version="1.0" encoding="..."?>. Attributes follow
// their element's name in sorted order as name="value"; an element without text or children
// closes as <Name a="1"/>.
//
// Layouts: kIndented puts the declaration and every element on a line of its own (line feeds),
// indented by one tab per nesting depth below the root, closing tags of elements with children
// on their own line too. kCompact writes the same markup with no whitespace between tags at
// all: the smallest text, for host chunks and clipboard copies.
//
// An element's text comes right after its start tag, before its children. Inside an element
// that has text no line breaks or tabs are written even in the indented layout, because there
// they would become part of the text when read back.
//
// Escaping, chosen so that any tree reads back equal:
// - "&", "<" and ">" everywhere as &amp; &lt; &gt;, '"' in attribute values as &quot; (values
//   are always in double quotes, so "'" stays literal);
// - every control character U+0000..U+001F, tab, line feed and carriage return included, as a
//   decimal reference (&#9;), since a reader normalises literal line ends and whitespace;
// - a space at the start of an element's text as &#32;, so that no text is ever pure literal
//   whitespace, which the reader drops as formatting.
// Unpaired surrogates are written as U+FFFD, keeping the output well-formed.
//
// Encodings: "utf-8" (any letter case) writes UTF-8. Any other ASCII-compatible name (such as
// "us-ascii" or "iso-8859-1") writes only ASCII, characters above U+007F as references; such a
// document cannot carry a non-ASCII name. Names of the UTF-16, UTF-32 and UCS families, and
// anything that is not an XML encoding name, are refused.
//
// Failures (KException): "Unsupported XML encoding. '{0}'", "Invalid XML name. '{0}'" (empty,
// or a character a name may not hold), "XML name cannot be written in encoding {1}. '{0}'",
// and "Elements nested more than 256 deep. '{0}'" with the name of the element too deep.
class TORVANE_API KXMLWriter {
public:
  enum Layout { kIndented, kCompact };

  static std::string Write(const Element& root, const KString& encoding = "utf-8", Layout layout = kIndented);

private:
  KXMLWriter(std::string& out, const KString& encoding, bool asciiOnly) noexcept
      : out_(out), encoding_(encoding), asciiOnly_(asciiOnly) {}

  void WriteElement(const Element& element, int32_t depth, bool indent);
  // Checks the name, then writes it.
  void WriteName(const KString& name);
  template <class Unit>
  void WriteEscaped(const Unit* units, int32_t length, bool attribute);
  void WriteReference(uint32_t character);

  std::string& out_;
  const KString& encoding_;
  const bool asciiOnly_;
};
