#include "plugins/KPluginHelpPage.h"

#include <map>
#include <string_view>
#include <vector>

#include "core/KParameter.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/KHelpTexts.h"
#include "ui/KRichTextHtml.h"
#include "ui/KRichTextLayout.h"
#include "ui/KRichTextPlain.h"
#include "ui/KRichTextRenderer.h"

namespace {

const KPluginHelp& HelpOf(const KAudioPlugin& plugin) {
  const KPluginHelp* help = KFindPluginHelp(plugin.Identifier().ToUtf8());
  if (!help) throw KException(KFormatText("No help is written for {0}.", plugin.Identifier()));
  return *help;
}

// A value as the parameter displays it, with its unit, written so that it reads as text in
// mark-up and never breaks across lines ("1.80 : 1", "20.0 Hz").
KString Display(const KAudioPluginBase::Parameter& p, double normalized) {
  KString text = p.TextForNormalized(normalized);
  if (!p.Unit().IsEmpty()) text.Append(u' ').Append(p.Unit());
  KString kept;
  for (int32_t i = 0; i < text.Length(); ++i) kept.Append(text.CharAt(i) == u' ' ? u'\u00A0' : text.CharAt(i));
  return KHelpTexts::Escape(kept);
}

}  // namespace

KPluginHelpPage::KPluginHelpPage(KAudioPlugin& plugin) : plugin_(plugin), help_(HelpOf(plugin)) {}

KString KPluginHelpPage::ParameterText(int32_t index) const {
  const KAudioPluginBase::Parameter& p = plugin_.GetParameter(index);
  int32_t number = 0;
  const KParameterHelp* entry = help_.Find(p.Key().ToUtf8(), number);
  if (!entry) return {};
  return KFormatText(KString::FromUtf8(entry->text), Display(p, 0.0), Display(p, 1.0), Display(p, p.DefaultNormalized()), number);
}

KString KPluginHelpPage::ControlHelp(int32_t index) const {
  const bool stepped = plugin_.GetParameter(index).Steps() > 0;
  return KHelpTexts::ControlHelp(ParameterText(index), stepped ? KHelpTexts::SwitchActions() : KHelpTexts::KnobActions());
}

KString KPluginHelpPage::Markup() const {
  KString markup("<center><l1>");
  markup.Append(KHelpTexts::Escape(KString::FromUtf8(help_.title))).Append(KString("</l1><left><p>"));
  markup.Append(KString::FromUtf8(help_.overview)).Append(KString("<p>"));
  // A numbered entry whose text takes no value of its parameter ({0} to {2}) reads the same for
  // every parameter it serves but for their number (the many slots of a plug-in that hosts
  // others): the page gives it once, titled with the first and the last of their names.
  struct Section {
    int32_t first, last;
  };
  std::vector<Section> sections;
  std::map<const KParameterHelp*, size_t> shared;
  for (int32_t i = 0; i < plugin_.ParameterCount(); ++i) {
    int32_t number = 0;
    const KParameterHelp* entry = help_.Find(plugin_.GetParameter(i).Key().ToUtf8(), number);
    const std::string_view text = entry ? entry->text : "";
    const bool numbered = entry && std::string_view(entry->key).find('#') != std::string_view::npos &&
                          text.find("{0}") == text.npos && text.find("{1}") == text.npos && text.find("{2}") == text.npos;
    if (!numbered) {
      sections.push_back({i, i});
      continue;
    }
    const auto [found, added] = shared.try_emplace(entry, sections.size());
    if (added) sections.push_back({i, i});
    else sections[found->second].last = i;
  }
  for (const Section& section : sections) {
    KString title = plugin_.GetParameter(section.first).Name();
    if (section.last != section.first) title.Append(KString(" to ")).Append(plugin_.GetParameter(section.last).Name());
    markup.Append(KHelpTexts::Section(title)).Append(KString("<p>"));
    const KString text = ParameterText(section.first);
    markup.Append(text.IsEmpty() ? KString::Static(KHelpTexts::kNoHelp) : text).Append(KString("<p>"));
  }
  for (const KButtonHelp& button : help_.buttons)
    markup.Append(KHelpTexts::Section(KString::FromUtf8(button.title))).Append(KString("<p>")).Append(KString::FromUtf8(button.text)).Append(KString("<p>"));
  return markup;
}

KRichTextDocument KPluginHelpPage::Document() const { return KRenderHelpMarkup(Markup()); }

std::string KPluginHelpPage::PlainText() const { return KRichTextPlainText(Document()); }

std::string KPluginHelpPage::Html() const {
  const KString title = KString::FromUtf8(help_.title);
  KRichTextHtml page(title);
  page.Heading(1, title);
  page.Document(KRenderHelpMarkup(KString::FromUtf8(help_.overview)));
  for (int32_t i = 0; i < plugin_.ParameterCount(); ++i) {
    page.Heading(2, plugin_.GetParameter(i).Name());
    const KString text = ParameterText(i);
    page.Document(KRenderHelpMarkup(text.IsEmpty() ? KString::Static(KHelpTexts::kNoHelp) : text));
  }
  for (const KButtonHelp& button : help_.buttons) {
    page.Heading(2, KString::FromUtf8(button.title));
    page.Document(KRenderHelpMarkup(KString::FromUtf8(button.text)));
  }
  return page.Finish();
}

KBitmap KPluginHelpPage::Picture(int32_t width, double scale) const {
  const KRichTextDocument document = Document();
  const KRichTextLayout layout(document, width - 2 * kMargin, scale);
  KBitmap picture(static_cast<int32_t>(width * scale), static_cast<int32_t>((layout.Height() + 2 * kMargin) * scale));
  KDrawerToKBitmap drawer(picture, scale);
  drawer.FillRectangle(picture.Bounds(), KRichTextLook().paper, 255, kDrawCopy);
  layout.Draw(drawer, {kMargin, kMargin});
  return picture;
}

std::string KPluginHelpPage::PicturePNG(int32_t width, double scale) const { return Picture(width, scale).EncodePNG(); }
