#include <gtest/gtest.h>

#include <string>

#include "core/Element.h"
#include "core/KXMLWriter.h"
#include "kernel/KException.h"

namespace {

KString Text(const std::string& utf8) { return KString::FromUtf8(utf8); }

std::string WriteFailure(const Element& root, const KString& encoding = "utf-8") {
  try {
    KXMLWriter::Write(root, encoding);
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}

// Root with attributes set out of order, an empty child, and a child holding a grandchild.
Element SampleTree() {
  Element root(Text("KPlugin"));
  root.SetAttribute("Version", "1.2");
  root.SetAttribute("Bypass", "1");
  root.AddChild(KString("LFOs"));
  Element& controllers = root.AddChild(KString("Controllers"));
  controllers.SetAttribute("SingleChannel", "0");
  controllers.AddChild(KString("Controller")).SetAttribute("CC", "7");
  return root;
}

}  // namespace

TEST(KXMLWriter, WritesBothLayoutsOfTheSameTree) {
  EXPECT_EQ(KXMLWriter::Write(SampleTree()),
            "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
            "<KPlugin Bypass=\"1\" Version=\"1.2\">\n"
            "\t<LFOs/>\n"
            "\t<Controllers SingleChannel=\"0\">\n"
            "\t\t<Controller CC=\"7\"/>\n"
            "\t</Controllers>\n"
            "</KPlugin>\n");
  EXPECT_EQ(KXMLWriter::Write(SampleTree(), "UTF-8", KXMLWriter::kCompact),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>"
            "<KPlugin Bypass=\"1\" Version=\"1.2\"><LFOs/><Controllers SingleChannel=\"0\">"
            "<Controller CC=\"7\"/></Controllers></KPlugin>");
}

TEST(KXMLWriter, EscapesMarkupControlsAndLeadingSpace) {
  Element root(Text("R"));
  root.SetAttribute("a", Text(std::string("<&>\"' \t\n\r\x01", 10) + std::string(1, '\0')));
  root.SetText(Text(" <&>\"' x\t"));
  EXPECT_EQ(KXMLWriter::Write(root, "utf-8", KXMLWriter::kCompact),
            "<?xml version=\"1.0\" encoding=\"utf-8\"?>"
            "<R a=\"&lt;&amp;&gt;&quot;' &#9;&#10;&#13;&#1;&#0;\">&#32;&lt;&amp;&gt;\"' x&#9;</R>");

  Element spaces(Text("R"));
  spaces.SetText(Text("  "));  // only the first space needs a reference to keep it from being formatting
  EXPECT_EQ(KXMLWriter::Write(spaces, "utf-8", KXMLWriter::kCompact).substr(38), "<R>&#32; </R>");
}

TEST(KXMLWriter, KeepsTheContentOfAnElementWithTextOnOneLine) {
  Element root(Text("Root"));
  Element& mixed = root.AddChild(KString("Mixed"));
  mixed.SetText("note");
  mixed.AddChild(KString("Inner")).AddChild(KString("Leaf"));
  root.AddChild(KString("After")).SetText("t");
  EXPECT_EQ(KXMLWriter::Write(root).substr(39),
            "<Root>\n"
            "\t<Mixed>note<Inner><Leaf/></Inner></Mixed>\n"
            "\t<After>t</After>\n"
            "</Root>\n");
}

TEST(KXMLWriter, EncodesUtf16AsUtf8OrAsReferencesForOtherEncodings) {
  Element root(Text("Gr\xC3\xBC\xC3\x9F"));  // "Grüß"
  const std::u16string value = u"\u00E9\u20AC\U0001F3B5";
  root.SetAttribute("v", KString::FromUtf16(value.data(), static_cast<int32_t>(value.size())));
  const char16_t lone[] = {u'a', 0xD800, u'b', 0xDC00};  // unpaired halves in both orders
  root.SetAttribute("w", KString::FromUtf16(lone, 4));
  EXPECT_EQ(KXMLWriter::Write(root, "utf-8", KXMLWriter::kCompact).substr(38),
            "<Gr\xC3\xBC\xC3\x9F v=\"\xC3\xA9\xE2\x82\xAC\xF0\x9F\x8E\xB5\" w=\"a\xEF\xBF\xBD" "b\xEF\xBF\xBD\"/>");

  root.SetName("Root");
  EXPECT_EQ(KXMLWriter::Write(root, "ISO-8859-1", KXMLWriter::kCompact),
            "<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?>"
            "<Root v=\"&#233;&#8364;&#127925;\" w=\"a&#65533;b&#65533;\"/>");
  root.SetName(Text("Gr\xC3\xBC\xC3\x9F"));
  EXPECT_EQ(WriteFailure(root, "us-ascii"), "XML name cannot be written in encoding us-ascii. 'Gr\xC3\xBC\xC3\x9F'");
}

TEST(KXMLWriter, RefusesNamesEncodingsAndDepthItCannotWriteReadably) {
  Element root(Text("Root"));
  EXPECT_EQ(WriteFailure(root, "utf-16"), "Unsupported XML encoding. 'utf-16'");
  EXPECT_EQ(WriteFailure(root, "UCS-4"), "Unsupported XML encoding. 'UCS-4'");
  EXPECT_EQ(WriteFailure(root, "utf-8\""), "Unsupported XML encoding. 'utf-8\"'");
  EXPECT_EQ(WriteFailure(root, ""), "Unsupported XML encoding. ''");

  for (const char* name : {"", "1st", "-a", "a b", "a<b", "a=b", "a\"b"}) {
    Element bad(Text(name));
    EXPECT_EQ(WriteFailure(bad), std::string("Invalid XML name. '") + name + "'");
    Element attribute(Text("Root"));
    attribute.SetAttribute(Text(name), "1");
    EXPECT_EQ(WriteFailure(attribute), std::string("Invalid XML name. '") + name + "'");
  }
  Element fine(Text("_a:b-c.9"));
  fine.SetAttribute(Text(":x"), "1");
  EXPECT_EQ(KXMLWriter::Write(fine, "utf-8", KXMLWriter::kCompact).substr(38), "<_a:b-c.9 :x=\"1\"/>");

  Element chain(Text("L1"));
  Element* deepest = &chain;
  for (int level = 2; level <= Element::kMaxDepth; ++level) deepest = &deepest->AddChild(Text("L" + std::to_string(level)));
  EXPECT_NO_THROW(KXMLWriter::Write(chain));
  deepest->AddChild(KString("TooDeep"));
  EXPECT_EQ(WriteFailure(chain), "Elements nested more than 256 deep. 'TooDeep'");
}
