#include <gtest/gtest.h>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "tests/core/TraceCapture.h"

// One minimal document per message, and the excerpt of at most 20 characters each names.
TEST(KXMLReader, RefusesMalformedTextWithAMessageNamingThePlace) {
  const std::string wide = "\xC3\xA9\xE2\x82\xAC\xF0\x9F\x8E\xB5";  // three characters of 2, 3 and 4 bytes
  const std::pair<std::string, std::string> cases[] = {
      {"<a =" + wide + "abcdefghijklmnopqrstuvwxyz/>",
       "Special character found where attribute was expected. '=" + wide + "abcdefghijklmnop'"},
      {"<a b=\"1\"c=\"2\"/>", "Invalid character found where attribute was expected. 'c=\"2\"/>'"},
      {"<a><1/></a>", "No element name found. '<1/></a>'"},
      {"<a></ a>", "Invalid closing element syntax. '</ a>'"},
      {"<a/ >", "Invalid element finishing sequence. '/ >'"},
      {"<!DOCTYPE a><a/>", "Invalid special element sequence. '<!DOCTYPE a><a/>'"},
      {"<a b=\"<\"/>", "Invalid character found in attribute value. '<\"/>'"},
      {"<a>&;</a>", "XML entity cannot have empty name. '&;</a>'"},
      {"<a>&nbsp;</a>", "Invalid entity reference. '&nbsp;</a>'"},
      {"<a>&#99999999999999999999;</a>", "Invalid entity reference. '&#999999999999999999'"},
      {"<a b='1' b=\"2\"/>", "Attribute found twice. 'b'"},
      {"<a><b></a></b>", "Closing element does not match. '</a></b>'"},
      {"<a/><b/>", "Content found outside the root element. '<b/>'"},
      {"<a b=\"1", "Unexpected end of text. '<a b=\"1'"},
      {"<a><![CDATA[x]]", "Unexpected end of text. '<![CDATA[x]]'"},
      {"<a><b>text", "Element is not closed. 'b'"},
      {"\xEF\xBB\xBF \n<!-- only -->", "No root element found."},
  };
  for (const auto& [text, message] : cases)
    EXPECT_EQ(KFailureOf([&] { KXMLReader::Read(text); }), "Invalid file contents. " + message) << text;
}

TEST(KXMLReader, CapsNestingDepthWithoutRecursing) {
  const auto nested = [](int depth) {
    std::string text;
    for (int i = 0; i < 2 * depth; ++i) text += i < depth ? "<e>" : "</e>";
    return text;
  };
  const Element deepest = KXMLReader::Read(nested(Element::kMaxDepth));
  int depth = 1;
  for (const Element* e = &deepest; e->ChildCount() == 1; e = &e->GetChild(0)) ++depth;
  EXPECT_EQ(depth, Element::kMaxDepth);
  const std::string refused = "Invalid file contents. Elements nested more than 256 deep. ";
  EXPECT_EQ(KFailureOf([&] { KXMLReader::Read(nested(Element::kMaxDepth + 1)); }), refused + "'<e></e></e></e></e><'");
  EXPECT_EQ(KFailureOf([&] { KXMLReader::Read(nested(100000)); }), refused + "'<e><e><e><e><e><e><e'");
}
