// Parameters: defaults, values, the update-pending mark, texts and lookup by key.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "core/KAudioPluginBase.h"
#include "core/KParameter.h"

namespace {
const KDecibelKind kGain(-60.0, 24.0);
const KTimeKind kRelease(0.001, 2.0);
constexpr const char* kModeNames[] = {"Clean", "Warm", "Hot"};
const KListKind kMode(kModeNames);
const KSwitchKind kSwitch;

constexpr KParameterInfo kTable[] = {
    {"gain", "Gain", &kGain, -6.0, KParameterInfo::kAutomatable},
    {"release", "Release", &kRelease, 0.005, KParameterInfo::kAutomatable},
    {"mode", "Mode", &kMode, 2.0, KParameterInfo::kAutomatable},
    {"bypass", "Bypass", &kSwitch, 0.0, 0},
};

class ParameterTest : public ::testing::Test {
protected:
  ParameterTest() { plugin.TakeUpdatePending(); }  // a new plug-in starts with its update pending

  KAudioPluginBase plugin{kTable};
  KAudioPluginBase::Parameter& gain = plugin.GetParameter(0);
  KAudioPluginBase::Parameter& release = plugin.GetParameter(1);
  KAudioPluginBase::Parameter& mode = plugin.GetParameter(2);
};
}  // namespace

TEST_F(ParameterTest, TableRowsBecomeParametersWithTheirDefaults) {
  ASSERT_EQ(plugin.ParameterCount(), 4);
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) {
    const KAudioPluginBase::Parameter& p = plugin.GetParameter(i);
    SCOPED_TRACE(p.Key().ToUtf8());
    EXPECT_EQ(p.Index(), i);
    EXPECT_EQ(&p.Info(), &kTable[i]);
    EXPECT_NEAR(p.Working(), kTable[i].defaultValue, 1e-12);
    EXPECT_EQ(p.Normalized(), kTable[i].kind->ToNormalized(kTable[i].defaultValue));
    EXPECT_EQ(p.DefaultNormalized(), p.Normalized());
  }
  EXPECT_EQ(gain.Name().ToUtf8(), "Gain");
  EXPECT_EQ(gain.Unit().ToUtf8(), "dB");
  EXPECT_EQ(mode.Steps(), 2);
  EXPECT_TRUE(gain.IsAutomatable());
  EXPECT_FALSE(plugin.GetParameter(3).IsAutomatable());
  EXPECT_EQ(gain.Text().ToUtf8(), "-6.0");
  EXPECT_EQ(release.Text().ToUtf8(), "5.00");
  EXPECT_EQ(mode.Text().ToUtf8(), "Hot");
}

TEST_F(ParameterTest, OnlyARealChangeMarksTheUpdatePending) {
  EXPECT_FALSE(plugin.TakeUpdatePending());
  gain.SetNormalized(0.25);
  EXPECT_TRUE(plugin.TakeUpdatePending());
  EXPECT_FALSE(plugin.TakeUpdatePending());  // taking clears it
  EXPECT_DOUBLE_EQ(gain.Working(), -39.0);

  gain.SetNormalized(0.25);
  EXPECT_FALSE(plugin.TakeUpdatePending());

  gain.SetNormalized(7.0);  // clamped to the top
  EXPECT_TRUE(plugin.TakeUpdatePending());
  EXPECT_EQ(gain.Normalized(), 1.0);
  EXPECT_EQ(gain.Working(), 24.0);
  gain.SetNormalized(1.5);  // clamps to the value it already has
  EXPECT_FALSE(plugin.TakeUpdatePending());

  gain.SetNormalized(std::numeric_limits<double>::quiet_NaN());
  EXPECT_TRUE(plugin.TakeUpdatePending());
  EXPECT_EQ(gain.Normalized(), 0.0);
  EXPECT_EQ(gain.Working(), -60.0);
  gain.SetNormalized(-3.0);
  EXPECT_FALSE(plugin.TakeUpdatePending());

  gain.SetWorking(-6.0);
  EXPECT_TRUE(plugin.TakeUpdatePending());
  EXPECT_NEAR(gain.Working(), -6.0, 1e-12);
  EXPECT_EQ(&gain.Value(), &plugin.GetParameter(0).Value());
  EXPECT_EQ(gain.Value().Working(), gain.Working());
}

TEST_F(ParameterTest, TextsBothWays) {
  EXPECT_EQ(gain.TextForNormalized(0.5).ToUtf8(), "-18.0");
  EXPECT_EQ(mode.TextForNormalized(0.5).ToUtf8(), "Warm");
  EXPECT_EQ(release.TextForNormalized(0.0).ToUtf8(), "1.00");
  EXPECT_EQ(gain.Text().ToUtf8(), "-6.0");  // asking for another value's text changes nothing
  EXPECT_FALSE(plugin.TakeUpdatePending());

  double normalized = 0.0;
  ASSERT_TRUE(gain.NormalizedFromText("+12 dB", normalized));
  EXPECT_DOUBLE_EQ(normalized, 72.0 / 84.0);
  ASSERT_TRUE(release.NormalizedFromText("0.25 s", normalized));
  EXPECT_DOUBLE_EQ(release.Kind().ToWorking(normalized), 0.25);
  ASSERT_TRUE(mode.NormalizedFromText("warm", normalized));
  EXPECT_EQ(normalized, 0.5);
  EXPECT_NEAR(gain.Working(), -6.0, 1e-12);  // reading a text sets nothing

  normalized = 0.125;
  EXPECT_FALSE(gain.NormalizedFromText("loud", normalized));
  EXPECT_FALSE(mode.NormalizedFromText("Boiling", normalized));
  EXPECT_EQ(normalized, 0.125);
}

TEST_F(ParameterTest, FindParameterByKey) {
  EXPECT_EQ(plugin.FindParameter("release"), &release);
  EXPECT_EQ(plugin.FindParameter("bypass"), &plugin.GetParameter(3));
  EXPECT_EQ(plugin.FindParameter("Release"), nullptr);  // keys are exact
  EXPECT_EQ(plugin.FindParameter("gai"), nullptr);
  EXPECT_EQ(plugin.FindParameter({}), nullptr);
}
