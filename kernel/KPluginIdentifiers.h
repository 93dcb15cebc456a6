#pragma once

// The identifiers of a plug-in in each host format, derived from its description. Hosts save
// projects under them, so none of these rules ever changes once a plug-in has been released
// (a test pins the values of the released plug-ins):
//
//   VST 3 class id   words 0-1: FNV-1a 64 of "Torvane." + identity, most significant first;
//                    words 2-3: FNV-1a 64 of "Torvane." + identity + ".VST3", likewise
//   VST 2 unique id  the four characters of vst2Id, the first in the most significant byte
//   AAX product id   the VST 2 unique id
//   AAX plug-in id   the upper 32 bits of FNV-1a 64 of "Torvane." + identity + ".AAX"
//   LV2 URI          "urn:torvane:" + identity
//   CLAP id          "torvane." + identity
//   bundle name      the key without its leading "K" and without a trailing "Plugin"
//                    (KCompressorPlugin -> Compressor, KSampleWarmer -> SampleWarmer)
//
// FNV-1a 64 runs over the bytes of the text: offset basis 0xCBF29CE484222325, prime 0x100000001B3.

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

namespace KPluginIds {

constexpr uint64_t FNV1a64(std::string_view text, uint64_t hash = 0xCBF29CE484222325ull) noexcept {
  for (const char c : text) {
    hash ^= static_cast<unsigned char>(c);
    hash *= 0x100000001B3ull;
  }
  return hash;
}

inline constexpr std::string_view kPrefix = "Torvane.";

// The four 32-bit words of the class identifier, as VST 3 publishes identifiers.
constexpr std::array<uint32_t, 4> VST3ClassWords(std::string_view identity) noexcept {
  const uint64_t high = FNV1a64(identity, FNV1a64(kPrefix));
  const uint64_t low = FNV1a64(".VST3", high);
  return {static_cast<uint32_t>(high >> 32), static_cast<uint32_t>(high), static_cast<uint32_t>(low >> 32),
          static_cast<uint32_t>(low)};
}

// Expects the four characters that KCatalogueProblems insists on.
constexpr int32_t VST2UniqueId(std::string_view vst2Id) noexcept {
  uint32_t id = 0;
  for (const char c : vst2Id.substr(0, 4)) id = id << 8 | static_cast<unsigned char>(c);
  return static_cast<int32_t>(id);
}

constexpr int32_t AAXProductId(std::string_view vst2Id) noexcept { return VST2UniqueId(vst2Id); }

constexpr int32_t AAXPluginId(std::string_view identity) noexcept {
  return static_cast<int32_t>(FNV1a64(".AAX", FNV1a64(identity, FNV1a64(kPrefix))) >> 32);
}

inline std::string LV2URI(std::string_view identity) { return "urn:torvane:" + std::string(identity); }

inline std::string CLAPId(std::string_view identity) { return "torvane." + std::string(identity); }

inline std::string BundleName(std::string_view key) {
  if (key.starts_with('K')) key.remove_prefix(1);
  if (key.size() > 6 && key.ends_with("Plugin")) key.remove_suffix(6);
  return std::string(key);
}

}  // namespace KPluginIds
