#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextHtml.h"
#include "ui/KRichTextPlain.h"
#include "ui/KRichTextRenderer.h"

// Any text renders (after the semantic tag sets, as help does) into a document that the HTML
// and plain-text writers accept, and no text puts an element of its own into the page: the page
// holds exactly the elements the writer makes. A crash, a sanitizer report, a time-out or
// memory beyond libFuzzer's limit is a finding too (deep nesting, huge tables, tag sets that
// play each other).
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::SemanticTagSets());
  renderer.Render(KString::FromUtf8(text));
  const KRichTextDocument& document = renderer.Document();
  KRichTextHtml html(KString::FromUtf8(text));
  html.Document(document);
  const std::string page = html.Finish();
  for (const char* forbidden : {"<script", "<img", "<iframe", "<object", "<a ", "<link", "<meta http", "javascript:"})
    if (page.find(forbidden) != std::string::npos) std::abort();
  (void)KRichTextPlainText(document);
  return 0;
}
