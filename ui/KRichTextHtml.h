#pragma once

#include <string>

#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "ui/KRichTextDocument.h"

// Writes help as one self-contained HTML page (UTF-8, an inline style sheet, no scripts): page
// headings h1 to h6 on dark bands, and rendered documents with the semantic tags as classes of
// the same names. Every text is escaped, so no help text can put mark-up of its own into the page.
class TORVANE_API KRichTextHtml {
public:
  explicit KRichTextHtml(const KString& title);

  void Heading(int32_t level, const KString& text);  // level 1..6
  void Document(const KRichTextDocument& document);
  // The finished page; the writer is spent afterwards.
  std::string Finish();

  static void AppendEscaped(const KString& text, std::string& out);

private:
  void Block(const KRichTextDocument& document, const KRichTextBlock& block);
  void Paragraph(const KRichTextDocument& document, const KRichTextParagraph& paragraph);
  void Run(const KRichTextDocument& document, const KRichTextRun& run);
  void Row(const KRichTextDocument& document, const KRichTextRow& row);
  void Element(const KRichTextElement& element, bool inLine);

  std::string page_;
};
