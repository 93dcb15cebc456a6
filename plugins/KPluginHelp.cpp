#include "plugins/KPluginHelp.h"

#include "kernel/KCatalogue.h"

namespace {
// Whether `key` matches `pattern`, a "#" in it standing for one or more digits.
bool Matches(std::string_view pattern, std::string_view key, int32_t& number) noexcept {
  size_t k = 0;
  number = 0;
  for (const char p : pattern) {
    if (p != '#') {
      if (k >= key.size() || key[k] != p) return false;
      ++k;
      continue;
    }
    const size_t start = k;
    while (k < key.size() && key[k] >= '0' && key[k] <= '9' && number < 100000) number = number * 10 + (key[k++] - '0');
    if (k == start) return false;
  }
  return k == key.size();
}
}  // namespace

const KParameterHelp* KPluginHelp::Find(std::string_view key, int32_t& number) const noexcept {
  for (const KParameterHelp& entry : parameters)
    if (Matches(entry.key, key, number)) return &entry;
  number = 0;
  return nullptr;
}

const KPluginHelp* KFindPluginHelp(std::string_view plugin) noexcept {
  const KPluginDescription* description = KFindDescription(KProductCatalogue(), plugin);
  return description && description->help ? &description->help() : nullptr;
}
