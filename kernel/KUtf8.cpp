#include "kernel/KUtf8.h"

namespace {

constexpr char32_t kReplacement = 0xFFFD;

// Decodes one scalar value at `p`, advancing it; rejects overlong forms, surrogates and values
// above U+10FFFF, consuming only the bytes that could belong to the sequence.
char32_t DecodeOne(const unsigned char*& p, const unsigned char* end) noexcept {
  const unsigned char lead = *p++;
  if (lead < 0x80) return lead;
  int extra;
  char32_t value;
  char32_t minimum;
  if ((lead & 0xE0) == 0xC0) {
    extra = 1, value = lead & 0x1F, minimum = 0x80;
  } else if ((lead & 0xF0) == 0xE0) {
    extra = 2, value = lead & 0x0F, minimum = 0x800;
  } else if ((lead & 0xF8) == 0xF0) {
    extra = 3, value = lead & 0x07, minimum = 0x10000;
  } else {
    return kReplacement;
  }
  for (int i = 0; i < extra; ++i) {
    if (p == end || (*p & 0xC0) != 0x80) return kReplacement;
    value = (value << 6) | (*p++ & 0x3F);
  }
  if (value < minimum || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF)) return kReplacement;
  return value;
}

// Writes the UTF-8 form of `c` to `out` (room for 4 bytes); answers its length.
size_t EncodeOne(char32_t c, char* out) noexcept {
  if (c < 0x80) {
    out[0] = static_cast<char>(c);
    return 1;
  }
  if (c < 0x800) {
    out[0] = static_cast<char>(0xC0 | (c >> 6));
    out[1] = static_cast<char>(0x80 | (c & 0x3F));
    return 2;
  }
  if (c < 0x10000) {
    out[0] = static_cast<char>(0xE0 | (c >> 12));
    out[1] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
    out[2] = static_cast<char>(0x80 | (c & 0x3F));
    return 3;
  }
  out[0] = static_cast<char>(0xF0 | (c >> 18));
  out[1] = static_cast<char>(0x80 | ((c >> 12) & 0x3F));
  out[2] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
  out[3] = static_cast<char>(0x80 | (c & 0x3F));
  return 4;
}

// The scalar value starting at units[i], advancing i past a surrogate pair.
char32_t NextScalar(const char16_t* units, int32_t length, int32_t& i) noexcept {
  char32_t c = units[i];
  if (c >= 0xD800 && c <= 0xDBFF && i + 1 < length && units[i + 1] >= 0xDC00 && units[i + 1] <= 0xDFFF) {
    c = 0x10000 + ((c - 0xD800) << 10) + (units[++i] - 0xDC00);
  } else if (c >= 0xD800 && c <= 0xDFFF) {
    c = kReplacement;
  }
  return c;
}
char32_t NextScalar(const char* units, int32_t, int32_t& i) noexcept { return static_cast<unsigned char>(units[i]); }

template <class Unit>
void EncodeAppending(const Unit* units, int32_t length, std::string& out) {
  out.reserve(out.size() + static_cast<size_t>(length));
  char bytes[4];
  for (int32_t i = 0; i < length; ++i) out.append(bytes, EncodeOne(NextScalar(units, length, i), bytes));
}

template <class Unit>
size_t EncodeBounded(const Unit* units, int32_t length, char* out, size_t capacity) noexcept {
  size_t used = 0;
  char bytes[4];
  for (int32_t i = 0; i < length; ++i) {
    const size_t n = EncodeOne(NextScalar(units, length, i), bytes);
    if (used + n > capacity) break;
    for (size_t k = 0; k < n; ++k) out[used++] = bytes[k];
  }
  return used;
}

}  // namespace

int32_t KUtf8::CountUtf16Units(const char* utf8, size_t bytes) noexcept {
  const auto* p = reinterpret_cast<const unsigned char*>(utf8);
  const auto* end = p + bytes;
  int32_t units = 0;
  while (p != end) units += DecodeOne(p, end) >= 0x10000 ? 2 : 1;
  return units;
}

void KUtf8::DecodeToUtf16(const char* utf8, size_t bytes, char16_t* out) noexcept {
  const auto* p = reinterpret_cast<const unsigned char*>(utf8);
  const auto* end = p + bytes;
  while (p != end) {
    const char32_t c = DecodeOne(p, end);
    if (c >= 0x10000) {
      *out++ = static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10));
      *out++ = static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
    } else {
      *out++ = static_cast<char16_t>(c);
    }
  }
}

void KUtf8::Encode(const char16_t* units, int32_t length, std::string& out) { EncodeAppending(units, length, out); }
void KUtf8::Encode(const char* units, int32_t length, std::string& out) { EncodeAppending(units, length, out); }

size_t KUtf8::EncodeInto(const char16_t* units, int32_t length, char* out, size_t capacity) noexcept {
  return EncodeBounded(units, length, out, capacity);
}
size_t KUtf8::EncodeInto(const char* units, int32_t length, char* out, size_t capacity) noexcept {
  return EncodeBounded(units, length, out, capacity);
}
