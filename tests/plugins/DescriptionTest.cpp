// The product's descriptions: whole and free of clashes, the identifiers of the released plug-ins
// exactly as hosts saved them, and the README's table of plug-ins as the descriptions say.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <set>
#include <string>

#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace {
std::string Hex(uint32_t value) {
  char text[9];
  std::snprintf(text, sizeof text, "%08X", value);
  return text;
}

std::string ClassId(const char* identity) {
  std::string id;
  for (const uint32_t word : KPluginIds::VST3ClassWords(identity)) id += (id.empty() ? "" : " ") + Hex(word);
  return id;
}

// The README's row of a plug-in.
std::string TableRow(const KPluginDescription& plugin) {
  std::string subCategories = plugin.vst3SubCategories;
  for (size_t bar = subCategories.find('|'); bar != std::string::npos; bar = subCategories.find('|', bar + 2)) subCategories.insert(bar, "\\");
  const std::string module = plugin.moduleKey ? std::string(plugin.moduleKey) + " (" + plugin.category + ")" : "";
  return "| `" + std::string(plugin.key) + "` | " + plugin.name + " | " + module + " | " + subCategories + " | `" + plugin.vst2Id + "` | `" +
         ClassId(plugin.identity) + "` |";
}

const KPluginDescription* Find(const char* key) { return KFindDescription(KProductCatalogue(), key); }

// Hosts saved projects under these: they never change. Releasing a plug-in adds its row here and
// to the README's table.
struct Released {
  const char* key;
  const char* classId;
  int32_t vst2;
  int32_t aaxPlugin;
};
const Released kReleased[] = {{"KUtilityPlugin", "DF0106AD B7E01744 F2F781A7 8CB082C4", 0x54765574, 0x02A3D501},
                              {"KCompressorPlugin", "F1DE0DFF 0C09900F 11CFA2FC E8B122D9", 0x5476436F, static_cast<int32_t>(0xD221FEBB)},
                              {"KEqualizerPlugin", "8FCBB6A5 CF3DD354 4B1A0A86 868302F4", 0x54764571, static_cast<int32_t>(0xBD0D05C2)},
                              {"KSampleWarmer", "003667AA 3B1E4EFD E8BAC290 D213509B", 0x54765357, 0x16E13430}};
}  // namespace

TEST(Descriptions, TheProductCatalogueHasNoFaults) {
  std::string faults;
  for (const KString& problem : KCatalogueProblems(KProductCatalogue())) faults += problem.ToUtf8() + "\n";
  EXPECT_EQ(faults, "");
}

TEST(Descriptions, ReleasedPluginsKeepTheirIdentifiers) {
  for (const Released& plugin : kReleased) {
    const KPluginDescription* found = Find(plugin.key);
    ASSERT_TRUE(found) << plugin.key;
    EXPECT_EQ(ClassId(found->identity), plugin.classId) << plugin.key;
    EXPECT_EQ(KPluginIds::VST2UniqueId(found->vst2Id), plugin.vst2) << plugin.key;
    EXPECT_EQ(KPluginIds::AAXProductId(found->vst2Id), plugin.vst2) << plugin.key;
    EXPECT_EQ(KPluginIds::AAXPluginId(found->identity), plugin.aaxPlugin) << plugin.key;
    EXPECT_EQ(KPluginIds::LV2URI(found->identity), "urn:torvane:" + std::string(plugin.key));
    EXPECT_EQ(KPluginIds::CLAPId(found->identity), "torvane." + std::string(plugin.key));
  }
}

// Every row of the README's table says what its plug-in's description says, and every released
// plug-in has one; a plug-in not yet released may be missing.
TEST(Descriptions, TheReadmeTableAgreesWithTheDescriptions) {
  std::ifstream readme(TORVANE_SOURCE_DIR "/README.md");
  ASSERT_TRUE(readme) << "README.md not found";
  std::set<std::string> rows;
  for (std::string line; std::getline(readme, line);)
    if (line.starts_with("| `K")) rows.insert(line);
  for (const std::string& row : rows) {
    const std::string key = row.substr(3, row.find('`', 3) - 3);
    const KPluginDescription* found = Find(key.c_str());
    EXPECT_TRUE(found && row == TableRow(*found)) << "README.md: " << row << "\nthe description says: " << (found ? TableRow(*found) : "nothing");
  }
  for (const Released& plugin : kReleased) {
    const KPluginDescription* found = Find(plugin.key);
    ASSERT_TRUE(found) << plugin.key;
    EXPECT_TRUE(rows.contains(TableRow(*found))) << "README.md lacks\n" << TableRow(*found);
  }
}
