// The LV2 adapter through the kernel's descriptors in this process (allocations counted), and
// the built bundles' loaders as a host loads them.
#include <lv2/atom/forge.h>
#include <lv2/atom/util.h>
#include <lv2/midi/midi.h>
#include <lv2/time/time.h>

#include <filesystem>

#include "hosts/lv2/KAudioPluginLV2Adapter.h"
#include "hosts/vst3/KAudioPluginVST3Adapter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/platform/KPlatformLibrary.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"
#include "tests/hosts/LV2Host.h"
#include "tests/hosts/VST3Host.h"

using namespace KLV2Test;

namespace {
std::string StateText(const KSavedState& saved, KURIDMap& map) {
  const auto found = saved.values.find(map.map.map(map.map.handle, KAudioPluginLV2Adapter::kStateKey));
  return found == saved.values.end() ? std::string() : found->second.bytes;
}
}  // namespace

// Every catalogue plug-in: its URI, an instance in a host that offers no features at all, and
// runs of 1, 64 and 4096 samples with a control moved before each that allocate nothing.
TEST(LV2Adapter, EveryPluginLoadsWithoutFeaturesAndRunsAnyBlockLengthWithoutAllocating) {
  for (const KString& key : GetTorvanePluginList()) {
    KInstance instance(key.ToUtf8(), nullptr);
    ASSERT_TRUE(instance.handle) << key.ToUtf8();
    EXPECT_EQ(std::string(instance.descriptor->URI), "urn:torvane:" + key.ToUtf8());
    EXPECT_EQ(instance.descriptor, KLV2DispatchDescriptor(KPluginIds::BundleName(key.ToUtf8().c_str()).c_str()));  // one per plug-in
    instance.Run(64);  // first run: every control lands once
    float& control = instance.buffers[static_cast<size_t>(instance.layout.First(KPort::Kind::kParameter))][0];
    const float low = static_cast<float>(instance.described->GetParameter(0).Kind().Minimum());
    int64_t allocations = 0;
    for (const uint32_t length : {1u, 64u, 4096u}) {
      control = control == low ? low + 1.0f : low;
      KAllocationCounter counter;
      instance.Run(length);
      allocations += counter.Count();
    }
    EXPECT_EQ(allocations, 0) << key.ToUtf8();
    for (int32_t c = 0; c < 2; ++c)
      for (const float sample : instance.Audio(c)) ASSERT_TRUE(std::isfinite(sample)) << key.ToUtf8();
  }
  EXPECT_EQ(KLV2DispatchDescriptor("NoSuchPlugin"), nullptr);
  EXPECT_EQ(KLV2DispatchDescriptor(nullptr), nullptr);
}

// A control moved between runs reaches the plug-in exactly as a VST 3 host's single point at
// offset 0 does: both outputs agree bit for bit over several blocks.
TEST(LV2Adapter, AControlChangeSoundsAsAVST3PointAtOffsetZero) {
  KURIDMap map;
  KInstance lv2("KCompressorPlugin", map.features);
  KVST3Test::KHost host;
  KVST3Test::KInstance vst3(static_cast<KVST3::IComponent*>(new KAudioPluginVST3Adapter(KHostCreatePlugin("KCompressorPlugin", ""))));
  vst3.Start(host);
  const KAudioPluginBase::Parameter& threshold = *lv2.described->FindParameter(KString::Static("threshold"));
  const KAudioPluginBase::Parameter& ratio = *lv2.described->FindParameter(KString::Static("ratio"));
  for (const auto& [thresholdValue, ratioValue] : {std::pair(0.25f, 4.0f), std::pair(0.125f, 4.0f), std::pair(0.125f, 8.0f)}) {
    KVST3Test::KBlock block(2, 1);
    block.changes.queues.clear();
    block.Change(static_cast<KVST3::ParamID>(threshold.Index()), {{0, threshold.Kind().ToNormalized(thresholdValue)}});
    block.Change(static_cast<KVST3::ParamID>(ratio.Index()), {{0, ratio.Kind().ToNormalized(ratioValue)}});
    ASSERT_EQ(vst3.processor->Process(block.data), KVST3::kResultOk);
    lv2.Control("threshold") = thresholdValue;
    lv2.Control("ratio") = ratioValue;
    lv2.Run(KVST3Test::kBlock);
    for (int32_t c = 0; c < 2; ++c)
      ASSERT_TRUE(std::equal(block.Out(c).begin(), block.Out(c).end(), lv2.Audio(c).begin())) << thresholdValue << " " << ratioValue << " channel " << c;
  }
  vst3.Stop();
}

// The state text saved through the state extension is the VST 3 state text for the same
// settings, restores another instance exactly, and a malformed text leaves it untouched.
// Without a URID map there is no state to save.
TEST(LV2State, RoundTripRestoresExactlyEqualsTheVST3TextAndMalformedTextChangesNothing) {
  KURIDMap map;
  KInstance source("KCompressorPlugin", map.features), target("KCompressorPlugin", map.features);
  source.Control("threshold") = 0.25f;
  source.Control("kneemode") = 2.0f;
  source.Control("linkchannels") = 0.0f;
  source.Run(64);
  KSavedState saved;
  ASSERT_EQ(source.Save(saved), LV2_STATE_SUCCESS);
  const std::string text = StateText(saved, map);
  ASSERT_FALSE(text.empty());
  EXPECT_EQ(text.back(), '\0');  // an atom:String

  KVST3Test::KHost host;
  KVST3Test::KInstance vst3(static_cast<KVST3::IComponent*>(new KAudioPluginVST3Adapter(KHostCreatePlugin("KCompressorPlugin", ""))));
  vst3.Start(host);
  for (const char* key : {"threshold", "kneemode", "linkchannels"}) {
    const KAudioPluginBase::Parameter& parameter = *source.described->FindParameter(KString::Static(key));
    vst3.controller->SetParamNormalized(static_cast<KVST3::ParamID>(parameter.Index()), parameter.Kind().ToNormalized(source.Control(key)));
  }
  EXPECT_EQ(vst3.State() + '\0', text);
  vst3.Stop();

  ASSERT_EQ(target.Restore(saved), LV2_STATE_SUCCESS);
  KSavedState again;
  ASSERT_EQ(target.Save(again), LV2_STATE_SUCCESS);
  EXPECT_EQ(StateText(again, map), text);
  // The restored state stands although the target's ports still show the defaults, and sounds
  // as the same settings set through the ports do.
  KInstance fresh("KCompressorPlugin", map.features);
  for (const char* key : {"threshold", "kneemode", "linkchannels"}) fresh.Control(key) = source.Control(key);
  fresh.Run(512), target.Run(512);
  EXPECT_EQ(fresh.Audio(0), target.Audio(0));

  KSavedState broken = saved;
  broken.values.begin()->second.bytes = "<TorvaneState><Parameters threshold=";
  EXPECT_NE(target.Restore(broken), LV2_STATE_SUCCESS);
  KSavedState after;
  ASSERT_EQ(target.Save(after), LV2_STATE_SUCCESS);
  EXPECT_EQ(StateText(after, map), text);
  KSavedState empty;
  EXPECT_EQ(target.Restore(empty), LV2_STATE_ERR_NO_PROPERTY);
  // A control the host moves after the restore does reach the plug-in (8 : 1 on the ratio's
  // quadratic travel, kept as its nearest double).
  target.Control("ratio") = 8.0f;
  target.Run(64);
  KSavedState moved;
  ASSERT_EQ(target.Save(moved), LV2_STATE_SUCCESS);
  EXPECT_NE(StateText(moved, map).find("ratio=\"7.99"), std::string::npos) << StateText(moved, map);

  KInstance unmapped("KCompressorPlugin", nullptr);
  EXPECT_EQ(unmapped.Save(empty), LV2_STATE_ERR_NO_FEATURE);
}

// The compressor's ports as KPortLayout numbers them: stereo main inputs, a side-chain pair,
// outputs, its parameters, meters that follow the signal, and the latency.
TEST(LV2Adapter, CompressorPortsMetersAndLatency) {
  KInstance instance("KCompressorPlugin", nullptr);
  const KLV2::KPortLayout& layout = instance.layout;
  EXPECT_EQ(std::tuple(layout.CountOf(KPort::Kind::kAudioIn), layout.CountOf(KPort::Kind::kSideChainIn), layout.CountOf(KPort::Kind::kAudioOut),
                       layout.CountOf(KPort::Kind::kParameter), layout.CountOf(KPort::Kind::kMeter), layout.CountOf(KPort::Kind::kLatency),
                       layout.CountOf(KPort::Kind::kMIDIIn)),
            std::tuple(2, 2, 2, instance.described->ParameterCount(), 4, 1, 0));
  EXPECT_EQ(layout.Ports()[2].symbol, "sc_in_1");
  EXPECT_EQ(layout.Ports()[layout.First(KPort::Kind::kParameter)].symbol, "gain");
  // Unconnected side-chain inputs read as silence.
  instance.descriptor->connect_port(instance.handle, 2, nullptr);
  instance.descriptor->connect_port(instance.handle, 3, nullptr);
  instance.Run(1024);
  EXPECT_GT(instance.Output(KPort::Kind::kMeter, 0), 0.4f);
  EXPECT_GT(instance.Output(KPort::Kind::kMeter, 2), 0.0f);
  EXPECT_EQ(instance.Output(KPort::Kind::kLatency), 0.0f);
  EXPECT_EQ(KLV2::KPortSymbol("9 lives-x"), "_9_lives_x");
  // An output left unconnected: the run does nothing rather than write nowhere.
  instance.descriptor->connect_port(instance.handle, static_cast<uint32_t>(layout.First(KPort::Kind::kAudioOut)), nullptr);
  instance.Run(64);
}

// The saturator reports its latency on its port: what the plug-in itself reports at that rate.
TEST(LV2Adapter, SaturatorReportsItsLatency) {
  KInstance instance("KSampleWarmer", nullptr);
  instance.Run(64);
  ASSERT_TRUE(instance.described->SetSampleRate(48000.0));
  EXPECT_GT(instance.described->TotalLatency(), 0);
  EXPECT_EQ(instance.Output(KPort::Kind::kLatency), static_cast<float>(instance.described->TotalLatency()));
}

// Every bundle's loader, loaded as a host loads it, answers its own plug-in at index 0 only; a
// loader renamed to a name the kernel does not know answers none.
TEST(LV2Bundles, EachLoaderAnswersThePluginItsBundleIsNamedAfter) {
  namespace fs = std::filesystem;
  using Entry = const LV2_Descriptor* (*)(uint32_t);
  for (const KString& key : GetTorvanePluginList()) {
    const std::string name = KPluginIds::BundleName(key.ToUtf8().c_str());
    void* library = KPlatform::OpenLibrary(TORVANE_LV2_DIR "/" + name + ".lv2/" + name + ".so");
    ASSERT_TRUE(library) << KPlatform::LibraryError();
    const auto entry = reinterpret_cast<Entry>(KPlatform::FindSymbol(library, "lv2_descriptor"));
    ASSERT_TRUE(entry && entry(0));
    EXPECT_EQ(std::string(entry(0)->URI), "urn:torvane:" + key.ToUtf8());
    EXPECT_EQ(entry(1), nullptr);
    KPlatform::CloseLibrary(library);
  }
  const fs::path stray = fs::temp_directory_path() / "torvane-lv2-stray.lv2";
  fs::create_directories(stray);
  fs::copy_file(TORVANE_LV2_DIR "/Compressor.lv2/Compressor.so", stray / "Stray.so", fs::copy_options::overwrite_existing);
  fs::copy_file(TORVANE_LV2_DIR "/Compressor.lv2/libtorvane.so", stray / "libtorvane.so", fs::copy_options::overwrite_existing);
  void* library = KPlatform::OpenLibrary((stray / "Stray.so").string());
  ASSERT_TRUE(library);
  EXPECT_EQ(reinterpret_cast<Entry>(KPlatform::FindSymbol(library, "lv2_descriptor"))(0), nullptr);
  KPlatform::CloseLibrary(library);
  fs::remove_all(stray);
}

// A plug-in that takes and sends MIDI: notes from the input sequence land at their frames; what
// the plug-in sends comes out as an atom sequence of MIDI events.
namespace {
// An adapter around a recording plug-in that takes and sends MIDI, every port connected: audio
// and controls to buffers of their own, the atom ports to `in` and `out`.
struct KMIDIRig {
  KURIDMap map;
  KRecordingPlugin* plugin = new KRecordingPlugin(2, KAudioPlugin::Shape{1, 1, true, true, true});
  std::unique_ptr<KAudioPluginLV2Adapter> adapter;
  std::vector<std::vector<float>> audio = std::vector<std::vector<float>>(6, std::vector<float>(256, 0.25f));
  std::vector<float> controls;
  alignas(8) uint8_t in[512] = {}, out[256] = {};
  KMIDIRig() {
    plugin->SetChannelsPerBus(2);
    plugin->SetSampleRate(48000.0);
    adapter = std::make_unique<KAudioPluginLV2Adapter>(std::unique_ptr<KAudioPlugin>(plugin), &map.map);
    const KLV2::KPortLayout& layout = adapter->Layout();
    controls.assign(static_cast<size_t>(layout.Count()), 0.0f);
    for (int32_t p = 0, a = 0; p < layout.Count(); ++p) {
      const KPort::Kind kind = layout.Ports()[p].kind;
      const bool isAudio = kind == KPort::Kind::kAudioIn || kind == KPort::Kind::kAudioOut;
      void* data = isAudio ? static_cast<void*>(audio[static_cast<size_t>(a++)].data()) : &controls[static_cast<size_t>(p)];
      adapter->ConnectPort(static_cast<uint32_t>(p), kind == KPort::Kind::kMIDIIn ? in : kind == KPort::Kind::kMIDIOut ? out : data);
    }
  }
  LV2_URID Id(const char* uri) { return map.map.map(map.map.handle, uri); }
};
}  // namespace

TEST(LV2Adapter, MIDIThroughAtomSequencesBothWays) {
  KMIDIRig rig;
  KURIDMap& map = rig.map;
  KRecordingPlugin* plugin = rig.plugin;
  KAudioPluginLV2Adapter& adapter = *rig.adapter;
  uint8_t* in = rig.in;
  uint8_t* out = rig.out;
  ASSERT_EQ(std::pair(adapter.Layout().CountOf(KPort::Kind::kMIDIIn), adapter.Layout().CountOf(KPort::Kind::kMIDIOut)), std::pair(1, 1));
  auto* sequence = reinterpret_cast<LV2_Atom_Sequence*>(in);
  sequence->atom = {sizeof(LV2_Atom_Sequence_Body), map.map.map(map.map.handle, LV2_ATOM__Sequence)};
  for (const auto& [frame, note] : {std::pair(10, 60), std::pair(30, 64)}) {
    struct {
      LV2_Atom_Event header;
      uint8_t bytes[3];
    } event{{{frame}, {3, map.map.map(map.map.handle, LV2_MIDI__MidiEvent)}}, {0x90, static_cast<uint8_t>(note), 100}};
    ASSERT_TRUE(lv2_atom_sequence_append_event(sequence, sizeof rig.in, &event.header));
  }
  reinterpret_cast<LV2_Atom_Sequence*>(out)->atom.size = sizeof rig.out - sizeof(LV2_Atom);  // the host's capacity
  const uint8_t sent[4] = {0xB0, 7, 99, 0};
  adapter.SendMIDIEvent(5, sent);
  adapter.Run(64);
  std::string notes;
  for (const KRecordingPlugin::Entry& e : plugin->Log())
    if (e.kind == KRecordingPlugin::Entry::kNote) notes += std::to_string(e.note) + "@" + std::to_string(e.length) + " ";
  EXPECT_EQ(notes, "60@10 64@30 ");
  const auto* produced = reinterpret_cast<const LV2_Atom_Sequence*>(out);
  const LV2_Atom_Event* first = lv2_atom_sequence_begin(&produced->body);
  ASSERT_FALSE(lv2_atom_sequence_is_end(&produced->body, produced->atom.size, first));
  EXPECT_EQ(std::tuple(first->time.frames, first->body.size, *reinterpret_cast<const uint8_t*>(first + 1)), std::tuple(int64_t{5}, 3u, uint8_t{0xB0}));
  EXPECT_TRUE(lv2_atom_sequence_is_end(&produced->body, produced->atom.size, lv2_atom_sequence_next(first)));
}

// The host's time:Position objects in the atom input reach the plug-in's transport through the
// shared rules, are carried forward between positions at the reported speed, and leave the MIDI
// beside them alone.
TEST(LV2Adapter, TimePositionsFromTheAtomInputBecomeTheTransport) {
  KMIDIRig rig;
  const KTransport& transport = rig.plugin->Transport();
  LV2_Atom_Forge forge;
  lv2_atom_forge_init(&forge, &rig.map.map);
  // One block's input: a position (fields as given, -1 left out) and a note at frame 10.
  const auto block = [&](double speed, double barBeat, bool withNote) {
    lv2_atom_forge_set_buffer(&forge, rig.in, sizeof rig.in);
    LV2_Atom_Forge_Frame sequence, object;
    lv2_atom_forge_sequence_head(&forge, &sequence, 0);
    if (speed >= 0) {
      lv2_atom_forge_frame_time(&forge, 0);
      lv2_atom_forge_object(&forge, &object, 0, rig.Id(LV2_TIME__Position));
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__frame)), lv2_atom_forge_long(&forge, 96000);
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__speed)), lv2_atom_forge_float(&forge, static_cast<float>(speed));
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__beatsPerMinute)), lv2_atom_forge_float(&forge, 120.0f);
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__bar)), lv2_atom_forge_long(&forge, 3);
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__barBeat)), lv2_atom_forge_double(&forge, barBeat);
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__beatsPerBar)), lv2_atom_forge_float(&forge, 6.0f);
      lv2_atom_forge_key(&forge, rig.Id(LV2_TIME__beatUnit)), lv2_atom_forge_int(&forge, 8);
      lv2_atom_forge_pop(&forge, &object);
    }
    if (withNote) {
      const uint8_t note[3] = {0x90, 60, 100};
      lv2_atom_forge_frame_time(&forge, 10);
      lv2_atom_forge_atom(&forge, 3, rig.Id(LV2_MIDI__MidiEvent));
      lv2_atom_forge_write(&forge, note, 3);
    }
    lv2_atom_forge_pop(&forge, &sequence);
    reinterpret_cast<LV2_Atom_Sequence*>(rig.out)->atom.size = sizeof rig.out - sizeof(LV2_Atom);
    rig.adapter->Run(64);
  };
  constexpr double kQuartersPerBlock = 64 * 120.0 / 60.0 / 48000.0 * 0.5;  // beats of an eighth

  block(-1, 0, false);  // before any position: nothing known
  EXPECT_EQ(std::tuple(transport.tempo, transport.samplePosition, transport.IsPlaying()), std::tuple(-1.0, KTransport::kUnknownSamplePosition, false));

  // Bar 3 of 6/8, one and a half eighths in: the bar starts at 9 quarter notes.
  block(1.0, 1.5, true);
  EXPECT_EQ(std::tuple(transport.tempo, transport.samplePosition, transport.numerator, transport.denominator, transport.IsPlaying()),
            std::tuple(120.0, int64_t{96000}, 6, 8, true));
  EXPECT_DOUBLE_EQ(transport.barStart, 9.0);
  EXPECT_DOUBLE_EQ(transport.songPosition, 9.75);
  int32_t notes = 0;
  for (const KRecordingPlugin::Entry& e : rig.plugin->Log()) notes += e.kind == KRecordingPlugin::Entry::kNote && e.note == 60 && e.length == 10;
  EXPECT_EQ(notes, 1);

  // No position in the next block: carried on by the block before it.
  block(-1, 0, false);
  EXPECT_EQ(transport.samplePosition, 96064);
  EXPECT_NEAR(transport.songPosition, 9.75 + kQuartersPerBlock, 1e-12);
  EXPECT_DOUBLE_EQ(transport.barStart, 9.0);

  // A block that ends past the bar line: the next one starts in bar 4 (12 quarter notes).
  block(1.0, 5.999, false);
  block(-1, 0, false);
  EXPECT_DOUBLE_EQ(transport.barStart, 12.0);
  EXPECT_NEAR(transport.songPosition, 9.0 + 5.999 * 0.5 + kQuartersPerBlock, 1e-9);

  // Stopped: not playing, and the position stays where the host put it.
  block(0.0, 2.0, false);
  block(-1, 0, false);
  EXPECT_FALSE(transport.IsPlaying());
  EXPECT_EQ(transport.samplePosition, 96000);
  EXPECT_DOUBLE_EQ(transport.songPosition, 10.0);
}
