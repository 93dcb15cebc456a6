#include <benchmark/benchmark.h>

#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "kernel/KPluginRegistry.h"

namespace {
// A registry the size of the product's: 132 class-like names, registered as literals (as the
// builder does) and looked up with the inline strings a host's name becomes.
struct KRegistryFixture {
  std::vector<std::string> keys;   // "KSampleCompressor", ...
  KPluginRegistry full;            // keys with the prefix letter
  KPluginRegistry shortKeys;       // module style: "SampleCompressor"
  std::vector<KString> exactNames, truncatedNames;

  // The reference tables hold the same names in standard containers.
  struct ViewHash {
    using is_transparent = void;
    size_t operator()(std::u16string_view text) const noexcept { return std::hash<std::u16string_view>()(text); }
  };
  std::unordered_map<std::u16string, void*, ViewHash, std::equal_to<>> fullMap, shortMap;
  std::vector<std::u16string> fullList, truncatedWide;

  KRegistryFixture() {
    static const char* const kinds[] = {"Sample",   "Multiband", "Stereo",   "Vintage", "Tape",     "Linear",
                                        "Dynamic",  "Vocal",     "Analog",   "Spectral", "Parallel", "Transient"};
    static const char* const effects[] = {"Compressor", "Equalizer", "Reverb", "Delay",     "Limiter", "Chorus",
                                          "Flanger",    "Phaser",    "Gate",   "Saturator", "Filter"};
    for (const char* kind : kinds)
      for (const char* effect : effects) keys.push_back(std::string("K") + kind + effect);
    for (const std::string& key : keys) {
      full.Register(KString::Static(key.c_str()), nullptr, {});
      shortKeys.Register(KString::Static(key.c_str() + 1), nullptr, {});
      exactNames.push_back(KString::Widen(key.c_str()));
      // Three characters short: neither a key nor a key without "K", so only the scan finds it.
      truncatedNames.push_back(KString::Widen(key.c_str(), key.size() - 3));

      const std::u16string wide(key.begin(), key.end());
      fullMap.emplace(wide, nullptr);
      shortMap.emplace(wide.substr(1), nullptr);
      fullList.push_back(wide);
      truncatedWide.push_back(wide.substr(0, wide.size() - 3));
    }
  }

  // The plain scan the registry's third route is measured against: first entry that agrees
  // with the name on their common length.
  const std::u16string* Scan(const std::u16string& name) const noexcept {
    for (const std::u16string& key : fullList) {
      const size_t common = name.size() < key.size() ? name.size() : key.size();
      if (std::char_traits<char16_t>::compare(name.data(), key.data(), common) == 0) return &key;
    }
    return nullptr;
  }
};

const KRegistryFixture& Fixture() {
  static const KRegistryFixture fixture;
  return fixture;
}

template <class Lookup>
void RunOverNames(benchmark::State& state, size_t count, Lookup lookup) {
  for (auto _ : state)
    for (size_t i = 0; i < count; ++i) benchmark::DoNotOptimize(lookup(i));
  state.SetItemsProcessed(static_cast<int64_t>(state.iterations() * count));
}
}  // namespace

static void BM_Registry_Exact(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.exactNames.size(), [&](size_t i) { return f.full.Find(f.exactNames[i]); });
}
static void BM_Reference_Exact_UnorderedMap(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.fullList.size(), [&](size_t i) { return f.fullMap.find(f.fullList[i]) != f.fullMap.end(); });
}

// "KSampleCompressor" against a registry of short keys: a miss, then a hit without the "K".
static void BM_Registry_WithoutPrefixLetter(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.exactNames.size(), [&](size_t i) { return f.shortKeys.Find(f.exactNames[i]); });
}
static void BM_Reference_WithoutPrefixLetter_UnorderedMap(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.fullList.size(), [&](size_t i) {
    const std::u16string_view name = f.fullList[i];
    if (f.shortMap.find(name) != f.shortMap.end()) return true;
    return f.shortMap.find(name.substr(1)) != f.shortMap.end();
  });
}

// Truncated names: two hash misses, then the scan in registration order.
static void BM_Registry_PrefixScan(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.truncatedNames.size(), [&](size_t i) { return f.full.Find(f.truncatedNames[i]); });
}
static void BM_Reference_PrefixScan_Linear(benchmark::State& state) {
  const KRegistryFixture& f = Fixture();
  RunOverNames(state, f.truncatedWide.size(), [&](size_t i) { return f.Scan(f.truncatedWide[i]); });
}

BENCHMARK(BM_Registry_Exact);
BENCHMARK(BM_Reference_Exact_UnorderedMap);
BENCHMARK(BM_Registry_WithoutPrefixLetter);
BENCHMARK(BM_Reference_WithoutPrefixLetter_UnorderedMap);
BENCHMARK(BM_Registry_PrefixScan);
BENCHMARK(BM_Reference_PrefixScan_Linear);
