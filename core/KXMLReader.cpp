#include "core/KXMLReader.h"

#include <algorithm>
#include <cstring>

#include "core/KXMLName.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KUtf8.h"

namespace {

uint32_t Byte(char c) noexcept { return static_cast<unsigned char>(c); }

bool IsSpace(char c) noexcept { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; }

// ASCII punctuation, which can never begin an attribute name ("_" and ":" can).
bool IsSpecial(uint32_t c) noexcept {
  const bool punctuation = (c >= '!' && c <= '/') || (c >= ':' && c <= '@') || (c >= '[' && c <= '`') || (c >= '{' && c <= '~');
  return punctuation && c != '_' && c != ':';
}

int32_t DigitValue(char c, bool hexadecimal) noexcept {
  if (c >= '0' && c <= '9') return c - '0';
  if (hexadecimal && c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (hexadecimal && c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

void AppendCharacter(uint32_t c, std::string& out) {
  char16_t units[2];
  int32_t count = 1;
  if (c >= 0x10000) {
    units[0] = static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10));
    units[1] = static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
    count = 2;
  } else {
    units[0] = static_cast<char16_t>(c);
  }
  KUtf8::Encode(units, count, out);
}

}  // namespace

Element KXMLReader::Read(std::string_view text) { return KXMLReader(text).Parse(); }

Element KXMLReader::Parse() {
  if (LookingAt("\xEF\xBB\xBF")) at_ += 3;
  while (at_ < end_) {
    if (*at_ != '<') ReadCharacterData();
    else if (LookingAt("<?")) ReadProcessingInstruction();
    else if (LookingAt("<!")) ReadSpecial();
    else if (LookingAt("</")) ReadClosingTag();
    else ReadStartTag();
  }
  if (!open_.IsEmpty()) Fail(KFormatText("Element is not closed. '{0}'", open_.Last().element->GetName()));
  if (!rooted_) Fail("No root element found.");
  return std::move(root_);
}

void KXMLReader::ReadStartTag() {
  const char* tag = at_++;
  if (at_ == end_ || !KXMLName::IsStart(Byte(*at_))) FailAt("No element name found. '{0}'", tag);
  if (open_.IsEmpty() && rooted_) FailAt("Content found outside the root element. '{0}'", tag);
  if (open_.Count() == Element::kMaxDepth)
    Fail(KFormatText("Elements nested more than {1} deep. '{0}'", Excerpt(tag), Element::kMaxDepth));

  const char* name = at_;
  SkipName();
  const size_t nameLength = static_cast<size_t>(at_ - name);
  Element& element = open_.IsEmpty() ? root_ : open_.Last().element->AddChild(KString());
  element.name_ = KString::FromUtf8({name, nameLength});
  rooted_ = true;
  for (;;) {
    const bool spaced = SkipSpace();
    if (at_ == end_) FailAt("Unexpected end of text. '{0}'", tag);
    const uint32_t c = Byte(*at_);
    if (c == '>') {
      ++at_;
      open_.Append(OpenElement{&element, name, nameLength});
      break;
    }
    if (c == '/') {
      if (at_ + 1 == end_) FailAt("Unexpected end of text. '{0}'", tag);
      if (at_[1] != '>') FailAt("Invalid element finishing sequence. '{0}'", at_);
      at_ += 2;
      break;
    }
    if (!KXMLName::IsStart(c))
      FailAt(IsSpecial(c) ? KString("Special character found where attribute was expected. '{0}'")
                          : KString("Invalid character found where attribute was expected. '{0}'"), at_);
    if (!spaced) FailAt("Invalid character found where attribute was expected. '{0}'", at_);
    ReadAttribute(element, tag);
  }
  SortAttributes(element);
}

void KXMLReader::ReadAttribute(Element& element, const char* tag) {
  const char* name = at_;
  SkipName();
  KString attributeName = KString::FromUtf8({name, static_cast<size_t>(at_ - name)});
  SkipSpace();
  if (at_ == end_) FailAt("Unexpected end of text. '{0}'", tag);
  if (*at_ != '=') FailAt("Invalid character found where attribute was expected. '{0}'", at_);
  ++at_;
  SkipSpace();
  if (at_ == end_) FailAt("Unexpected end of text. '{0}'", tag);
  const char quote = *at_;
  if (quote != '"' && quote != '\'') FailAt("Invalid character found where attribute was expected. '{0}'", at_);
  ++at_;
  scratch_.clear();
  Decode(quote, true);
  if (at_ == end_) FailAt("Unexpected end of text. '{0}'", tag);
  ++at_;
  element.attributes_.Append(Element::Attribute{std::move(attributeName), KString::FromUtf8(scratch_)});
}

// Attributes usually arrive sorted (the writer sorts them), so the sort is mostly skipped.
void KXMLReader::SortAttributes(Element& element) const {
  auto& attributes = element.attributes_;
  const auto before = [](const Element::Attribute& a, const Element::Attribute& b) { return a.name.Compare(b.name) < 0; };
  if (!std::is_sorted(attributes.begin(), attributes.end(), before)) std::sort(attributes.begin(), attributes.end(), before);
  const auto twice = std::adjacent_find(attributes.begin(), attributes.end(),
                                        [](const Element::Attribute& a, const Element::Attribute& b) { return a.name == b.name; });
  if (twice != attributes.end()) Fail(KFormatText("Attribute found twice. '{0}'", twice->name));
}

void KXMLReader::ReadClosingTag() {
  const char* tag = at_;
  at_ += 2;
  if (at_ == end_ || !KXMLName::IsStart(Byte(*at_))) FailAt("Invalid closing element syntax. '{0}'", tag);
  const char* name = at_;
  SkipName();
  const size_t nameLength = static_cast<size_t>(at_ - name);
  SkipSpace();
  if (at_ == end_) FailAt("Unexpected end of text. '{0}'", tag);
  if (*at_ != '>') FailAt("Invalid closing element syntax. '{0}'", tag);
  ++at_;
  if (open_.IsEmpty() || open_.Last().nameLength != nameLength || std::memcmp(open_.Last().name, name, nameLength) != 0)
    FailAt("Closing element does not match. '{0}'", tag);
  open_.RemoveLast();
}

// Comments anywhere and CDATA sections inside the root; nothing else begins with "<!".
void KXMLReader::ReadSpecial() {
  const char* construct = at_;
  if (LookingAt("<!--")) {
    at_ += 4;
    SkipPast("-->", construct);
  } else if (LookingAt("<![CDATA[")) {
    if (open_.IsEmpty()) FailAt("Content found outside the root element. '{0}'", construct);
    at_ += 9;
    const char* data = at_;
    const char* stop = SkipPast("]]>", construct);
    scratch_.clear();
    for (const char* p = data; p < stop; ++p) {  // line ends are normalised here too
      if (*p != '\r') scratch_ += *p;
      else if (p + 1 == stop || p[1] != '\n') scratch_ += '\n';
    }
    open_.Last().element->text_.AppendUtf8(scratch_);
  } else {
    FailAt("Invalid special element sequence. '{0}'", construct);
  }
}

void KXMLReader::ReadProcessingInstruction() {
  const char* construct = at_;
  at_ += 2;
  if (at_ == end_ || !KXMLName::IsStart(Byte(*at_))) FailAt("Invalid special element sequence. '{0}'", construct);
  SkipPast("?>", construct);
}

void KXMLReader::ReadCharacterData() {
  if (open_.IsEmpty()) {  // only whitespace may stand around the root
    SkipSpace();
    if (at_ < end_ && *at_ != '<') FailAt("Content found outside the root element. '{0}'", at_);
    return;
  }
  scratch_.clear();
  if (Decode('<', false)) open_.Last().element->text_.AppendUtf8(scratch_);
}

bool KXMLReader::Decode(char stop, bool attribute) {
  bool significant = false;
  while (at_ < end_ && *at_ != stop) {
    // Plain characters are copied a run at a time.
    const char* run = at_;
    for (char c; at_ < end_ && (c = *at_) != stop && c != '&' && c != '<' && c != '\r' && !(attribute && IsSpace(c)); ++at_)
      significant = significant || !IsSpace(c);
    scratch_.append(run, static_cast<size_t>(at_ - run));
    if (at_ == end_ || *at_ == stop) break;
    const char c = *at_;
    if (c == '&') {
      ReadReference();
      significant = true;
    } else if (c == '<') {  // text stops there, so only a value gets here
      FailAt("Invalid character found in attribute value. '{0}'", at_);
    } else {  // a line end, or whitespace in a value: one space or line feed
      ++at_;
      if (c == '\r' && at_ < end_ && *at_ == '\n') ++at_;
      scratch_ += attribute ? ' ' : '\n';
    }
  }
  return significant;
}

void KXMLReader::ReadReference() {
  const char* reference = at_++;
  if (at_ < end_ && *at_ == ';') FailAt("XML entity cannot have empty name. '{0}'", reference);
  uint32_t c = 0;
  if (at_ < end_ && *at_ == '#') {
    ++at_;
    const bool hexadecimal = at_ < end_ && *at_ == 'x';
    if (hexadecimal) ++at_;
    const char* digits = at_;
    for (int32_t d; at_ < end_ && (d = DigitValue(*at_, hexadecimal)) >= 0; ++at_)
      if (c <= 0x10FFFF) c = c * (hexadecimal ? 16 : 10) + static_cast<uint32_t>(d);  // stays above the limit once there
    if (at_ == digits || c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) FailAt("Invalid entity reference. '{0}'", reference);
  } else {
    const char* name = at_;
    SkipName();
    const std::string_view entity(name, static_cast<size_t>(at_ - name));
    if (entity == "amp") c = '&';
    else if (entity == "lt") c = '<';
    else if (entity == "gt") c = '>';
    else if (entity == "quot") c = '"';
    else if (entity == "apos") c = '\'';
    else FailAt("Invalid entity reference. '{0}'", reference);
  }
  if (at_ == end_ || *at_ != ';') FailAt("Invalid entity reference. '{0}'", reference);
  ++at_;
  AppendCharacter(c, scratch_);
}

const char* KXMLReader::SkipPast(std::string_view terminator, const char* construct) {
  const std::string_view rest(at_, static_cast<size_t>(end_ - at_));
  const size_t found = rest.find(terminator);
  if (found == std::string_view::npos) FailAt("Unexpected end of text. '{0}'", construct);
  const char* stop = at_ + found;
  at_ = stop + terminator.size();
  return stop;
}

bool KXMLReader::LookingAt(std::string_view text) const noexcept {
  return static_cast<size_t>(end_ - at_) >= text.size() && std::memcmp(at_, text.data(), text.size()) == 0;
}

bool KXMLReader::SkipSpace() noexcept {
  const char* start = at_;
  while (at_ < end_ && IsSpace(*at_)) ++at_;
  return at_ != start;
}

void KXMLReader::SkipName() noexcept {
  while (at_ < end_ && KXMLName::IsPart(Byte(*at_))) ++at_;
}

// Counts characters, not bytes, so that a multi-byte character is never cut.
KString KXMLReader::Excerpt(const char* from) const {
  const char* to = from;
  for (int32_t n = 0; n < kExcerptCharacters && to < end_; ++n) {
    ++to;
    while (to < end_ && (Byte(*to) & 0xC0) == 0x80) ++to;
  }
  return KString::FromUtf8({from, static_cast<size_t>(to - from)});
}

void KXMLReader::Fail(const KString& message) const { throw KException(KString("Invalid file contents. ") + message); }

void KXMLReader::FailAt(const KString& pattern, const char* from) const { Fail(KFormatText(pattern, Excerpt(from))); }
