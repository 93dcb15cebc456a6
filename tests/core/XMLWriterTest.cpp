#include <gtest/gtest.h>

#include "core/Element.h"
#include "core/KXMLWriter.h"
#include "tests/core/TraceCapture.h"

// The indented layout, with what a reader would change escaped.
TEST(KXMLWriter, WritesTheIndentedLayoutEscapingWhatAReaderWouldChange) {
  Element root("KPlugin");
  root.SetAttribute("Version", "1.2");
  root.SetAttribute("Bypass", KString::FromUtf8(std::string("<&>\"' \t\n\r\x01\xC3\xA9", 12)));
  root.AddChild("LFOs");
  Element& controllers = root.AddChild("Controllers");
  controllers.AddChild("Controller").SetAttribute("CC", "7");
  controllers.SetText(" <&> x\t");  // an element with text keeps its content on one line
  EXPECT_EQ(KXMLWriter::Write(root),
            "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
            "<KPlugin Bypass=\"&lt;&amp;&gt;&quot;' &#9;&#10;&#13;&#1;\xC3\xA9\" Version=\"1.2\">\n"
            "\t<LFOs/>\n"
            "\t<Controllers>&#32;&lt;&amp;&gt; x&#9;<Controller CC=\"7\"/></Controllers>\n"
            "</KPlugin>\n");
  EXPECT_EQ(KFailureOf([&] { KXMLWriter::Write(root, "utf-16"); }), "Unsupported XML encoding. 'utf-16'");
}
