#include <gtest/gtest.h>

#include <string>

#include "ui/KHelpTexts.h"
#include "ui/KRichTextHtml.h"
#include "ui/KRichTextRenderer.h"

namespace {

std::string Page(const char* markup, const char* title = "Page") {
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::SemanticTagSets());
  renderer.Render(KString::FromUtf8(markup));
  KRichTextHtml html(KString::FromUtf8(title));
  html.Heading(1, KString::FromUtf8(title));
  html.Document(renderer.Document());
  return html.Finish();
}

bool Has(const std::string& page, const std::string& part) { return page.find(part) != std::string::npos; }

TEST(RichTextHtml, SemanticTagsBecomeClassesOfTheirName) {
  const std::string page = Page("<control>Threshold</control> <range>1 to 20</range> <cred>red</cred> <example>e</example>");
  EXPECT_TRUE(Has(page, "<span class=\"b control\" style=\"color:rgba(0,136,0,1.000);\">Threshold</span>")) << page;
  EXPECT_TRUE(Has(page, "class=\"range\" style=\"color:rgba(0,136,0,1.000);\">1 to 20<"));
  EXPECT_TRUE(Has(page, "<span class=\"cred\">red</span>"));
  EXPECT_TRUE(Has(page, "<span class=\"i example\">e</span>"));
  EXPECT_TRUE(Has(page, ".control,.value{color:#008800;font-weight:bold}"));
  EXPECT_TRUE(Has(page, "h1{background:#000;color:#fff"));
  EXPECT_TRUE(Has(page, "<h1>Page</h1>"));
}

TEST(RichTextHtml, NoTextInjectsMarkup) {
  // Entities in the help text, the page title, tag-set names and attribute values all stay text.
  const std::string page = Page("&lt;script&gt;alert(1)&lt;/script&gt; <tagset name='x\"><b'></tagset><x\"><b>t</x\"><b>"
                                "<img icon='\"><script>'><td width=\"1\"><hline width='\"'>",
                                "</title><script>x</script>");
  EXPECT_FALSE(Has(page, "<script")) << page;
  EXPECT_TRUE(Has(page, "&lt;script&gt;alert(1)&lt;/script&gt;"));
  EXPECT_TRUE(Has(page, "<title>&lt;/title&gt;&lt;script&gt;x&lt;/script&gt;</title>"));
  EXPECT_FALSE(Has(page, "class=\"x\""));
}

TEST(RichTextHtml, StructureFollowsTheDocument) {
  const std::string page = Page("<center>mid<p><p>next<br>line<li>one</li><li>two</li><tr><td width=25%>cell</td></tr><header1>H</header1>");
  EXPECT_TRUE(Has(page, "<div class=\"p\" style=\"text-align:center;\"><span>mid</span></div>\n<div class=\"p\" style=\"text-align:center;\"></div>"));
  EXPECT_TRUE(Has(page, "next<br>line"));
  EXPECT_TRUE(Has(page, "<ul>\n<li style=\"margin-left:0px\"><div class=\"p\" style=\"text-align:center;\"><span>one</span></div>\n</li>\n<li"));
  EXPECT_TRUE(Has(page, "<td style=\"padding:2px;width:25%;\">"));
  EXPECT_TRUE(Has(page, "<h3 style=\"text-align:center;\"><span class=\"l1\">H</span></h3>"));
}

TEST(RichTextHtml, IconsAreInlineVectorShapes) {
  const std::string page = Page("press <img icon=play> or <img icon=nosuch>");
  EXPECT_TRUE(Has(page, "<svg class=\"icon\" viewBox=\"0 0 16 16\"")) << page;
  EXPECT_TRUE(Has(page, "<polygon stroke=\"none\" points=\"4.50,2.50 13.00,8.00 4.50,13.50\"/></svg>"));
  EXPECT_TRUE(Has(page, "<span class=\"image\" title=\"nosuch\"></span>"));
}

}  // namespace
