// The built VST 2 modules loaded and driven as a host drives them, and the adapter in this process
// around test plug-ins, reached only through its AEffect record.
#include <set>

#include "core/KAudioPlugin.h"
#include "hosts/vst2/KAudioPluginVSTAdapter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KPluginIdentifiers.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"
#include "tests/hosts/VST2Host.h"
#include "tests/hosts/VST3Host.h"

using namespace KVST2Test;

namespace {
int32_t ParameterCount(const KString& key) { return std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(key))->ParameterCount(); }
AEffect* Adapt(KAudioPlugin* plugin) { return (new KAudioPluginVSTAdapter(&KHost::Callback, std::unique_ptr<KAudioPlugin>(plugin), FourCharacters("TsT2")))->Effect(); }

// Answers every note with a note of its own, from inside processing.
class KEchoingPlugin final : public KRecordingPlugin {
public:
  KEchoingPlugin() : KRecordingPlugin(4, Shape{1, 1, true, true, true}) {}
  void ProcessNotePerformCore(const KMIDIEvent& event) override {
    KRecordingPlugin::ProcessNotePerformCore(event);
    const uint8_t bytes[4] = {0x90, static_cast<uint8_t>(event.number + 12), 100, 0};
    Interface()->SendMIDIEvent(event.sampleOffset, bytes);
  }
};

std::vector<std::pair<int32_t, int32_t>> Notes(const KRecordingPlugin& plugin) {  // (offset, note) of each note heard
  std::vector<std::pair<int32_t, int32_t>> notes;
  for (const KRecordingPlugin::Entry& e : plugin.Log())
    if (e.kind == KRecordingPlugin::Entry::kNote) notes.emplace_back(e.length, e.note);
  return notes;
}
}  // namespace

// Each plug-in's module as a host sees it: both entries, the record, texts, pins, the canDo table.
// A host without a callback gets an instance that works with defaults.
TEST(VST2Modules, EveryCataloguePluginHasAModuleThatDescribesAndMakesIt) {
  std::set<int32_t> ids;
  for (const KString& key : GetTorvanePluginList()) {
    const KPluginDescription& description = *KFindDescription(KProductCatalogue(), key.ToUtf8());
    const std::string name = KPluginIds::BundleName(description.key);
    KHost host;
    KModuleFile module(name);
    KInstance instance(module.Create()), legacy(module.legacyMain(&KHost::Callback));
    const AEffect& e = *instance.effect;
    const int32_t inputs = std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(key))->InputChannelCount();
    EXPECT_EQ(std::tuple(e.numPrograms, e.numParams, e.numInputs, e.numOutputs, e.flags, e.ioRatio, e.version, e.initialDelay),
              std::tuple(1, ParameterCount(key), inputs, 2, effFlagsCanReplacing | effFlagsProgramChunks | effFlagsHasEditor, 1.0f, 1, 0))
        << name;
    EXPECT_TRUE(ids.insert(e.uniqueID).second && e.uniqueID == FourCharacters(description.vst2Id) &&
                e.uniqueID == legacy.effect->uniqueID)
        << name;
    EXPECT_EQ(std::tuple(instance.Text(effGetEffectName), instance.Text(effGetVendorString), instance.Text(effGetProductString), instance.Call(effGetVstVersion)),
              std::tuple(std::string(description.name), "Torvane", std::string(description.name), intptr_t{2400}));
    EXPECT_EQ(std::tuple(instance.CanDo("bypass"), instance.CanDo("receiveVstMidiEvent"), instance.CanDo("sendVstEvents"), instance.CanDo("canMono"),
                         instance.CanDo("receiveVstTimeInfo"), instance.CanDo("offline")),
              std::tuple(-1, -1, -1, 1, 1, 0))
        << name;
    // Beyond the parameters the answer is the default 0; within them the parameter's value.
    const auto parameters = static_cast<int32_t>(e.numParams);
    std::unique_ptr<KAudioPlugin> reference(CreateTorvanePlugin(key));
    EXPECT_EQ(std::tuple(e.getParameter(instance.effect, parameters), e.getParameter(instance.effect, parameters + 7), e.getParameter(instance.effect, 0)),
              std::tuple(0.0f, 0.0f, static_cast<float>(reference->GetParameter(0).Normalized())));
    VstPinProperties pin{};
    EXPECT_EQ((std::pair{instance.Call(effGetOutputProperties, 1, 0, &pin), std::string(pin.label)}), std::pair(intptr_t{1}, std::string("Out 2")));
    if (inputs == 4) {
      EXPECT_EQ((std::pair{instance.Call(effGetInputProperties, 2, 0, &pin), std::string(pin.label)}), std::pair(intptr_t{1}, std::string("Sidechain 1")));
      EXPECT_EQ(pin.flags, kVstPinIsActive | kVstPinIsStereo);
    }
    EXPECT_EQ(instance.Call(effGetOutputProperties, 2, 0, &pin), 0);
    // No host at all: version 1, no time, nothing sent back, and the audio still goes through.
    KInstance alone(module.Create(nullptr));
    alone.Start();
    KBuffers in(inputs, 64), out(2, 64);
    alone.Process(in.pointers, out.pointers, 64);
    EXPECT_EQ(alone.effect->numInputs, inputs < 3 ? 2 : inputs);
  }
}

// The Part's edge cases of processing, and MIDI in and out without a single allocation.
TEST(VST2Adapter, ProcessKeepsMIDIForARealBlockDropsSysexAndSendsMIDIWithoutAllocating) {
  auto* plugin = new KEchoingPlugin;
  KHost host;
  host.midi.reserve(64);
  KInstance instance(Adapt(plugin));
  instance.Start();
  VstMidiEvent first = Midi(5, 0x90, 60, 100), second = Midi(9, 0x80, 60, 0);
  VstMidiSysexEvent sysex{kVstSysExType, 48 - 8, 7, 0, 4, 0, const_cast<char*>("\xF0\x01\x02\xF7"), 0};
  struct { int32_t numEvents; intptr_t reserved; VstEvent* events[3]; } events{3, 0, {reinterpret_cast<VstEvent*>(&first), reinterpret_cast<VstEvent*>(&sysex), reinterpret_cast<VstEvent*>(&second)}};
  EXPECT_EQ(instance.Call(effProcessEvents, 0, 0, &events), 1);
  KBuffers in(2, 64), out(2, 64);  // as many buffers as the record shows
  instance.Process(in.pointers, out.pointers, 0);
  instance.effect->processReplacing(instance.effect, in.pointers.data(), nullptr, 64);
  EXPECT_TRUE(Notes(*plugin).empty());
  {
    KAllocationCounter counter;
    instance.Process(in.pointers, out.pointers, 64);
    EXPECT_EQ(counter.Count(), 0);
  }
  EXPECT_EQ(Notes(*plugin), (std::vector<std::pair<int32_t, int32_t>>{{5, 60}, {9, 60}}));
  ASSERT_EQ(host.midi.size(), 2u);
  for (size_t i = 0; i < 2; ++i)
    EXPECT_EQ(std::tuple(host.midi[i].type, host.midi[i].byteSize, host.midi[i].deltaFrames, static_cast<uint8_t>(host.midi[i].midiData[1]), host.midi[i].noteLength),
              std::tuple(kVstMidiType, 32, i ? 9 : 5, uint8_t{72}, 0));
  instance.Process(in.pointers, out.pointers, 64);
  EXPECT_EQ(host.midi.size(), 2u);  // each note went out once
}

TEST(VST2Adapter, TimeInformationFollowsTheTransportRules) {
  auto* plugin = new KRecordingPlugin(4);
  KHost host;
  KInstance instance(Adapt(plugin));
  instance.Start();
  KBuffers in(2, 64), out(2, 64);
  auto fields = [](const KTransport& t) { return std::tuple(t.tempo, t.songPosition, t.barStart, t.samplePosition, t.numerator, t.denominator, t.cycleStart, t.cycleEnd, t.flags); };
  constexpr int32_t kAll = kVstTempoValid | kVstPpqPosValid | kVstBarsValid | kVstTimeSigValid | kVstCyclePosValid;
  struct Row { const char* name; int32_t level, flags; VstTimeInfo time; KTransport expected; };
  const Row rows[] = {
      {"6/8 snaps to halves, tempo 1.0 ignored", kVstProcessLevelRealtime, kAll | kVstTransportPlaying,
       {96000.4, 48000, 0, 2.0, 1.0, 7.4, 4.0, 8.0, 6, 8, 0, 0, 0, 0}, {-1.0, 2.0, 7.5, 96000, 6, 8, 4.0, 8.0, 1}},
      {"3/4 to whole quarters, an empty cycle ignored", kVstProcessLevelRealtime, kAll,
       {96000, 48000, 0, 2.0, 120.0, 7.4, 4.0, 4.0, 3, 4, 0, 0, 0, 0}, {120.0, 2.0, 7.0, 96000, 3, 4, -1.0, -1.0, 0}},
      {"numerator 0 ignored, unflagged fields too", kVstProcessLevelRealtime, kVstTimeSigValid,
       {96000, 48000, 0, 2.0, 120.0, 7.4, 4.0, 8.0, 0, 8, 0, 0, 0, 0}, {-1.0, -1.0, -1.0, 96000, 4, 4, -1.0, -1.0, 0}},
      {"offline at 0 has no position, and plays", kVstProcessLevelOffline, kAll,
       {0.0, 48000, 0, 0.0, 90.0, 0.0, 0.0, 0.0, 4, 4, 0, 0, 0, 0}, {90.0, -1.0, 0.0, -1, 4, 4, -1.0, -1.0, 1}},
  };
  for (const Row& row : rows) {
    host.processLevel = row.level, host.time = row.time, host.time.flags = row.flags;
    instance.Process(in.pointers, out.pointers, 64);
    EXPECT_EQ(fields(plugin->Transport()), fields(row.expected)) << row.name;
  }
  EXPECT_EQ(host.askedFilter, 0x3EC7);
  host.giveTime = false;
  instance.Process(in.pointers, out.pointers, 64);
  EXPECT_EQ(fields(plugin->Transport()), fields(KTransport{}));
}

// One input channel: a VST 1 host sees two, a VST 2.4 host one. Arrangements with more channels
// than the plug-in has are refused; fewer are taken and mapped.
TEST(VST2Adapter, ChannelCountsFollowTheHostsVersionAndArrangement) {
  for (const auto& [version, shown] : {std::pair{0, 2}, std::pair{1, 2}, std::pair{99, 2}, std::pair{2400, 1}}) {
    auto* plugin = new KRecordingPlugin(4);
    ASSERT_TRUE(plugin->SetChannelsPerBus(1));
    KHost host;
    host.version = version;
    KInstance instance(Adapt(plugin));
    EXPECT_EQ(std::pair(instance.effect->numInputs, instance.effect->numOutputs), std::pair(shown, 1)) << version;
  }
  auto* instrument = new KRecordingPlugin(4, KAudioPlugin::Shape{0, 1, true, false, true});
  KHost host;
  KInstance synth(Adapt(instrument));
  EXPECT_EQ(std::tuple(synth.effect->numInputs, synth.effect->flags & effFlagsIsSynth, synth.CanDo("receiveVstEvents"), synth.Call(effGetPlugCategory)),
            std::tuple(0, effFlagsIsSynth, intptr_t{1}, kPlugCategSynth));

  auto* plugin = new KRecordingPlugin(4, KRecordingPlugin::kEffect, KRecordingPlugin::kChannelNumber);
  KInstance instance(Adapt(plugin));
  instance.Start();
  VstSpeakerArrangement mono{kSpeakerArrMono, 1, {}}, stereo{kSpeakerArrStereo, 2, {}}, three{kSpeakerArrUserDefined, 3, {}};
  auto arrange = [&](VstSpeakerArrangement& input, VstSpeakerArrangement& output) {
    return instance.Call(effSetSpeakerArrangement, 0, reinterpret_cast<intptr_t>(&input), &output);
  };
  EXPECT_EQ(std::tuple(arrange(three, stereo), arrange(stereo, three), arrange(mono, mono)), std::tuple(0, 0, 1));
  KBuffers in(1, 64), out(1, 64);
  instance.Process(in.pointers, out.pointers, 64);
  EXPECT_EQ(std::pair(plugin->ChannelsPerBus(), out.planes[0][63]), std::pair(1, 1.0f));
  // Stereo in, mono out: the plug-in runs mono, its one output into the host's.
  EXPECT_EQ(arrange(stereo, mono), 1);
  KBuffers in2(2, 64), out1(1, 64);
  instance.Process(in2.pointers, out1.pointers, 64);
  EXPECT_EQ(out1.planes[0][0], 1.0f);
  VstSpeakerArrangement* asked[2] = {&mono, &mono};
  EXPECT_EQ((std::tuple{instance.Call(effGetSpeakerArrangement, 0, reinterpret_cast<intptr_t>(&asked[0]), &asked[1]), asked[0], asked[1]}),
            std::tuple(intptr_t{0}, nullptr, nullptr));
}

// The plug-in's way back: a gesture as begin, automated value, end; the host's echo of the value
// changes nothing while a genuine change does; latency and names reach the host.
TEST(VST2Adapter, AutomationLatencyAndNamesReachTheHost) {
  auto* plugin = new KRecordingPlugin(4);
  KHost host;
  KInstance instance(Adapt(plugin));
  instance.Start();
  KAudioPluginHost& door = *plugin->Interface();
  door.SendAutomation(1, 0.25);
  door.GestureNotice(1, 3);
  EXPECT_EQ(host.edits, (std::vector<std::tuple<char, int32_t, float>>{{'b', 1, 0.0f}, {'a', 1, 0.25f}, {'e', 1, 0.0f}}));
  EXPECT_EQ(std::pair(plugin->GetParameter(1).Normalized(), plugin->AutomationSending().load()), std::pair(0.0, 0));
  instance.effect->setParameter(instance.effect, 1, 0.75f);
  EXPECT_EQ(instance.effect->getParameter(instance.effect, 1), 0.75f);
  plugin->ReportLatency(64);
  instance.Call(effIdle);
  door.UpdateParameterNames();
  door.NotifyPresetChanged();
  EXPECT_EQ(std::tuple(instance.effect->initialDelay, host.ioChanges, host.displayUpdates, door.ResizeEditor(400, 300)), std::tuple(64, 1, 2, false));
}

// The chunk is the same text as the VST 3 state; it loads into another instance exactly and
// stays where it is until the next request.
TEST(VST2Modules, ChunkIsTheVST3StateTextAndRestoresAnotherInstance) {
  KHost host;
  KModuleFile module("Compressor");
  KVST3Test::KBundle bundle("Compressor");
  KVST3Test::KHost host3;
  KVST3Test::KInstance vst3(bundle.Create());
  vst3.Start(host3);
  KInstance source(module.Create()), target(module.Create());
  source.Start(), target.Start();
  for (int32_t index = 0; index < source.effect->numParams; ++index) {
    const float value = 0.05f + 0.09f * static_cast<float>(index * 7 % 11);
    source.effect->setParameter(source.effect, index, value);
    vst3.controller->SetParamNormalized(static_cast<KVST3::ParamID>(index), value);
  }
  void* first = nullptr;
  const auto size = source.Call(effGetChunk, 0, 0, &first);
  const std::string chunk(static_cast<const char*>(first), static_cast<size_t>(size));
  EXPECT_EQ(chunk, vst3.State());
  EXPECT_NE(chunk, target.Chunk());
  EXPECT_EQ((std::pair{target.SetChunk(chunk), target.Chunk()}), std::pair(intptr_t{1}, chunk));
  EXPECT_EQ((std::pair{target.SetChunk(chunk.substr(0, chunk.size() / 2)), target.Chunk()}), std::pair(intptr_t{1}, chunk));  // a broken one changes nothing
  EXPECT_EQ(std::string(static_cast<const char*>(first), static_cast<size_t>(size)), chunk);  // untouched by the other instance
  vst3.Stop();
}
