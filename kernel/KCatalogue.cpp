#include "kernel/KCatalogue.h"

#include <cstring>
#include <map>
#include <string>

#include "kernel/KPluginIdentifiers.h"
#include "kernel/KRegistries.h"

namespace {
bool Given(const char* text) { return text && *text; }

std::string Named(const KPluginDescription& plugin, size_t index) {
  return Given(plugin.key) ? std::string(plugin.key) : "plug-in " + std::to_string(index + 1);
}

bool IsCategory(const char* category) {
  for (const char* known : KRegistries::kCategories)
    if (Given(category) && std::strcmp(known, category) == 0) return true;
  return false;
}

// Remembers who first used each value of one identifier and reports whoever uses it again.
class KUniqueness {
public:
  explicit KUniqueness(const char* what) : what_(what) {}
  void Claim(const std::string& value, const std::string& owner, KStringList& problems) {
    const auto [first, fresh] = owners_.emplace(value, owner);
    if (!fresh) problems.Append(KString::FromUtf8(first->second + " and " + owner + " share the " + what_ + " \"" + value + "\"."));
  }

private:
  const char* what_;
  std::map<std::string, std::string> owners_;
};
}  // namespace

const KPluginDescription* KFindDescription(const KCatalogue& catalogue, std::string_view key) noexcept {
  for (const KPluginDescription& plugin : catalogue.plugins)
    if (plugin.key && key == plugin.key) return &plugin;
  return nullptr;
}

KStringList KCatalogueProblems(const KCatalogue& catalogue) {
  KStringList problems;
  auto problem = [&](const std::string& text) { problems.Append(KString::FromUtf8(text)); };
  KUniqueness keys("key"), modules("module key"), identities("identity"), vst2Ids("VST 2 id"), classIds("VST 3 class id"),
      aaxIds("AAX plug-in id"), bundles("bundle name");
  for (size_t i = 0; i < catalogue.plugins.size(); ++i) {
    const KPluginDescription& plugin = catalogue.plugins[i];
    const std::string who = Named(plugin, i);
    const std::pair<const char*, const char*> required[] = {{"key", plugin.key},           {"name", plugin.name},
                                                            {"VST 3 sub-categories", plugin.vst3SubCategories},
                                                            {"VST 2 id", plugin.vst2Id},   {"identity", plugin.identity},
                                                            {"vendor", plugin.vendor},     {"version", plugin.version}};
    for (const auto& [field, value] : required)
      if (!Given(value)) problem(who + " has no " + field + ".");
    if (!plugin.factory) problem(who + " has no factory.");
    if (Given(plugin.key) && plugin.key[0] != 'K') problem(who + ": a key begins with \"K\".");
    if (plugin.moduleKey && !IsCategory(plugin.category)) problem(who + " is a module of no known category.");
    if (Given(plugin.vst2Id)) {
      const std::string id = plugin.vst2Id;
      bool printable = id.size() == 4;
      for (const char c : id) printable = printable && c >= 0x20 && c < 0x7F;
      if (!printable) problem(who + ": the VST 2 id \"" + id + "\" is not four printable ASCII characters.");
      vst2Ids.Claim(id, who, problems);
    }
    if (Given(plugin.key)) {
      keys.Claim(plugin.key, who, problems);
      bundles.Claim(KPluginIds::BundleName(plugin.key), who, problems);
    }
    if (Given(plugin.moduleKey)) modules.Claim(plugin.moduleKey, who, problems);
    if (Given(plugin.identity)) {
      identities.Claim(plugin.identity, who, problems);
      std::string words;
      for (const uint32_t word : KPluginIds::VST3ClassWords(plugin.identity)) words += std::to_string(word) + ".";
      classIds.Claim(words, who, problems);
      aaxIds.Claim(std::to_string(KPluginIds::AAXPluginId(plugin.identity)), who, problems);
    }
  }
  return problems;
}
