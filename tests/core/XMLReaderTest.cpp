#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "kernel/KException.h"

namespace {

std::string ReadFailure(const std::string& text) {
  try {
    KXMLReader::Read(text);
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}

std::vector<std::string> AttributeNames(const Element& element) {
  std::vector<std::string> names;
  for (const auto& attribute : element.Attributes()) names.push_back(attribute.name.ToUtf8());
  return names;
}

std::string Attribute(const Element& element, const char* name) {
  return element.GetAttribute(KString::FromUtf8(name), "(absent)").ToUtf8();
}

}  // namespace

TEST(KXMLReader, ReadsTheFullSyntaxAndSkipsWhatCarriesNoSettings) {
  const Element root = KXMLReader::Read(
      "\xEF\xBB\xBF<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
      "<!-- leading comment -->\n"
      "<Root z='single \"quoted\"' a=\"double 'quoted'\" m = \"&lt;&gt;&amp;&quot;&apos;&#65;&#x42;&#x1F3B5;\">\n"
      "\t<?pi ignored <Fake/> ?>\n"
      "\t<Empty/>\n"
      "\t<Text>one <!-- split --> two<![CDATA[ <not markup> &amp; ]]></Text>\n"
      "\t<Spaced  b='1'  ></Spaced >\n"
      "</Root>\n"
      "<!-- trailing comment --><?trailing?>\n");
  EXPECT_EQ(root.GetName().ToUtf8(), "Root");
  EXPECT_EQ(AttributeNames(root), (std::vector<std::string>{"a", "m", "z"}));
  EXPECT_EQ(Attribute(root, "z"), "single \"quoted\"");
  EXPECT_EQ(Attribute(root, "a"), "double 'quoted'");
  EXPECT_EQ(Attribute(root, "m"), "<>&\"'AB\xF0\x9F\x8E\xB5");
  EXPECT_EQ(root.GetText().ToUtf8(), "");  // indentation between children is formatting
  ASSERT_EQ(root.ChildCount(), 3);
  EXPECT_EQ(root.GetChild(0).GetName().ToUtf8(), "Empty");
  EXPECT_EQ(root.GetChild(1).GetText().ToUtf8(), "one  two <not markup> &amp; ");
  EXPECT_EQ(Attribute(root.GetChild(2), "b"), "1");
}

TEST(KXMLReader, NormalisesLineEndsAndAttributeWhitespaceButKeepsReferences) {
  const Element root = KXMLReader::Read("<R a=\"x\r\ny\tz\nw\" b=\"&#13;&#10;&#9;\">\r\n\tline\r\nnext\rend<![CDATA[\r\n]]></R>");
  EXPECT_EQ(Attribute(root, "a"), "x y z w");
  EXPECT_EQ(Attribute(root, "b"), "\r\n\t");
  EXPECT_EQ(root.GetText().ToUtf8(), "\n\tline\nnext\nend\n");  // not whitespace only, so kept whole
  EXPECT_EQ(KXMLReader::Read("<R> <A/>&#32;</R>").GetText().ToUtf8(), " ");  // a reference is content
  EXPECT_EQ(KXMLReader::Read("<R><![CDATA[ ]]></R>").GetText().ToUtf8(), " ");
  EXPECT_EQ(KXMLReader::Read("<R>&#0;</R>").GetText().Length(), 1);
}

// One minimal document per message, with the excerpt each produces.
TEST(KXMLReader, RefusesMalformedTextWithAMessageNamingThePlace) {
  const std::string prefix = "Invalid file contents. ";
  const struct {
    const char* text;
    const char* message;
  } cases[] = {
      {"<a =\"1\"/>", "Special character found where attribute was expected. '=\"1\"/>'"},
      {"<a \"x\"/>", "Special character found where attribute was expected. '\"x\"/>'"},
      {"<a b=\"1\"c=\"2\"/>", "Invalid character found where attribute was expected. 'c=\"2\"/>'"},
      {"<a 1=\"2\"/>", "Invalid character found where attribute was expected. '1=\"2\"/>'"},
      {"<a b/>", "Invalid character found where attribute was expected. '/>'"},
      {"<a b=1/>", "Invalid character found where attribute was expected. '1/>'"},
      {"< a/>", "No element name found. '< a/>'"},
      {"<a><1/></a>", "No element name found. '<1/></a>'"},
      {"<a></ a>", "Invalid closing element syntax. '</ a>'"},
      {"<a></a b>", "Invalid closing element syntax. '</a b>'"},
      {"<a/ >", "Invalid element finishing sequence. '/ >'"},
      {"<!DOCTYPE a><a/>", "Invalid special element sequence. '<!DOCTYPE a><a/>'"},
      {"<a><!-x--></a>", "Invalid special element sequence. '<!-x--></a>'"},
      {"<? x?><a/>", "Invalid special element sequence. '<? x?><a/>'"},
      {"<a b=\"<\"/>", "Invalid character found in attribute value. '<\"/>'"},
      {"<a>&;</a>", "XML entity cannot have empty name. '&;</a>'"},
      {"<a>&nbsp;</a>", "Invalid entity reference. '&nbsp;</a>'"},
      {"<a>&amp</a>", "Invalid entity reference. '&amp</a>'"},
      {"<a>&#xD800;</a>", "Invalid entity reference. '&#xD800;</a>'"},
      {"<a>&#1114112;</a>", "Invalid entity reference. '&#1114112;</a>'"},
      {"<a>&#99999999999999999999;</a>", "Invalid entity reference. '&#999999999999999999'"},
      {"<a>&#;</a>", "Invalid entity reference. '&#;</a>'"},
      {"<a b='1' b=\"2\"/>", "Attribute found twice. 'b'"},
      {"<a><b></a></b>", "Closing element does not match. '</a></b>'"},
      {"<a/></a>", "Closing element does not match. '</a>'"},
      {"<a/><b/>", "Content found outside the root element. '<b/>'"},
      {"x<a/>", "Content found outside the root element. 'x<a/>'"},
      {"<a/>&amp;", "Content found outside the root element. '&amp;'"},
      {"<![CDATA[x]]><a/>", "Content found outside the root element. '<![CDATA[x]]><a/>'"},
      {"<a b=\"1", "Unexpected end of text. '<a b=\"1'"},
      {"<a><!-- open", "Unexpected end of text. '<!-- open'"},
      {"<a><![CDATA[x]]", "Unexpected end of text. '<![CDATA[x]]'"},
      {"<?xml version='1.0'", "Unexpected end of text. '<?xml version='1.0''"},
      {"<a></a", "Unexpected end of text. '</a'"},
      {"<a><b>text", "Element is not closed. 'b'"},
      {"", "No root element found."},
      {"\xEF\xBB\xBF \n<!-- only -->", "No root element found."},
  };
  for (const auto& c : cases) EXPECT_EQ(ReadFailure(c.text), prefix + c.message) << c.text;
}

TEST(KXMLReader, ExcerptHoldsTwentyCharactersNotBytes) {
  const std::string tail = "\xC3\xA9\xE2\x82\xAC\xF0\x9F\x8E\xB5" "abcdefghijklmnopqrstuvwxyz";  // 3 wide, then ASCII
  EXPECT_EQ(ReadFailure("<a =" + tail + "/>"),
            "Invalid file contents. Special character found where attribute was expected. '=" +
                tail.substr(0, 9 + 16) + "'");
}

TEST(KXMLReader, CapsNestingDepthWithoutRecursing) {
  const auto nested = [](int depth) {
    std::string text;
    for (int i = 0; i < depth; ++i) text += "<e>";
    for (int i = 0; i < depth; ++i) text += "</e>";
    return text;
  };
  const Element deepest = KXMLReader::Read(nested(Element::kMaxDepth));
  const Element* e = &deepest;
  int depth = 1;
  for (; e->ChildCount() == 1; e = &e->GetChild(0)) ++depth;
  EXPECT_EQ(depth, Element::kMaxDepth);

  const std::string refused = "Invalid file contents. Elements nested more than 256 deep. ";
  EXPECT_EQ(ReadFailure(nested(Element::kMaxDepth + 1)), refused + "'<e></e></e></e></e><'");
  EXPECT_EQ(ReadFailure(nested(100000)), refused + "'<e><e><e><e><e><e><e'");
}
