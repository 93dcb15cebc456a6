#pragma once

#include <cstdint>

// The characters of element and attribute names, shared by the reader and the writer so that
// every name written reads back. ASCII follows XML (a letter, "_" or ":" first, then also
// digits, "-" and "."); every character above U+007F is accepted, which is looser than XML's
// tables but never ambiguous with markup. Works on UTF-16 units and on UTF-8 bytes alike.
struct KXMLName {
  static constexpr bool IsStart(uint32_t c) noexcept {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || c == ':' || c >= 0x80;
  }
  static constexpr bool IsPart(uint32_t c) noexcept {
    return IsStart(c) || (c >= '0' && c <= '9') || c == '-' || c == '.';
  }
};
