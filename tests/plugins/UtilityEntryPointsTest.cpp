// The product's exports end to end with the utility plug-in, in a process of their own.
#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"
#include "plugins/utility/KUtilityPlugin.h"

static std::vector<std::string> gMessages;
static void RecordMessage(const KString& text) { gMessages.push_back(text.ToUtf8()); }

// Whether the instance is a working utility: at +6.02 dB it doubles a block of stereo audio.
static bool DoublesAudio(KAudioPlugin& plugin) {
  KAudioPluginBase::Parameter* gain = plugin.FindParameter("gain");
  if (!gain || plugin.OutputChannelCount() != 2 || !plugin.SetSampleRate(48000.0)) return false;
  gain->SetWorking(6.02);
  const float left[4] = {0.25f, -0.5f, 0.125f, 0.0f}, right[4] = {-0.25f, 0.5f, 0.0f, 0.375f};
  float outLeft[4], outRight[4];
  const float* in[] = {left, right};
  float* out[] = {outLeft, outRight};
  plugin.ProcessHostBlock(in, out, 4);
  for (int i = 0; i < 4; ++i)
    if (std::abs(outLeft[i] - 2.0f * left[i]) > 1e-3f || std::abs(outRight[i] - 2.0f * right[i]) > 1e-3f) return false;
  return true;
}

// The exact key, a truncated key and a key with a tail find the utility and name the instance as
// asked. The main registry's keys carry the prefix letter, and a name never gains one.
TEST(UtilityEntryPoints, CreatedByItsNameOrAPrefixButNeverByANameWithoutTheK) {
  const KUserMessageHook previous = KSetUserMessageHook(RecordMessage);
  EXPECT_GE(GetTorvanePluginList().IndexOf("KUtilityPlugin"), 0);
  for (const char* name : {"KUtilityPlugin", "KUtility", "KUtilityPlugin2"}) {
    const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::FromUtf8(name)));
    ASSERT_NE(plugin, nullptr) << name;
    EXPECT_NE(dynamic_cast<KUtilityPlugin*>(plugin.get()), nullptr) << name;
    EXPECT_EQ(plugin->Identifier().ToUtf8(), name);
    EXPECT_TRUE(DoublesAudio(*plugin)) << name;
  }
  EXPECT_TRUE(gMessages.empty());
  for (const char* name : {"UtilityPlugin", "Utility"}) EXPECT_EQ(CreateTorvanePlugin(KString::FromUtf8(name)), nullptr) << name;
  KSetUserMessageHook(previous);
  EXPECT_EQ(gMessages, (std::vector<std::string>{"Could not create plugin UtilityPlugin.\n\nError: Plugin UtilityPlugin hasn't been found.",
                                                 "Could not create plugin Utility.\n\nError: Plugin Utility hasn't been found."}));
  // The short name lives in the module registry, under "Stereo".
  const KPluginRecord* module = KRegistries::Instance().Modules().FindExact("Utility");
  ASSERT_NE(module, nullptr);
  EXPECT_EQ(module->category.ToUtf8(), "Stereo");
  EXPECT_EQ(module->factory, &KUtilityPlugin::Create);
}
