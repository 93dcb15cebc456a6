// The help of every catalogue plug-in: every parameter has a text that formats, renders and names
// its own control; no entry is left over; the help window's texts are as the toolkit writes them.
#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "core/KParameter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginHelpPage.h"
#include "ui/KHelpTexts.h"
#include "ui/KRichTextPlain.h"
#include "ui/KRichTextRenderer.h"

namespace {

std::unique_ptr<KAudioPlugin> Create(const char* key) { return std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString::Static(key))); }

// The first run drawn as a control, or empty.
std::string FirstControl(const KString& markup) {
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::SemanticTagSets());
  renderer.Render(markup);
  for (const KRichTextItem& item : renderer.Document().body.items)
    if (const auto* p = std::get_if<KRichTextParagraph>(&item))
      for (const KRichTextRun& run : p->runs)
        if (run.format.tagSet == KString("control") && !run.text.IsEmpty()) return run.text.ToUtf8();
  return {};
}

TEST(PluginHelp, EveryParameterOfEveryCataloguePluginHasHelp) {
  ASSERT_FALSE(KProductCatalogue().plugins.empty());
  for (const KPluginDescription& entry : KProductCatalogue().plugins) {
    SCOPED_TRACE(entry.key);
    const auto plugin = Create(entry.key);
    ASSERT_NE(plugin, nullptr);
    const KPluginHelpPage page(*plugin);
    std::vector<bool> used(page.Help().parameters.size(), false);
    for (int32_t i = 0; i < plugin->ParameterCount(); ++i) {
      const KAudioPluginBase::Parameter& p = plugin->GetParameter(i);
      SCOPED_TRACE(p.Key().ToUtf8());
      int32_t number = 0;
      const KParameterHelp* help = page.Help().Find(p.Key().ToUtf8(), number);
      ASSERT_NE(help, nullptr);
      used[static_cast<size_t>(help - page.Help().parameters.data())] = true;
      // The formatter fills each placeholder once: a second "{3}" would stay empty.
      const std::string raw = help->text;
      for (const char* placeholder : {"{0}", "{1}", "{2}", "{3}"})
        EXPECT_EQ(raw.find(placeholder), raw.rfind(placeholder)) << placeholder << " twice in " << raw;
      const KString text = page.ParameterText(i);
      const std::string utf8 = text.ToUtf8();
      EXPECT_EQ(utf8.find('{'), std::string::npos) << utf8;  // every placeholder filled
      EXPECT_GT(utf8.size(), 120u) << "what it does, its range and a tip";
      EXPECT_NE(utf8.find("Tip: "), std::string::npos);
      EXPECT_EQ(FirstControl(text), p.Name().ToUtf8());
    }
    for (size_t h = 0; h < used.size(); ++h) EXPECT_TRUE(used[h]) << "no parameter for " << page.Help().parameters[h].key;
  }
}

TEST(PluginHelp, RangesComeFromTheParameters) {
  const auto plugin = Create("KEqualizerPlugin");
  const KPluginHelpPage page(*plugin);
  const std::string freq = page.ParameterText(12).ToUtf8();  // band 3 frequency
  EXPECT_NE(freq.find("<control>Band 3 frequency</control>"), std::string::npos) << freq;
  EXPECT_NE(freq.find("<range>20.0\u00A0Hz</range> to <range>20000\u00A0Hz</range>, default <value>350\u00A0Hz</value>"), std::string::npos) << freq;
  const auto utility = Create("KUtilityPlugin");
  EXPECT_NE(KPluginHelpPage(*utility).ParameterText(0).ToUtf8().find("<range>-60.0\u00A0dB</range>"), std::string::npos);
}

TEST(PluginHelp, PluginWithoutHelpIsRefused) {
  int32_t number = 7;
  EXPECT_EQ(KFindPluginHelp("KNoSuchPlugin"), nullptr);
  const KPluginHelp* help = KFindPluginHelp("KEqualizerPlugin");
  ASSERT_NE(help, nullptr);
  EXPECT_NE(help->Find("band12q", number), nullptr);
  EXPECT_EQ(number, 12);
  EXPECT_EQ(help->Find("bandq", number), nullptr);   // "#" needs a digit
  EXPECT_EQ(help->Find("band1qq", number), nullptr);  // and the whole key must match
}

TEST(HelpWindow, TextsAndComposition) {
  EXPECT_EQ(KHelpTexts::Section(KString("A<B")).ToUtf8(), "<center invert=1 singleline=1><l2>A&lt;B</l2><left>");
  const char* const actions[] = {"Click", "Drag"};
  EXPECT_EQ(KHelpTexts::ActionItems(actions).ToUtf8(), "<li>Click</li><li>Drag</li>");
  KRichTextRenderer renderer;
  renderer.Render(KHelpTexts::ControlHelp(KString(), actions));
  EXPECT_EQ(KRichTextPlainText(renderer.Document()),
            "Control meaning\n\nSorry, no help is defined for this control.\nMouse and keys\n\n  - Click\n  - Drag\n"
            "Move mouse cursor on a control and press F1 to get detailed info about it. If the F1 key is captured by another "
            "application, try using Ctrl+F1 or Ctrl+H.\n");
  // The header paragraphs are inverted, centred single lines in level-2 text.
  const auto& header = std::get<KRichTextParagraph>(renderer.Document().body.items[0]);
  EXPECT_TRUE(header.background.invert);
  EXPECT_TRUE(header.singleLine);
  EXPECT_EQ(header.alignment, kParagraphCenter);
  EXPECT_EQ(header.runs[0].format.style, kStyleLarge2);
  const auto& body = std::get<KRichTextParagraph>(renderer.Document().body.items[2]);
  EXPECT_EQ(body.alignment, kParagraphLeft);
  EXPECT_EQ(body.runs.back().format.style, kStyleNormal);
}

}  // namespace
