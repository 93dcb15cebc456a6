// The effect pipeline: modules in series sound as the same plug-ins one after another, keep
// their host parameters through edits, and travel through states and pipeline files exactly.
#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "core/KParameter.h"
#include "core/KPipelineFile.h"
#include "core/KXMLReader.h"
#include "kernel/KException.h"
#include "kernel/KRegistries.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "plugins/equalizer/KEqualizerPlugin.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "plugins/warmer/KSampleWarmer.h"
#include "tests/core/AllocationCounter.h"

namespace {
using Signal = std::vector<float>;
using P = KEffectPipeline;
constexpr double kRate = 48000.0;

// Bursts of a chirp, loud then quiet, different in the two channels.
std::vector<Signal> Program(size_t length) {
  std::vector<Signal> in(2, Signal(length));
  for (size_t i = 0; i < length; ++i) {
    const double t = static_cast<double>(i) / kRate;
    const double level = (i / 4800) % 2 ? 0.9 : 0.05;
    in[0][i] = static_cast<float>(level * std::sin(6.283185307179586 * (200.0 + 3000.0 * t) * t));
    in[1][i] = static_cast<float>(-0.7 * level * std::sin(6.283185307179586 * (300.0 + 1000.0 * t) * t));
  }
  return in;
}

// Runs `plugin` over `in` in host blocks of `block` samples, in place; a side-chain bus gets no
// buffers (silence), as in the pipeline.
void Play(KAudioPlugin& plugin, std::vector<Signal>& audio, size_t block) {
  for (size_t at = 0; at < audio[0].size(); at += block) {
    const float* i[KAudioPlugin::kMaxChannels] = {audio[0].data() + at, audio[1].data() + at};
    float* o[] = {audio[0].data() + at, audio[1].data() + at};
    plugin.ProcessHostBlock(i, o, static_cast<int32_t>(std::min(block, audio[0].size() - at)));
  }
}

void SetWorking(KAudioPlugin& plugin, const char* key, double working) { plugin.FindParameter(KString::FromUtf8(key))->SetWorking(working); }

std::unique_ptr<P> Pipeline() {
  auto pipeline = std::make_unique<P>();
  pipeline->SetIdentifier(KString::Static("KEffectPipeline"));
  EXPECT_TRUE(pipeline->SetSampleRate(kRate));
  return pipeline;
}

// Sets a module's parameter through its slot, as a host would: in the module's working units.
void SetInSlot(P& pipeline, int32_t slot, const char* key, double working) {
  const KAudioPluginBase::Parameter& carried = *pipeline.ModuleInSlot(slot)->FindParameter(KString::FromUtf8(key));
  pipeline.GetParameter(P::ParameterIndex(slot, carried.Index())).SetNormalized(carried.Kind().ToNormalized(working));
}

// Compressor at 4:1 and a threshold of 0.1, then the oversampling saturator at 12 dB of drive.
std::unique_ptr<P> CompressorThenWarmer() {
  auto pipeline = Pipeline();
  const int32_t compressor = pipeline->AddModule(KString::Static("Compressor"));
  const int32_t warmer = pipeline->AddModule(KString::Static("SampleWarmer"));
  SetInSlot(*pipeline, compressor, "ratio", 4.0);
  SetInSlot(*pipeline, compressor, "threshold", 0.1);
  SetInSlot(*pipeline, warmer, "drive", 12.0);
  return pipeline;
}
}  // namespace

// The chain sounds, bit for bit and at the same reported latency, as the same plug-ins one after
// another, at host blocks the pipeline cuts differently from its modules' own (1000, 64, 4096).
TEST(KEffectPipeline, SoundsAsItsModulesInSeries) {
  for (size_t block : {1000u, 64u, 4096u}) {
    std::vector<Signal> viaPipeline = Program(24000), viaPlugins = viaPipeline;
    auto pipeline = CompressorThenWarmer();
    Play(*pipeline, viaPipeline, block);

    KCompressorPlugin compressor;
    KSampleWarmer warmer;
    for (KAudioPlugin* plugin : {static_cast<KAudioPlugin*>(&compressor), static_cast<KAudioPlugin*>(&warmer)}) ASSERT_TRUE(plugin->SetSampleRate(kRate));
    SetWorking(compressor, "ratio", 4.0);
    SetWorking(compressor, "threshold", 0.1);
    SetWorking(warmer, "drive", 12.0);
    Play(compressor, viaPlugins, block);
    Play(warmer, viaPlugins, block);

    EXPECT_EQ(pipeline->TotalLatency(), compressor.TotalLatency() + warmer.TotalLatency());
    EXPECT_GT(warmer.TotalLatency(), 0);
    EXPECT_EQ(pipeline->TailSamples(), std::min<uint64_t>(KAudioPlugin::kInfiniteTail, uint64_t{compressor.TailSamples()} + warmer.TailSamples()));
    for (int c = 0; c < 2; ++c) {
      ASSERT_EQ(viaPipeline[c], viaPlugins[c]) << "block " << block << ", channel " << c;
    }
  }
}

// A module keeps its slot, and so its host parameters, from being added until it is removed:
// moving it changes the order only, removing it frees the slot for the next one; slot
// parameters read and take the module's own texts.
TEST(KEffectPipeline, SlotsStayWithTheirModules) {
  auto pipeline = Pipeline();
  EXPECT_EQ(pipeline->AddModule(KString::Static("Compressor")), 0);
  EXPECT_EQ(pipeline->AddModule(KString::Static("Utility")), 1);
  EXPECT_EQ(pipeline->AddModule(KString::Static("Equalizer"), 0), 2);
  ASSERT_EQ(pipeline->ModuleCount(), 3);
  EXPECT_EQ(pipeline->KeyAt(0).ToUtf8(), "Equalizer");

  pipeline->MoveModule(1, 0);  // the utility first
  EXPECT_EQ(pipeline->SlotAt(0), 1);
  EXPECT_EQ(pipeline->SlotAt(1), 2);
  EXPECT_EQ(pipeline->SlotAt(2), 0);
  const int32_t gain = KUtilityPlugin::kGain;
  KAudioPluginBase::Parameter& slotGain = pipeline->GetParameter(P::ParameterIndex(1, gain));
  double normalized = 0.0;
  ASSERT_TRUE(slotGain.NormalizedFromText(KString::Static("-6 dB"), normalized));
  slotGain.SetNormalized(normalized);
  EXPECT_EQ(slotGain.Text().ToUtf8(), "-6.0 dB");
  EXPECT_EQ(pipeline->GetParameter(P::ParameterIndex(3, 0)).Text().ToUtf8(), "-");  // a free slot
  EXPECT_EQ(pipeline->GetParameter(P::ParameterIndex(1, KUtilityPlugin::kParameterCount)).Text().ToUtf8(), "-");
  EXPECT_EQ(pipeline->GetParameter(P::BypassIndex(0)).Key().ToUtf8(), "slot1bypass");
  EXPECT_EQ(pipeline->GetParameter(P::ParameterIndex(5, 11)).Key().ToUtf8(), "slot6param12");

  // The value reaches the module in the audio thread's next block, whatever the order.
  std::vector<Signal> audio = Program(256);
  Play(*pipeline, audio, 256);
  const double reached = pipeline->ModuleInSlot(1)->GetParameter(gain).Working();
  EXPECT_NEAR(reached, -6.0, 1e-9);

  pipeline->RemoveModule(0);
  EXPECT_EQ(pipeline->ModuleInSlot(0), nullptr);
  EXPECT_EQ(pipeline->GetParameter(P::ParameterIndex(0, 0)).Normalized(), 0.0);
  EXPECT_EQ(pipeline->AddModule(KString::Static("SampleWarmer")), 0);
  EXPECT_EQ(pipeline->SlotAt(2), 0);
  EXPECT_EQ(pipeline->ModuleInSlot(1)->GetParameter(gain).Working(), reached);  // untouched by the edits

  EXPECT_THROW(pipeline->AddModule(KString::Static("NoSuchModule")), KException);
  EXPECT_THROW(pipeline->AddModule(KString::Static("KCompressorPlugin")), KException);  // a registry key, not a module key
  EXPECT_THROW(pipeline->RemoveModule(5), KException);
  while (pipeline->ModuleCount() < P::kSlots) pipeline->AddModule(KString::Static("Utility"));
  EXPECT_EQ(pipeline->ModuleCount(), P::kSlots);
  EXPECT_THROW(pipeline->AddModule(KString::Static("Utility")), KException);
}

// Bypassing a module lets the signal pass it unchanged and undelayed: the output is the other
// module's alone, and the reported latency loses the bypassed module's.
TEST(KEffectPipeline, BypassedModulePassesTheSignal) {
  std::vector<Signal> viaPipeline = Program(12000), viaCompressor = viaPipeline;
  auto pipeline = CompressorThenWarmer();
  pipeline->SetModuleBypass(1, true);
  Play(*pipeline, viaPipeline, 512);
  EXPECT_EQ(pipeline->TotalLatency(), 0);

  KCompressorPlugin compressor;
  ASSERT_TRUE(compressor.SetSampleRate(kRate));
  SetWorking(compressor, "ratio", 4.0);
  SetWorking(compressor, "threshold", 0.1);
  Play(compressor, viaCompressor, 512);
  EXPECT_EQ(viaPipeline, viaCompressor);
}

// The state carries the chain (order, slots, bypass, every module's settings) exactly; a
// pipeline document naming an unknown module, or too many, leaves the pipeline as it was.
TEST(KEffectPipeline, StateAndFileRoundTrips) {
  auto pipeline = CompressorThenWarmer();
  pipeline->AddModule(KString::Static("Utility"), 0);
  pipeline->RemoveModule(0);  // slot 0 free, the utility in slot 2
  pipeline->SetModuleBypass(1, true);
  const std::string state = pipeline->WriteState();

  auto restored = Pipeline();
  restored->ReadState(state);
  EXPECT_EQ(restored->WriteState(), state);
  ASSERT_EQ(restored->ModuleCount(), 2);
  EXPECT_EQ(restored->KeyAt(0).ToUtf8(), "Utility");
  EXPECT_EQ(restored->SlotAt(0), 2);
  EXPECT_EQ(restored->SlotAt(1), 1);
  EXPECT_EQ(restored->GetParameter(P::BypassIndex(1)).Normalized(), 1.0);
  std::vector<Signal> a = Program(6000), b = a;
  Play(*pipeline, a, 512);
  Play(*restored, b, 512);
  EXPECT_EQ(a, b);

  const Element file = pipeline->WritePipeline();
  Element unknown = file;
  unknown.GetChild(0).SetAttribute(KString::Static("Key"), KString::Static("NoSuchModule"));
  EXPECT_THROW(restored->LoadPipeline(unknown), KException);
  Element crowded(KString::Static(KPipelineFile::kRoot));
  for (int i = 0; i <= P::kSlots; ++i) crowded.AddChild(file.GetChild(0));
  EXPECT_THROW(restored->LoadPipeline(crowded), KException);
  EXPECT_EQ(restored->WriteState(), state);

  restored->ReadState("<TorvaneState/>");  // no chain: every slot free and at its default
  EXPECT_EQ(restored->ModuleCount(), 0);
  EXPECT_EQ(restored->GetParameter(P::ParameterIndex(1, 0)).Normalized(), 0.0);
  EXPECT_EQ(restored->WriteState(), Pipeline()->WriteState());
}

// Processing allocates nothing, also in the blocks that take over a new chain or see a module
// bypassed; the chains the audio thread left are freed on the next edit.
TEST(KEffectPipeline, ProcessingAllocatesNothingAcrossEdits) {
  auto pipeline = CompressorThenWarmer();
  std::vector<Signal> audio = Program(4096);
  Play(*pipeline, audio, 4096);
  for (int round = 0; round < 3; ++round) {
    if (round == 0) pipeline->AddModule(KString::Static("Equalizer"), 1);
    if (round == 1) pipeline->MoveModule(2, 0);
    if (round == 2) pipeline->SetModuleBypass(0, true);
    KAllocationCounter counter;
    for (size_t block : {1u, 4096u}) Play(*pipeline, audio, block);
    EXPECT_EQ(counter.Count(), 0) << "round " << round;
  }
  EXPECT_EQ(pipeline->KeyAt(0).ToUtf8(), "Equalizer");
}

// A factory preset is a whole chain: it replaces the modules there were with its own, in order.
TEST(KEffectPipeline, FactoryPresetsBringTheirChains) {
  auto pipeline = CompressorThenWarmer();
  const auto& presets = kEffectPipelineDescription.presets;
  ASSERT_FALSE(presets.empty());
  pipeline->LoadFactoryPreset(presets[0]);
  ASSERT_EQ(pipeline->ModuleCount(), 3);
  EXPECT_EQ(pipeline->KeyAt(0).ToUtf8(), "Gate");
  EXPECT_EQ(pipeline->KeyAt(1).ToUtf8(), "Compressor");
  EXPECT_EQ(pipeline->KeyAt(2).ToUtf8(), "Equalizer");
  for (int32_t slot = 0; slot < 3; ++slot) EXPECT_EQ(pipeline->GetParameter(P::BypassIndex(slot)).Normalized(), 0.0);
}

// Every parameter of every module has a host parameter: the slots reach exactly as far as the
// largest module. The identifiers hosts saved stay where they were (each slot's bypass and first
// twelve in a block of 13), and the rest follow them, slot by slot, each key once.
TEST(KEffectPipeline, EveryModuleParameterHasAStableHostParameter) {
  KRegistries& registries = KRegistries::Instance();
  registries.EnsureBuilt();
  int32_t largest = 0;
  for (int32_t i = 0; i < registries.Modules().Count(); ++i) {
    const std::unique_ptr<KAudioPlugin> module(registries.Modules().Create(registries.Modules().Record(i).key, nullptr));
    largest = std::max(largest, module->ParameterCount());
  }
  EXPECT_EQ(largest, P::kModuleParameters);

  const auto pipeline = Pipeline();
  ASSERT_EQ(pipeline->ParameterCount(), P::kParameterCount);
  EXPECT_EQ(pipeline->GetParameter(0).Key().ToUtf8(), "slot1bypass");
  EXPECT_EQ(pipeline->GetParameter(12).Key().ToUtf8(), "slot1param12");
  EXPECT_EQ(pipeline->GetParameter(13).Key().ToUtf8(), "slot2bypass");
  EXPECT_EQ(pipeline->GetParameter(77).Key().ToUtf8(), "slot6param12");
  EXPECT_EQ(pipeline->GetParameter(78).Key().ToUtf8(), "slot1param13");
  EXPECT_EQ(pipeline->GetParameter(78 + P::kModuleParameters - 12).Key().ToUtf8(), "slot2param13");
  EXPECT_EQ(pipeline->GetParameter(P::kParameterCount - 1).Key().ToUtf8(), "slot6param" + std::to_string(P::kModuleParameters));
  std::set<std::string> keys;
  for (int32_t slot = 0; slot < P::kSlots; ++slot)
    for (int32_t p = 0; p < P::kModuleParameters; ++p) {
      const KAudioPluginBase::Parameter& parameter = pipeline->GetParameter(P::ParameterIndex(slot, p));
      EXPECT_EQ(parameter.Key().ToUtf8(), "slot" + std::to_string(slot + 1) + "param" + std::to_string(p + 1));
      EXPECT_TRUE(parameter.IsAutomatable());
      keys.insert(parameter.Key().ToUtf8());
    }
  EXPECT_EQ(keys.size(), size_t(P::kSlots * P::kModuleParameters));
}

// Automating the last parameter of the largest module through its host parameter moves it: the
// module takes the value at the next block, the host reads it in the module's units, the state
// keeps it, and the chain sounds as the plug-in set the same way.
TEST(KEffectPipeline, AutomatingAModulesLastParameterMovesIt) {
  auto pipeline = Pipeline();
  pipeline->AddModule(KString::Static("Utility"));
  const int32_t slot = pipeline->AddModule(KString::Static("Equalizer"));
  const int32_t last = KEqualizerPlugin::kParameterCount - 1;
  ASSERT_GE(last, P::kSlotParameters);
  pipeline->RemoveModule(0);  // the equalizer alone, in slot 1
  const KAudioPluginBase::Parameter& carried = pipeline->ModuleInSlot(slot)->GetParameter(last);
  const double target = carried.Kind().ToNormalized(-6.0);
  const int32_t host = P::ParameterIndex(slot, last);
  EXPECT_EQ(host, P::kFirstExtra + slot * (P::kModuleParameters - P::kSlotParameters) + last - P::kSlotParameters);
  KEqualizerPlugin equalizer;
  ASSERT_TRUE(equalizer.SetSampleRate(kRate));
  // Both run a block first, so that the value arrives at a running module and glides alike.
  std::vector<Signal> viaPipeline = Program(4800), viaPlugin = viaPipeline;
  std::vector<Signal> first = Program(480), second = first;
  Play(*pipeline, first, 480);
  Play(equalizer, second, 480);
  pipeline->GetParameter(host).SetNormalized(target);  // as a host sets it between blocks
  Play(*pipeline, viaPipeline, 480);
  EXPECT_EQ(carried.Normalized(), target);
  const std::string unit = carried.Unit().ToUtf8();
  EXPECT_EQ(pipeline->GetParameter(host).Text().ToUtf8(), carried.Text().ToUtf8() + (unit.empty() ? "" : " " + unit));
  EXPECT_NE(pipeline->GetParameter(host).Text().ToUtf8(), "-");

  equalizer.GetParameter(last).SetNormalized(target);
  Play(equalizer, viaPlugin, 480);
  EXPECT_EQ(viaPipeline, viaPlugin);

  auto restored = Pipeline();
  restored->ReadState(pipeline->WriteState());
  EXPECT_EQ(restored->GetParameter(host).Normalized(), target);
  EXPECT_EQ(restored->ModuleInSlot(slot)->GetParameter(last).Normalized(), target);
}
