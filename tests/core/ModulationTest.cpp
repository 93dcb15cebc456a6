// Modulation in the processing cycle: modulator ramps move a parameter's working value, cut
// the audio at their corners like automation, leave the value hosts and states see alone; and
// multiparameters move their targets along curves.
#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KModulator.h"
#include "core/KParameter.h"
#include "core/KXMLReader.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/BlockBuffers.h"

namespace {
const KNumberKind kTenths(0.0, 10.0, "", "{0.000}");
constexpr KParameterInfo kTable[] = {{"a", "A", &kTenths, 5.0, KParameterInfo::kAutomatable},
                                     {"b", "B", &kTenths, 0.0, KParameterInfo::kAutomatable}};

// Logs each Process call as "<length>@<working value of a>".
class KModulatedPlugin final : public KAudioPlugin {
public:
  KModulatedPlugin() : KAudioPlugin(kTable, {1, 1, false, false, false}) { log_.reserve(4096); }
  // One host block of up to 64 samples; the log holds this block only.
  void Block(int32_t length) {
    log_.clear();
    ProcessHostBlock(buffers_.Inputs(), buffers_.Outputs(), length);
  }
  std::string Log() const { return log_.substr(log_.empty() ? 0 : 1); }
  std::string Run(int32_t length) {
    Block(length);
    return Log();
  }

protected:
  void Process(const float* const*, float* const*, int32_t sampleCount) override {
    char piece[32];
    std::snprintf(piece, sizeof piece, " %d@%g", sampleCount, GetParameter(0).Working());
    log_ += piece;
  }

private:
  std::string log_;
  KBlockBuffers buffers_{2, 2, 64};
};

// Moves "a" by 0.2 from sample 16 of every piece, to as many parameters as the section's
// Target children name.
class KStepModulator final : public KModulator {
public:
  void Modulate(KAudioPlugin& plugin, int32_t length) noexcept override {
    const KAudioPluginBase::RampPoint points[] = {{0, 0.0}, {16, 0.0}, {16, 0.2}, {length, 0.2}};
    plugin.AddRamp(0, points, false, true);
  }
};

std::unique_ptr<KModulator> MakeStep(KAudioPlugin&, const Element& lfos) {
  return lfos.ChildCount() > 0 ? std::make_unique<KStepModulator>() : nullptr;
}

struct MakerScope {
  explicit MakerScope(KModulatorMaker maker) { KSetModulatorMaker(maker); }
  ~MakerScope() { KSetModulatorMaker(nullptr); }
};
}  // namespace

// The modulator's corner splits the block, even the first after a reset; the working value moves,
// the set value and the state do not; automation of the same parameter runs beside it. An empty section stops it and
// takes the offset back.
TEST(Modulation, ModulatorRampsMoveTheWorkingValueOnly) {
  MakerScope scope(&MakeStep);
  KModulatedPlugin plugin;
  ASSERT_EQ(plugin.Run(64), "64@5");
  const std::string state = plugin.WriteState();
  Element lfos(KString::Static("LFOs"));
  lfos.AddChild(KString::Static("LFO"));
  plugin.SetLFOs(lfos);
  {
    KAllocationCounter counter;
    plugin.Block(64);
    EXPECT_EQ(counter.Count(), 0);
  }
  EXPECT_EQ(plugin.Log(), "16@5 48@7");
  // A reset lands automation at once, but the modulation of its first block still moves.
  plugin.Reset();
  EXPECT_EQ(plugin.Run(64), "16@5 48@7");
  EXPECT_EQ(plugin.GetParameter(0).Normalized(), 0.5);
  EXPECT_EQ(plugin.GetParameter(0).Text().ToUtf8(), plugin.GetParameter(0).TextForNormalized(0.5).ToUtf8());
  EXPECT_NE(plugin.WriteState().find("<LFOs><LFO/></LFOs>"), std::string::npos);

  const KAudioPluginBase::RampPoint automation[] = {{0, 0.6}, {64, 0.6}};
  plugin.AddRamp(0, automation, false);  // automation of the same parameter: the modulation adds to it
  EXPECT_EQ(plugin.Run(64), "16@6 48@8");
  plugin.SetLFOs(Element(KString::Static("LFOs")));
  EXPECT_EQ(plugin.Run(64), "64@6");
  plugin.GetParameter(0).SetNormalized(0.5);
  EXPECT_EQ(plugin.WriteState(), state);
}

// A multiparameter moves each target from its From to its To along position^Curve, at once or
// gliding through the curve's corners; its position is kept in the section, which otherwise
// stays as found, and targets naming no parameter are passed over.
TEST(Modulation, MultiParametersMoveTargetsAlongTheirCurves) {
  KModulatedPlugin plugin;
  plugin.ReadState(
      "<TorvaneState><MultiParameters Future=\"x\"><MultiParameter Name=\"Macro\" Colour=\"red\">"
      "<Target Parameter=\"a\" From=\"0.2\" To=\"0.8\" Curve=\"2\"/><Target Parameter=\"b\" From=\"1\" To=\"0\"/>"
      "<Target Parameter=\"gone\"/><Note>kept</Note></MultiParameter></MultiParameters></TorvaneState>");
  ASSERT_EQ(plugin.MultiParameterCount(), 1);
  EXPECT_EQ(plugin.MultiParameter(0).name.ToUtf8(), "Macro");
  ASSERT_EQ(plugin.MultiParameter(0).targets.size(), 2u);

  plugin.SetMultiParameter(0, 0.5);
  plugin.Run(64);
  EXPECT_NEAR(plugin.GetParameter(0).Normalized(), 0.2 + 0.6 * 0.25, 1e-12);
  EXPECT_NEAR(plugin.GetParameter(1).Normalized(), 0.5, 1e-12);

  // Over 300 samples the corners lie 20 apart: at sample 160 the path is at corner 8 of 15,
  // at the end at the curve's top.
  plugin.SetMultiParameter(0, 1.0, 300);
  for (int block = 0; block < 5; ++block) plugin.Run(32);
  const double along = 0.5 + 0.5 * (8.0 / 15);
  EXPECT_NEAR(plugin.GetParameter(0).Normalized(), 0.2 + 0.6 * along * along, 1e-12);
  EXPECT_NEAR(plugin.GetParameter(1).Normalized(), 1.0 - along, 1e-12);
  for (int block = 0; block < 5; ++block) plugin.Run(32);
  EXPECT_NEAR(plugin.GetParameter(0).Normalized(), 0.8, 1e-12);
  EXPECT_NEAR(plugin.GetParameter(1).Normalized(), 0.0, 1e-12);

  const std::string state = plugin.WriteState();
  EXPECT_NE(state.find("Value=\"1\""), std::string::npos) << state;
  EXPECT_NE(state.find("<Note>kept</Note>"), std::string::npos) << state;
  KModulatedPlugin restored;
  restored.ReadState(state);
  EXPECT_EQ(restored.WriteState(), state);
  EXPECT_EQ(restored.MultiParameter(0).value, 1.0);
}
