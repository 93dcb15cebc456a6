#include "ui/KRichTextHtml.h"

#include <cstdio>
#include <type_traits>

#include "kernel/KFormat.h"
#include "ui/KVectorIcons.h"

namespace {

constexpr const char* kStyleSheet =
    "body{font-family:'DejaVu Sans',Verdana,sans-serif;font-size:14px;line-height:1.4;color:#000;background:#fff;"
    "max-width:52em;margin:0 auto;padding:0 1em 2em}\n"
    "h1,h2,h3,h4,h5,h6{margin:1.2em 0 .5em;padding:.25em .5em;font-weight:bold}\n"
    "h1{background:#000;color:#fff;font-size:170%}h2{background:#333;color:#fff;font-size:140%}"
    "h3{background:#555;color:#fff;font-size:120%}h4{background:#999;font-size:110%}h5{background:#ddd}h6{background:#ddd;font-size:95%}\n"
    ".p{margin:0;min-height:1.4em}.single{white-space:nowrap;overflow:hidden}.invert,.ci{background:#000;color:#fff}\n"
    ".b{font-weight:bold}.i{font-style:italic}.s{font-size:85%;color:#555}"
    ".l1{font-size:170%}.l2{font-size:140%}.l3{font-size:120%}.l4{font-size:110%}\n"
    ".shortcut,.shortcutnop{color:#00BB00}.control,.value{color:#008800;font-weight:bold}.range{color:#008800}"
    ".reference,.symbol{color:#880000;font-weight:bold}.example{font-style:italic}\n"
    ".cred{color:#880000;font-weight:bold}.cgreen{color:#008800;font-weight:bold}.cblue{color:#000088;font-weight:bold}\n"
    "table.row{border-collapse:separate;width:100%}td{vertical-align:top}ul{margin:0}\n"
    ".icon{width:1.15em;height:1.15em;vertical-align:-.2em}"
    ".image{display:inline-block;width:1em;height:1em;vertical-align:-.15em;border:1px solid #888;border-radius:2px}"
    ".shape{display:inline-block;vertical-align:middle}\n";

constexpr const char* kStyleClasses[] = {nullptr, "b", "i", "s", "l1", "l2", "l3", "l4"};
constexpr const char* kColourClasses[] = {nullptr, nullptr, "cred", "cgreen", "cblue"};
constexpr const char* kAlignments[] = {"left", "center", "right", "justify"};

std::string Text(const char* pattern, auto... args) { return KFormatText(KString::Static(pattern), args...).ToUtf8(); }

// "rgba(r,g,b,a)" of a 0xAARRGGBB colour with an extra opacity.
std::string Css(uint32_t colour, uint32_t opacity = 255) {
  const double alpha = static_cast<double>(colour >> 24) * static_cast<double>(opacity) / (255.0 * 255.0);
  return Text("rgba({0},{1},{2},{3.3})", static_cast<int32_t>(colour >> 16 & 0xFF), static_cast<int32_t>(colour >> 8 & 0xFF),
              static_cast<int32_t>(colour & 0xFF), alpha);
}

// "12px" or "25%", or `fallback` for an unset size.
std::string Length(const KMarkupSize& size, const char* fallback) {
  if (size.unit == KMarkupSize::kPixels) return Text("{0}px", size.value);
  if (size.unit == KMarkupSize::kPercent) return Text("{0}%", size.value);
  return fallback;
}

// "width:12px;" or nothing for an unset size.
std::string Size(const char* property, const KMarkupSize& size) {
  const std::string length = Length(size, "");
  return length.empty() ? length : std::string(property) + ":" + length + ";";
}

// A tag set's name becomes a class only when it is a plain word.
bool IsClassName(const KString& name) {
  if (name.IsEmpty()) return false;
  for (int32_t i = 0; i < name.Length(); ++i) {
    const char16_t c = name.CharAt(i);
    if (!((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' || c == '-')) return false;
  }
  return true;
}

std::string Background(const KRichTextBackground& b) {
  return b.fillAlpha != 0 ? "background:" + Css(b.fill, b.fillAlpha) + ";" : std::string();
}

}  // namespace

KRichTextHtml::KRichTextHtml(const KString& title) {
  page_ = "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n<title>";
  AppendEscaped(title, page_);
  page_.append("</title>\n<style>\n").append(kStyleSheet).append("</style>\n</head>\n<body>\n");
}

void KRichTextHtml::Heading(int32_t level, const KString& text) {
  level = level < 1 ? 1 : (level > 6 ? 6 : level);
  page_.append(Text("<h{0}>", level));
  AppendEscaped(text, page_);
  page_.append(Text("</h{0}>\n", level));
}

void KRichTextHtml::Document(const KRichTextDocument& document) { Block(document, document.body); }

std::string KRichTextHtml::Finish() {
  page_.append("</body>\n</html>\n");
  return std::move(page_);
}

void KRichTextHtml::AppendEscaped(const KString& text, std::string& out) {
  for (const char c : text.ToUtf8()) {
    switch (c) {
      case '&': out.append("&amp;"); break;
      case '<': out.append("&lt;"); break;
      case '>': out.append("&gt;"); break;
      case '"': out.append("&quot;"); break;
      case '\'': out.append("&#39;"); break;
      default: out.push_back(c);
    }
  }
}

void KRichTextHtml::Block(const KRichTextDocument& document, const KRichTextBlock& block) {
  bool inList = false;
  for (const KRichTextItem& item : block.items) {
    const auto* sub = std::get_if<std::unique_ptr<KRichTextBlock>>(&item);
    const bool listItem = sub && (*sub)->kind == KRichTextBlock::kListItem;
    if (listItem != inList) page_.append(listItem ? "<ul>\n" : "</ul>\n");
    inList = listItem;
    std::visit(
        [&](const auto& value) {
          using T = std::decay_t<decltype(value)>;
          if constexpr (std::is_same_v<T, KRichTextParagraph>) {
            Paragraph(document, value);
          } else if constexpr (std::is_same_v<T, KRichTextRow>) {
            Row(document, value);
          } else if constexpr (std::is_same_v<T, KRichTextGraphic>) {
            Element(document.elements[static_cast<size_t>(value.element)], false);
          } else {
            page_.append(Text("<li style=\"margin-left:{0}px\">", value->indent > 0 ? value->indent - 16 : 0));
            Block(document, *value);
            page_.append("</li>\n");
          }
        },
        item);
  }
  if (inList) page_.append("</ul>\n");
}

void KRichTextHtml::Paragraph(const KRichTextDocument& document, const KRichTextParagraph& paragraph) {
  const bool heading = paragraph.heading != 0;
  const std::string element = heading ? Text("h{0}", paragraph.heading + 2) : "div";
  std::string classes = heading ? "" : "p";
  if (paragraph.singleLine) classes.append(" single");
  if (paragraph.background.invert) classes.append(" invert");
  page_.append("<").append(element);
  if (!classes.empty()) page_.append(" class=\"").append(classes.front() == ' ' ? classes.substr(1) : classes).append("\"");
  page_.append(" style=\"text-align:").append(kAlignments[paragraph.alignment & 3]).append(";").append(Background(paragraph.background)).append("\">");
  for (const KRichTextRun& run : paragraph.runs) Run(document, run);
  page_.append("</").append(element).append(">\n");
}

void KRichTextHtml::Run(const KRichTextDocument& document, const KRichTextRun& run) {
  if (run.text.IsEmpty()) return;
  const KRichTextFormat& f = run.format;
  std::string classes;
  auto addClass = [&](const char* name) {
    if (!name) return;
    if (!classes.empty()) classes.push_back(' ');
    classes.append(name);
  };
  addClass(kStyleClasses[f.style & 7]);
  if (f.colourIndex >= 0 && f.colourIndex < 5) addClass(kColourClasses[f.colourIndex]);
  if (IsClassName(f.tagSet)) addClass(f.tagSet.ToUtf8().c_str());
  if (f.inverted) addClass("ci");
  std::string style;
  if (f.colourIndex == kColourDefault && f.colour != 0) style = "color:" + Css(f.colour, f.opacity) + ";";
  else if (f.opacity != 255) style = Text("opacity:{0.3};", f.opacity / 255.0);
  page_.append("<span");
  if (!classes.empty()) page_.append(" class=\"").append(classes).append("\"");
  if (!style.empty()) page_.append(" style=\"").append(style).append("\"");
  page_.append(">");
  if (run.element >= 0) {
    Element(document.elements[static_cast<size_t>(run.element)], true);
  } else {
    std::string text;
    AppendEscaped(run.text, text);
    for (const char c : text) c == '\n' ? page_.append("<br>") : page_.append(1, c);
  }
  page_.append("</span>");
}

void KRichTextHtml::Row(const KRichTextDocument& document, const KRichTextRow& row) {
  page_.append(Text("<table class=\"row\" style=\"border-spacing:{0}px;{1}\"><tr>", row.cellSpaces, KString::FromUtf8(Size("height", row.height))));
  for (const auto& cell : row.cells) {
    const int32_t padding = cell->padding >= 0 ? cell->padding : row.padding;
    const int32_t border = cell->border >= 0 ? cell->border : row.border;
    const uint8_t borderAlpha = cell->border >= 0 ? cell->borderAlpha : row.borderAlpha;
    std::string style = Text("padding:{0}px;", padding) + Size("width", cell->width) + Background(cell->background);
    if (border > 0) style += Text("border:{0}px solid ", border) + Css(0xFF000000, borderAlpha) + ";";
    if (!cell->valign.IsEmpty()) style += "vertical-align:" + std::string(cell->valign == KString("center") ? "middle" : (cell->valign == KString("bottom") ? "bottom" : "top")) + ";";
    if (cell->autoSize) style += "width:1%;white-space:nowrap;";
    page_.append(cell->background.invert ? "<td class=\"invert\" style=\"" : "<td style=\"").append(style).append("\">");
    Block(document, *cell);
    page_.append("</td>");
  }
  page_.append("</tr></table>\n");
}

void KRichTextHtml::Element(const KRichTextElement& e, bool inLine) {
  switch (e.kind) {
    case KRichTextElement::kImage:
      if (const std::string svg = KVectorIcons::Svg(e.icon); !svg.empty()) {
        page_.append(svg);
        break;
      }
      page_.append("<span class=\"image\" title=\"");
      AppendEscaped(e.icon.IsEmpty() ? (e.bitmap.IsEmpty() ? KFormatText("image {0}", e.number) : e.bitmap) : e.icon, page_);
      page_.append("\"></span>");
      break;
    case KRichTextElement::kHorizontalLine:
      page_.append(Text("<hr style=\"border:0;height:{0}px;margin:{1}px {2}px;background:", e.size, e.vspace, e.hspace))
          .append(e.colour ? Css(e.colour, e.alpha) : Css(0xFF000000, e.alpha))
          .append(";").append(Size("width", e.width)).append("\">\n");
      break;
    case KRichTextElement::kRectangle:
    case KRichTextElement::kIndicator: {
      std::string style = "width:" + Length(e.width, "1em") + ";height:" + Length(e.height, "1em") + ";";
      if (e.borderColour) style += "border:1px solid " + Css(e.borderColour) + ";";
      const std::string fill = Css(e.colour ? e.colour : 0xFF000000);
      if (e.kind == KRichTextElement::kRectangle) {
        style += "background:" + fill + ";";
      } else {
        // The filled share runs from `middle` percent to `value` percent of the width.
        const int32_t from = e.middle < e.value ? e.middle : e.value, to = e.middle < e.value ? e.value : e.middle;
        style += Text("background:linear-gradient(to right,transparent {0}%,{1} {0}%,{1} {2}%,transparent {2}%);", from,
                      KString::FromUtf8(fill), to);
      }
      page_.append(inLine ? "<span" : "<div").append(" class=\"shape\" style=\"").append(style).append(inLine ? "\"></span>" : "\"></div>\n");
      break;
    }
  }
}
