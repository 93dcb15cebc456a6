#pragma once

#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "ui/KMarkupAttributes.h"

// Splits help-text mark-up into plain-text runs and tags and hands each to a virtual handler,
// so that the on-screen layout and the HTML exporter read the mark-up the same way. Placeholders
// ("{0}") are the formatter's business: they are filled before the text arrives here.
//
// Reading rules:
// - "<name attr=value attr2="quoted value">" is an opening tag, "</name>" a closing one. A name
//   starts with a letter and continues with letters, digits, "_" and "-"; names are
//   case-sensitive. Attributes are separated by blanks (spaces, tabs, line ends); an attribute
//   without "=" has an empty value. A value is either quoted in double or single quotation
//   marks (which are removed; ">" and blanks may stand inside) or runs to the next blank or ">".
// - A "/" just before ">" marks an element without content ("<br/>", "<img number=0/>"): it is
//   read as the opening tag alone.
// - "<br>", "<br/>" and "<br />" never reach the tag handler: they are a line break, handed to
//   the text handler as "\n". A line end written in the text is a line break as well.
// - A "<" that does not begin a complete tag (not followed by a name or "/name", or with no
//   ">" before the text ends or an unterminated quotation) is ordinary text, as is a ">" outside
//   a tag.
// - Entities, in text and in attribute values: "&lt;", "&gt;", "&amp;", "&quot;", "&apos;",
//   "&nbsp;" (U+00A0) and numeric "&#nnn;" / "&#xhhh;". Anything else beginning with "&" is
//   ordinary text; a numeric reference to no character (0, a surrogate, beyond U+10FFFF) gives
//   U+FFFD.
class TORVANE_API KMarkupTokenizer {
public:
  virtual ~KMarkupTokenizer() = default;

  // Reads the whole text, calling the handlers in order of appearance.
  void Tokenize(const KString& text);

protected:
  // A run of text between tags, entities decoded; never empty.
  virtual void HandleText(const KString& text) = 0;
  virtual void HandleTag(const KString& name, const KMarkupAttributes& attributes, bool closing) = 0;
};
