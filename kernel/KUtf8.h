#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "kernel/KExport.h"

// Conversion between the UTF-16 kept inside and the UTF-8 of files and host chunks.
// Malformed input (bad UTF-8, unpaired surrogates) becomes U+FFFD; nothing throws.
struct KUtf8 {
  TORVANE_API static int32_t CountUtf16Units(const char* utf8, size_t bytes) noexcept;
  // Writes exactly CountUtf16Units(utf8, bytes) units to `out`.
  TORVANE_API static void DecodeToUtf16(const char* utf8, size_t bytes, char16_t* out) noexcept;
  TORVANE_API static void Encode(const char16_t* units, int32_t length, std::string& out);
  // 8-bit units are Latin-1: each byte is one character.
  TORVANE_API static void Encode(const char* units, int32_t length, std::string& out);
  // Bounded forms for paths that must not allocate: as much as fits whole into `capacity`
  // bytes; answers the bytes written.
  TORVANE_API static size_t EncodeInto(const char16_t* units, int32_t length, char* out, size_t capacity) noexcept;
  TORVANE_API static size_t EncodeInto(const char* units, int32_t length, char* out, size_t capacity) noexcept;
};
