#include <cstddef>
#include <cstdint>
#include <cctype>
#include <cstdlib>
#include <string>
#include <string_view>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextHtml.h"
#include "ui/KRichTextPlain.h"
#include "ui/KRichTextRenderer.h"

namespace {
// The elements and attributes the writer makes; anything else in the page came from the text.
constexpr std::string_view kElements[] = {"!DOCTYPE", "html", "head", "meta", "title", "style", "body", "h1", "h2", "h3", "h4",
                                          "h5", "h6", "div", "span", "br", "ul", "li", "table", "tr", "td", "hr", "svg",
                                          "polyline", "polygon", "circle"};
constexpr std::string_view kAttributes[] = {"html",   "lang",         "charset",         "class", "style", "title", "viewBox",
                                            "fill",   "stroke",       "stroke-width",    "points", "cx",   "cy",    "r",
                                            "stroke-linejoin"};

template <size_t N>
bool Listed(std::string_view word, const std::string_view (&list)[N]) {
  for (const std::string_view item : list)
    if (word == item) return true;
  return false;
}

// Reads every tag of the page: its name and attribute names must be the writer's own, and its
// quoted values must close.
bool OnlyOwnMarkup(const std::string& page) {
  auto isName = [](char c) { return std::isalnum(static_cast<unsigned char>(c)) || c == '!' || c == '-'; };
  for (size_t at = page.find('<'); at != std::string::npos; at = page.find('<', at)) {
    size_t i = at + 1 + (page[at + 1] == '/');
    const size_t start = i;
    while (i < page.size() && isName(page[i])) ++i;
    if (!Listed(std::string_view(page).substr(start, i - start), kElements)) return false;
    while (i < page.size() && page[i] != '>') {
      if (page[i] == ' ' || (page[i] == '/' && page[i + 1] == '>')) {
        ++i;
        continue;
      }
      const size_t nameStart = i;
      while (i < page.size() && isName(page[i])) ++i;
      if (!Listed(std::string_view(page).substr(nameStart, i - nameStart), kAttributes)) return false;
      if (i < page.size() && page[i] == '=') {
        if (page[i + 1] != '"') return false;
        i = page.find('"', i + 2);
        if (i == std::string::npos) return false;
        ++i;
      }
    }
    at = i;
  }
  return true;
}
}  // namespace

// Any text renders (after the semantic tag sets, as help does) into a document that the HTML
// and plain-text writers accept, and no text puts markup of its own into the page: every tag
// and attribute there is one the writer makes. A crash, a sanitizer report, a time-out or memory
// beyond libFuzzer's limit is a finding too (deep nesting, huge tables, tag sets that play each
// other).
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::SemanticTagSets());
  renderer.Render(KString::FromUtf8(text));
  const KRichTextDocument& document = renderer.Document();
  KRichTextHtml html(KString::FromUtf8(text));
  html.Heading(static_cast<int32_t>(size % 8), KString::FromUtf8(text));
  html.Document(document);
  if (!OnlyOwnMarkup(html.Finish())) std::abort();
  (void)KRichTextPlainText(document);
  return 0;
}
