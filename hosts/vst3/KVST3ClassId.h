#pragma once

// The class identifier of each plug-in, derived from its registry key. Hosts save projects
// under it, so the rule below never changes once a plug-in has been released:
//
//   text  = "Torvane." followed by the key, e.g. "Torvane.KCompressorPlugin"
//   high  = FNV-1a 64-bit hash of text               (offset basis 0xCBF29CE484222325,
//   low   = FNV-1a 64-bit hash of text + ".VST3"      prime 0x100000001B3, over the bytes)
//   class id bytes 0-7 = high, most significant byte first; bytes 8-15 = low, likewise.
//
// The bytes are the same on every system; written as the four published words they read
// high >> 32, high & 0xFFFFFFFF, low >> 32, low & 0xFFFFFFFF.

#include <cstdint>
#include <string_view>

#include "hosts/vst3/KVST3Base.h"

namespace KVST3 {

constexpr uint64_t KFNV1a64(std::string_view text, uint64_t hash = 0xCBF29CE484222325ull) noexcept {
  for (const char c : text) {
    hash ^= static_cast<unsigned char>(c);
    hash *= 0x100000001B3ull;
  }
  return hash;
}

constexpr KUID KClassIdOf(std::string_view key) noexcept {
  const uint64_t text = KFNV1a64(key, KFNV1a64("Torvane."));
  const uint64_t high = text;
  const uint64_t low = KFNV1a64(".VST3", text);
  return KUID::FromWords(static_cast<uint32_t>(high >> 32), static_cast<uint32_t>(high),
                         static_cast<uint32_t>(low >> 32), static_cast<uint32_t>(low));
}

// Released identifiers stay put: the rule's value for one key, worked out by hand.
static_assert(KClassIdOf("KCompressorPlugin") == KUID::FromWords(0xF1DE0DFF, 0x0C09900F, 0x11CFA2FC, 0xE8B122D9));

}  // namespace KVST3
