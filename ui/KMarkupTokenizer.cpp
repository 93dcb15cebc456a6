#include "ui/KMarkupTokenizer.h"

#include <cstdint>

namespace {

constexpr char16_t kReplacement = 0xFFFD;

bool IsLetter(uint32_t c) noexcept { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }
bool IsNameChar(uint32_t c) noexcept { return IsLetter(c) || (c >= '0' && c <= '9') || c == '_' || c == '-'; }
bool IsBlank(uint32_t c) noexcept { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; }

struct KNamedEntity {
  const char* name;
  char16_t character;
};
constexpr KNamedEntity kEntities[] = {
    {"lt", '<'}, {"gt", '>'}, {"amp", '&'}, {"quot", '"'}, {"apos", '\''}, {"nbsp", 0xA0},
};
// Longest reference read: "&#x10FFFF;" and a little slack; a longer one is plain text.
constexpr int32_t kMaxEntity = 12;
// Longest tag read, attributes included; the help texts' longest are a tenth of it.
constexpr int32_t kMaxTag = 1024;

// The parser over the text's units (8-bit literal or UTF-16), one pass, no look-back.
template <class Unit>
class KParser {
public:
  KParser(const Unit* units, int32_t length) : units_(units), length_(length) {}

  template <class OnText, class OnTag>
  void Run(OnText&& onText, OnTag&& onTag) {
    KString pending;
    auto flush = [&] {
      if (!pending.IsEmpty()) onText(pending);
      pending = KString();
    };
    int32_t at = 0;
    while (at < length_) {
      const uint32_t c = At(at);
      if (c == '<') {
        KString name;
        KMarkupAttributes attributes;
        bool closing = false;
        const int32_t next = ReadTag(at, name, attributes, closing);
        if (next > at) {
          if (!closing && name == KString("br")) {
            pending.Append(u'\n');
          } else {
            flush();
            onTag(name, attributes, closing);
          }
          at = next;
          continue;
        }
      } else if (c == '&') {
        at = ReadEntity(at, pending);
        continue;
      }
      pending.Append(c == '\r' ? u'\n' : static_cast<char16_t>(c));
      at += c == '\r' && At(at + 1) == '\n' ? 2 : 1;
    }
    flush();
  }

private:
  uint32_t At(int32_t i) const noexcept { return i < length_ ? static_cast<uint32_t>(Unsigned(units_[i])) : 0; }
  static uint32_t Unsigned(char c) noexcept { return static_cast<unsigned char>(c); }
  static uint32_t Unsigned(char16_t c) noexcept { return c; }

  // Reads a tag starting at the "<" at `at`; answers the position after its ">", or `at` when
  // there is no complete tag there. A tag is at most kMaxTag units long, so that text full of
  // unfinished tags is read in linear time.
  int32_t ReadTag(int32_t at, KString& name, KMarkupAttributes& attributes, bool& closing) const {
    const int32_t end = length_ - at > kMaxTag ? at + kMaxTag : length_;
    auto unit = [&](int32_t i) { return i < end ? At(i) : 0; };
    auto endsTag = [&](int32_t i) { return unit(i) == '>' || (unit(i) == '/' && unit(i + 1) == '>'); };
    int32_t i = at + 1;
    closing = unit(i) == '/';
    if (closing) ++i;
    if (!IsLetter(unit(i))) return at;
    const int32_t nameStart = i;
    while (IsNameChar(unit(i))) ++i;
    name = Slice(nameStart, i);
    for (;;) {
      while (IsBlank(unit(i))) ++i;
      if (i >= end) return at;
      if (unit(i) == '>') return i + 1;
      if (endsTag(i)) return i + 2;
      if (unit(i) == '/') {  // a stray slash inside the tag
        ++i;
        continue;
      }
      const int32_t attributeStart = i;
      while (i < end && !IsBlank(unit(i)) && unit(i) != '=' && !endsTag(i)) ++i;
      KString attributeName = Slice(attributeStart, i);
      KString value;
      if (unit(i) == '=') {
        ++i;
        const uint32_t quote = unit(i);
        if (quote == '"' || quote == '\'') {
          int32_t close = i + 1;
          while (close < end && unit(close) != quote) ++close;
          if (close >= end) return at;  // unterminated quotation: no tag
          value = Decode(i + 1, close);
          i = close + 1;
        } else {
          const int32_t valueStart = i;
          while (i < end && !IsBlank(unit(i)) && !endsTag(i)) ++i;
          value = Decode(valueStart, i);
        }
      }
      attributes.Add(std::move(attributeName), std::move(value));
    }
  }

  KString Slice(int32_t from, int32_t to) const {
    KString s;
    s.Reserve(to - from);
    for (int32_t i = from; i < to; ++i) s.Append(static_cast<char16_t>(At(i)));
    return s;
  }

  // The units from..to with entities decoded.
  KString Decode(int32_t from, int32_t to) const {
    KString s;
    int32_t i = from;
    while (i < to) {
      if (At(i) == '&') {
        i = ReadEntity(i, s, to);
      } else {
        s.Append(static_cast<char16_t>(At(i)));
        ++i;
      }
    }
    return s;
  }

  // Decodes the reference at `at` (an "&") into `out`, or appends the "&" itself when it begins
  // none; answers where reading goes on.
  int32_t ReadEntity(int32_t at, KString& out, int32_t limit = -1) const {
    if (limit < 0) limit = length_;
    int32_t end = at + 1;
    while (end < limit && end - at <= kMaxEntity && At(end) != ';' && At(end) != '&' && At(end) != '<') ++end;
    if (end >= limit || At(end) != ';' || end == at + 1) {
      out.Append(u'&');
      return at + 1;
    }
    if (At(at + 1) == '#') {
      if (!AppendNumeric(at + 2, end, out)) {
        out.Append(u'&');
        return at + 1;
      }
      return end + 1;
    }
    const KString name = Slice(at + 1, end);
    for (const KNamedEntity& e : kEntities) {
      if (name == KString::Static(e.name)) {
        out.Append(e.character);
        return end + 1;
      }
    }
    out.Append(u'&');
    return at + 1;
  }

  // "nnn" or "xhhh" between from and to; false when it is not a number at all.
  bool AppendNumeric(int32_t from, int32_t to, KString& out) const {
    const bool hex = At(from) == 'x' || At(from) == 'X';
    int32_t i = hex ? from + 1 : from;
    if (i >= to) return false;
    uint32_t code = 0;
    for (; i < to; ++i) {
      const uint32_t c = At(i);
      uint32_t digit;
      if (c >= '0' && c <= '9') digit = c - '0';
      else if (hex && c >= 'a' && c <= 'f') digit = c - 'a' + 10;
      else if (hex && c >= 'A' && c <= 'F') digit = c - 'A' + 10;
      else return false;
      code = code > 0x10FFFF ? code : code * (hex ? 16 : 10) + digit;
    }
    if (code == 0 || code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) {
      out.Append(kReplacement);
    } else if (code >= 0x10000) {
      out.Append(static_cast<char16_t>(0xD800 + ((code - 0x10000) >> 10)));
      out.Append(static_cast<char16_t>(0xDC00 + ((code - 0x10000) & 0x3FF)));
    } else {
      out.Append(static_cast<char16_t>(code));
    }
    return true;
  }

  const Unit* units_;
  int32_t length_;
};

}  // namespace

void KMarkupTokenizer::Tokenize(const KString& text) {
  text.VisitUnits([&](const auto* units, int32_t length) {
    KParser parser(units, length);
    parser.Run([&](const KString& run) { HandleText(run); },
               [&](const KString& name, const KMarkupAttributes& attributes, bool closing) { HandleTag(name, attributes, closing); });
  });
}
