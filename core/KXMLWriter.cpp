#include "core/KXMLWriter.h"

#include <charconv>
#include <string_view>
#include <type_traits>

#include "core/KXMLName.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KUtf8.h"

namespace {

template <class Unit>
uint32_t UnitValue(Unit unit) noexcept {
  return static_cast<std::make_unsigned_t<Unit>>(unit);
}

char LowerAscii(char c) noexcept { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }

bool StartsWithIgnoringCase(const std::string& text, std::string_view prefix) noexcept {
  if (text.size() < prefix.size()) return false;
  for (size_t i = 0; i < prefix.size(); ++i)
    if (LowerAscii(text[i]) != prefix[i]) return false;
  return true;
}

// XML's EncName: a letter, then letters, digits, ".", "_" and "-".
bool IsEncodingName(const std::string& name) noexcept {
  if (name.empty()) return false;
  for (size_t i = 0; i < name.size(); ++i) {
    const char c = LowerAscii(name[i]);
    const bool letter = c >= 'a' && c <= 'z';
    if (!letter && (i == 0 || !((c >= '0' && c <= '9') || c == '.' || c == '_' || c == '-'))) return false;
  }
  return true;
}

// The entity that stands for a markup character, or null. A leading space of a text gets one
// too, so that a text is never pure literal whitespace.
const char* NamedEntity(uint32_t c, bool attribute, bool first) noexcept {
  switch (c) {
    case '&': return "&amp;";
    case '<': return "&lt;";
    case '>': return "&gt;";
    case '"': return attribute ? "&quot;" : nullptr;
    case ' ': return !attribute && first ? "&#32;" : nullptr;
    default: return nullptr;
  }
}

// The character at units[i], advancing i past the second half of a surrogate pair; an unpaired
// surrogate stands for U+FFFD.
uint32_t ScalarAt(const char* units, int32_t, int32_t& i) noexcept { return UnitValue(units[i]); }
uint32_t ScalarAt(const char16_t* units, int32_t length, int32_t& i) noexcept {
  const uint32_t c = units[i];
  if (c >= 0xD800 && c <= 0xDBFF && i + 1 < length && units[i + 1] >= 0xDC00 && units[i + 1] <= 0xDFFF)
    return 0x10000 + ((c - 0xD800) << 10) + (units[++i] - 0xDC00u);
  return c >= 0xD800 && c <= 0xDFFF ? 0xFFFD : c;
}

}  // namespace

std::string KXMLWriter::Write(const Element& root, const KString& encoding, Layout layout) {
  const std::string name = encoding.ToUtf8();
  const bool utf8 = name.size() == 5 && StartsWithIgnoringCase(name, "utf-8");
  if (!IsEncodingName(name) || (!utf8 && (StartsWithIgnoringCase(name, "utf") || StartsWithIgnoringCase(name, "ucs"))))
    throw KException(KFormatText("Unsupported XML encoding. '{0}'", encoding));

  std::string out = "<?xml version=\"1.0\" encoding=\"" + name + "\"?>";
  if (layout == kIndented) out += '\n';
  KXMLWriter(out, encoding, !utf8).WriteElement(root, 1, layout == kIndented);
  return out;
}

void KXMLWriter::WriteElement(const Element& element, int32_t depth, bool indent) {
  if (depth > Element::kMaxDepth)
    throw KException(KFormatText("Elements nested more than {1} deep. '{0}'", element.GetName(), Element::kMaxDepth));
  if (indent) out_.append(static_cast<size_t>(depth - 1), '\t');
  out_ += '<';
  WriteName(element.GetName());
  for (const Element::Attribute& attribute : element.Attributes()) {
    out_ += ' ';
    WriteName(attribute.name);
    out_ += "=\"";
    attribute.value.VisitUnits([&](const auto* units, int32_t length) { WriteEscaped(units, length, true); });
    out_ += '"';
  }
  const KString& text = element.GetText();
  if (text.IsEmpty() && element.ChildCount() == 0) {
    out_ += "/>";
  } else {
    out_ += '>';
    text.VisitUnits([&](const auto* units, int32_t length) { WriteEscaped(units, length, false); });
    const bool indentChildren = indent && text.IsEmpty();
    if (indentChildren) out_ += '\n';
    for (int32_t i = 0; i < element.ChildCount(); ++i) WriteElement(element.GetChild(i), depth + 1, indentChildren);
    if (indentChildren) out_.append(static_cast<size_t>(depth - 1), '\t');
    out_ += "</";
    element.GetName().AppendUtf8To(out_);  // checked at the start tag
    out_ += '>';
  }
  if (indent) out_ += '\n';
}

void KXMLWriter::WriteName(const KString& name) {
  name.VisitUnits([&](const auto* units, int32_t length) {
    bool valid = length > 0 && KXMLName::IsStart(UnitValue(units[0]));
    bool ascii = true;
    for (int32_t i = 0; i < length; ++i) {
      valid = valid && KXMLName::IsPart(UnitValue(units[i]));
      ascii = ascii && UnitValue(units[i]) < 0x80;
    }
    if (!valid) throw KException(KFormatText("Invalid XML name. '{0}'", name));
    if (asciiOnly_ && !ascii) throw KException(KFormatText("XML name cannot be written in encoding {1}. '{0}'", name, encoding_));
    KUtf8::Encode(units, length, out_);
  });
}

// Copies runs of plain characters at once and replaces the few that need an entity.
template <class Unit>
void KXMLWriter::WriteEscaped(const Unit* units, int32_t length, bool attribute) {
  int32_t plain = 0;  // start of the run not written yet
  for (int32_t i = 0; i < length; ++i) {
    const uint32_t c = UnitValue(units[i]);
    const char* entity = NamedEntity(c, attribute, i == 0);
    if (!entity && c >= 0x20 && (c < 0x80 || !asciiOnly_)) continue;
    KUtf8::Encode(units + plain, i - plain, out_);
    if (entity) out_ += entity;
    else WriteReference(ScalarAt(units, length, i));
    plain = i + 1;
  }
  KUtf8::Encode(units + plain, length - plain, out_);
}

void KXMLWriter::WriteReference(uint32_t character) {
  char digits[12];
  const auto end = std::to_chars(digits, digits + sizeof digits, character).ptr;
  out_ += "&#";
  out_.append(digits, end);
  out_ += ';';
}
