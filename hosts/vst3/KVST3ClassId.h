#pragma once

// The class identifier of each plug-in, derived from its description's identity by the rule of
// kernel/KPluginIdentifiers.h. Hosts save projects under it, so the rule never changes once a
// plug-in has been released. The bytes are the same on every system: the four published words,
// each most significant byte first.

#include <string_view>

#include "hosts/vst3/KVST3Base.h"
#include "kernel/KPluginIdentifiers.h"

namespace KVST3 {

constexpr KUID KClassIdOf(std::string_view identity) noexcept {
  const auto words = KPluginIds::VST3ClassWords(identity);
  return KUID::FromWords(words[0], words[1], words[2], words[3]);
}

// Released identifiers stay put: the rule's value for one identity, worked out by hand.
static_assert(KClassIdOf("KCompressorPlugin") == KUID::FromWords(0xF1DE0DFF, 0x0C09900F, 0x11CFA2FC, 0xE8B122D9));

}  // namespace KVST3
