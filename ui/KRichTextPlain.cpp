#include "ui/KRichTextPlain.h"

#include <type_traits>

namespace {

void AppendBlock(const KRichTextDocument& document, const KRichTextBlock& block, const std::string& indent, std::string& out);

std::string ElementText(const KRichTextElement& e) {
  if (e.kind == KRichTextElement::kHorizontalLine) return std::string(40, '-');
  if (e.kind != KRichTextElement::kImage) return "[#]";
  return "[" + (e.icon.IsEmpty() ? std::string("image") : e.icon.ToUtf8()) + "]";
}

void AppendLine(const std::string& indent, const std::string& text, std::string& out) {
  out.append(indent);
  for (const char c : text) {
    out.push_back(c);
    if (c == '\n') out.append(indent);
  }
  out.push_back('\n');
}

std::string ParagraphText(const KRichTextDocument& document, const KRichTextParagraph& paragraph) {
  std::string text;
  for (const KRichTextRun& run : paragraph.runs)
    text.append(run.element >= 0 ? ElementText(document.elements[static_cast<size_t>(run.element)]) : run.text.ToUtf8());
  return text;
}

void AppendBlock(const KRichTextDocument& document, const KRichTextBlock& block, const std::string& indent, std::string& out) {
  for (const KRichTextItem& item : block.items) {
    std::visit(
        [&](const auto& value) {
          using T = std::decay_t<decltype(value)>;
          if constexpr (std::is_same_v<T, KRichTextParagraph>) {
            AppendLine(indent, ParagraphText(document, value), out);
          } else if constexpr (std::is_same_v<T, KRichTextRow>) {
            std::string line;
            for (const auto& cell : value.cells) {
              std::string text;
              AppendBlock(document, *cell, "", text);
              while (!text.empty() && text.back() == '\n') text.pop_back();
              for (char& c : text) c = c == '\n' ? ' ' : c;
              line.append(line.empty() ? "" : " | ").append(text);
            }
            AppendLine(indent, line, out);
          } else if constexpr (std::is_same_v<T, KRichTextGraphic>) {
            AppendLine(indent, ElementText(document.elements[static_cast<size_t>(value.element)]), out);
          } else {
            std::string lines;
            AppendBlock(document, *value, "", lines);
            // The first line carries the bullet, the others line up behind it.
            out.append(indent).append("  - ");
            for (size_t i = 0; i < lines.size(); ++i) {
              out.push_back(lines[i]);
              if (lines[i] == '\n' && i + 1 < lines.size()) out.append(indent).append("    ");
            }
          }
        },
        item);
  }
}

}  // namespace

std::string KRichTextPlainText(const KRichTextDocument& document) {
  std::string out;
  AppendBlock(document, document.body, "", out);
  return out;
}
