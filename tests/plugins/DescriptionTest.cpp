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
const Released kReleased[] = {
    {"KUtilityPlugin", "DF0106AD B7E01744 F2F781A7 8CB082C4", 0x54765574, static_cast<int32_t>(0x02A3D501)},
    {"KCompressorPlugin", "F1DE0DFF 0C09900F 11CFA2FC E8B122D9", 0x5476436F, static_cast<int32_t>(0xD221FEBB)},
    {"KEqualizerPlugin", "8FCBB6A5 CF3DD354 4B1A0A86 868302F4", 0x54764571, static_cast<int32_t>(0xBD0D05C2)},
    {"KSampleWarmer", "003667AA 3B1E4EFD E8BAC290 D213509B", 0x54765357, static_cast<int32_t>(0x16E13430)},
    {"KLimiterPlugin", "70CCC6F6 B29F70A8 711C681E 3A2C2998", 0x54764C69, static_cast<int32_t>(0x5ACAF0E8)},
    {"KGatePlugin", "329F8F2F DB29196D FECF48D8 D9DA0D2B", 0x54764761, static_cast<int32_t>(0x1CE0AE22)},
    {"KBitCrusherPlugin", "ED5ED4EC 8FFF17A7 0A10914A FED95FF1", 0x54764243, static_cast<int32_t>(0x672290BB)},
    {"KTransientShaperPlugin", "9EED1CA2 C93E5EC7 9353E69A B1F110D1", 0x54765453, static_cast<int32_t>(0x2706D810)},
    {"KMultibandCompressorPlugin", "01F23292 2871CB63 1F6D1F7C FF9F95DD", 0x54764D43, static_cast<int32_t>(0x69A3FDBE)},
    {"KDynamicEqualizerPlugin", "D6F3CA71 F2153705 B6B6529B 2A00EAE3", 0x54764445, static_cast<int32_t>(0x81433797)},
    {"KWaveshaperPlugin", "290CF3E4 0B541C06 BC6228BE 062C5CCA", 0x54765753, static_cast<int32_t>(0xEF80149A)},
    {"KEffectPipeline", "E66D1AEF 14147DF2 C2B2E9F7 F62AF596", 0x54764550, static_cast<int32_t>(0x58FE3A8E)},
    {"KDelayPlugin", "A0148F96 B6F01F9B 0FB799B9 1EBEF5F5", 0x5476446C, static_cast<int32_t>(0xB1E309BC)},
    {"KReverbPlugin", "35B96149 1663E67A 5238F01C 813A115E", 0x54765276, static_cast<int32_t>(0x612C2887)},
    {"KChorusPlugin", "B397E36A EE770D98 EB995FE1 A47FF0E8", 0x54764368, static_cast<int32_t>(0x031586A0)},
    {"KFlangerPlugin", "A6856236 5FAF7C75 F94CAA41 5F091933", 0x5476466C, static_cast<int32_t>(0xDC8C3C05)},
    {"KPhaserPlugin", "979B7CC7 39814F69 4264A4A7 48611487", 0x54765068, static_cast<int32_t>(0x23C764B3)},
    {"KTremoloPlugin", "1570384E 4F351DC8 4DF2B943 079A19F8", 0x54765472, static_cast<int32_t>(0x988518BF)},
    {"KAutoPanPlugin", "631B2887 9A2DC0FA 7D0A73D5 FA4290DE", 0x54764150, static_cast<int32_t>(0xC233D7E9)},
    {"KAutoFilterPlugin", "AE85A222 1F2F8FE3 F0EA6AD6 21DF935D", 0x54764146, static_cast<int32_t>(0x7FB9E0C8)},
    {"KConvolutionReverbPlugin", "9640956E 220EE08A F8D0C96A 0EC2ABCE", 0x54764372, static_cast<int32_t>(0xF6FB7311)},
    {"KLoudnessMeterPlugin", "CF9BB065 F59B0FE8 D385A4A1 0DDAB7D8", 0x54764C6D, static_cast<int32_t>(0xCE463DB3)},
    {"KSpectrumAnalyserPlugin", "AAA7A3C2 6CB5CE8C F2747005 FB53BFCC", 0x54765361, static_cast<int32_t>(0xCF218812)},
    {"KMidSidePlugin", "D2E5B3DA 2757FCE9 75EFF66B 30BD2D07", 0x54764D73, static_cast<int32_t>(0x965B44D0)},
    {"KStereoImagerPlugin", "EF203075 B5D5FCF3 E2972BFD 421C4D4D", 0x54765369, static_cast<int32_t>(0x708C425D)},
    {"KToneGeneratorPlugin", "3F6BF9CC 3BE1A051 22EA4AF9 60DDD7CF", 0x54765467, static_cast<int32_t>(0x6B0A553F)},
};
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
