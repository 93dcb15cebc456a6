#include <gtest/gtest.h>

#include <limits>

#include "core/KAudioPluginBase.h"
#include "core/KParameter.h"
#include "core/KParameterInfo.h"

namespace {
const KDecibelKind kGain(-60.0, 24.0);
constexpr KParameterInfo kTable[] = {{"gain", "Gain", &kGain, -6.0, KParameterInfo::kAutomatable}};
}  // namespace

// Setting a parameter marks the plug-in's update pending only when the (clamped) value changes.
TEST(Parameter, OnlyARealChangeMarksTheUpdatePending) {
  KAudioPluginBase plugin{kTable};
  KAudioPluginBase::Parameter& gain = plugin.GetParameter(0);
  EXPECT_EQ(gain.Text().ToUtf8(), "-6.0");   // the default is a working value
  EXPECT_TRUE(plugin.TakeUpdatePending());   // a new plug-in starts with its update pending
  EXPECT_FALSE(plugin.TakeUpdatePending());  // taking clears it
  struct Step { double set; bool marks; double normalized; };
  const Step steps[] = {{0.25, true, 0.25}, {0.25, false, 0.25}, {7.0, true, 1.0}, {1.5, false, 1.0},
               {std::numeric_limits<double>::quiet_NaN(), true, 0.0}, {-3.0, false, 0.0}};
  for (const auto& step : steps) {
    gain.SetNormalized(step.set);
    EXPECT_EQ(plugin.TakeUpdatePending(), step.marks) << step.set;
    EXPECT_EQ(gain.Normalized(), step.normalized) << step.set;
  }
  gain.SetWorking(-39.0);
  EXPECT_TRUE(plugin.TakeUpdatePending());
  EXPECT_DOUBLE_EQ(gain.Normalized(), 0.25);
}

// A parameter's index is its key's row, found while compiling (a key not in the table would not
// compile), so a plug-in's indices cannot drift from its table.
namespace {
const KSwitchKind kRowSwitch;
constexpr KParameterInfo kRows[] = {{"first", "First", &kRowSwitch, 0.0, 0}, {"second", "Second", &kRowSwitch, 1.0, 0}};
static_assert(KParameterRow(kRows, "first") == 0 && KParameterRow(kRows, "second") == 1);
}  // namespace
