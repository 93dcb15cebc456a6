// The built bundles driven as a host drives them; the adapter in this process around test plug-ins.
#include "core/KAudioPlugin.h"
#include "hosts/vst3/KAudioPluginVST3Adapter.h"
#include "hosts/vst3/KVST3ClassId.h"
#include "hosts/vst3/KVST3Parameters.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KPluginIdentifiers.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"
#include "tests/core/UserDataFolder.h"
#include "tests/hosts/VST3Host.h"

#include <filesystem>
#include <fstream>
#include <random>

using namespace KVST3Test;

namespace {
ParamID Parameters(const char* key) { return static_cast<ParamID>(std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString::Static(key)))->ParameterCount()); }
FUnknown* Adapt(KAudioPlugin* plugin) { return static_cast<IComponent*>(new KAudioPluginVST3Adapter(std::unique_ptr<KAudioPlugin>(plugin))); }
}  // namespace

TEST(VST3Bundles, EveryCataloguePluginHasABundleThatDescribesAndMakesIt) {
  for (const KString& key : GetTorvanePluginList()) {
    const std::string name = KPluginIds::BundleName(key.ToUtf8());
    KBundle bundle(name);
    ASSERT_TRUE(bundle.factory) << name;
    PFactoryInfo factory{}; PClassInfoW info{};
    IPluginFactory3* factory3 = Query<IPluginFactory3>(bundle.factory);
    ASSERT_TRUE(factory3) << name;
    EXPECT_EQ(bundle.factory->GetFactoryInfo(&factory) | factory3->GetClassInfoUnicode(0, &info), kResultOk);
    factory3->Release();
    EXPECT_TRUE(KClassIdOf(key.ToUtf8()).Is(info.cid)) << name;
    EXPECT_EQ(std::tuple(std::string(factory.vendor), bundle.factory->CountClasses(), std::string(info.category), std::string(info.subCategories).substr(0, 3),
                         std::u16string(info.name), std::u16string(info.version)),
              std::tuple("Torvane", 1, "Audio Module Class", "Fx|", std::u16string(name.begin(), name.end()), u"" TORVANE_VERSION));
    // Every parameter of the plug-in can be automated: a host hides the others from its controls.
    KInstance made(bundle.Create());
    KHost host;
    ASSERT_EQ(made.component->Initialize(static_cast<IHostApplication*>(&host)), kResultOk);
    for (int32_t index = 0, count = made.controller->GetParameterCount(); index < count; ++index) {
      ParameterInfo parameter{};
      ASSERT_EQ(made.controller->GetParameterInfo(index, parameter), kResultOk);
      EXPECT_TRUE(parameter.id >= KParameterTable::kFirstController || (parameter.flags & ParameterInfo::kCanAutomate)) << name << " " << parameter.id;
    }
    EXPECT_EQ(made.component->Terminate(), kResultOk);
  }
}

// When a host unloads the last bundle, the kernel leaves the process with it (no symbol of it pins
// it in memory), so that a second load starts from fresh globals; and it loads again.
TEST(VST3Bundles, TheKernelUnloadsWithTheLastBundleAndLoadsAgain) {
  const std::string binaries = BundleBinaries("Utility");
  for (int round = 1; round <= 2; ++round) {
    {
      KBundle bundle("Utility");
      ASSERT_TRUE(bundle.factory);
      KInstance made(bundle.Create());
      EXPECT_TRUE(KPlatform::IsLibraryLoaded(binaries + kKernelFile));
    }
    EXPECT_FALSE(KPlatform::IsLibraryLoaded(binaries + kKernelFile)) << "round " << round;
    EXPECT_FALSE(KPlatform::IsLibraryLoaded(binaries + "Utility" + kModuleSuffix)) << "round " << round;
  }
}

// A bundle whose name the kernel does not know (renamed by hand) loads, offers no factory and
// says why; nothing crashes.
TEST(VST3Bundles, ABundleOfAnUnknownNameOffersNoFactory) {
  namespace fs = std::filesystem;
  const fs::path folder = TORVANE_VST3_DIR "-unknown";
  const fs::path binaries = folder / "Nope.vst3/Contents" / TORVANE_VST3_ARCH;
  fs::create_directories(binaries);
  const std::string module = std::string("Nope") + kModuleSuffix;
  fs::copy_file(BundleBinaries("Utility") + "Utility" + kModuleSuffix, binaries / module, fs::copy_options::overwrite_existing);
  fs::copy_file(BundleBinaries("Utility") + kKernelFile, binaries / kKernelFile, fs::copy_options::overwrite_existing);
  void* library = KPlatform::OpenLibrary((binaries / module).string());
  ASSERT_TRUE(library) << KPlatform::LibraryError();
  const auto get = reinterpret_cast<GetPluginFactoryFunction>(KPlatform::FindSymbol(library, "GetPluginFactory"));
  ASSERT_TRUE(get);
  EXPECT_TRUE(EnterModule(library));
  testing::internal::CaptureStderr();
  EXPECT_EQ(get(), nullptr);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Torvane: the kernel knows no plug-in of the bundle Nope\n");
  EXPECT_TRUE(ExitModule(library));
  KPlatform::CloseLibrary(library);
  fs::remove_all(folder);
}

// Two bundles at once, each with its own kernel. The compressor's buses and parameters; its state
// restores another instance exactly (a broken one changes nothing); texts; audio through both.
TEST(VST3Bundles, TwoBundlesAtOnceCompressorBusesParametersStateTextsAndAudio) {
  KBundle compressor("Compressor"), equalizer("Equalizer");
  KHost host;
  KInstance source(compressor.Create()), target(compressor.Create()), filter(equalizer.Create());
  for (KInstance* instance : {&source, &target, &filter}) instance->Start(host);
  struct Bus { int32_t direction, index; std::u16string name; int32_t type; uint32_t flags; };
  for (const Bus& bus : {Bus{kInput, 0, u"Input", kMain, 1}, Bus{kInput, 1, u"Sidechain", kAux, 0}, Bus{kOutput, 0, u"Output", kMain, 1}}) {
    BusInfo info{};
    ASSERT_EQ(source.component->GetBusInfo(kAudio, bus.direction, bus.index, info), kResultTrue);
    EXPECT_EQ(std::tuple(std::u16string(info.name), info.busType, info.flags, info.channelCount), std::tuple(bus.name, bus.type, bus.flags, 2));
  }
  // An effect: its own parameters, bypass, program (a step per preset), then 130 controllers of channel 0.
  const ParamID n = Parameters("KCompressorPlugin");
  const int32_t count = source.controller->GetParameterCount();
  ASSERT_EQ(count, static_cast<int32_t>(n) + 2 + 130);
  const int32_t programs = std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString::Static("KCompressorPlugin")))->ListPresets().Count();
  ASSERT_GE(programs, 3);
  struct Row { int32_t index; ParamID id; std::u16string title; int32_t steps, flags; };
  for (const Row& row : {Row{count - 132, 32767, u"Bypass", 1, 0x10001}, Row{count - 131, 32766, u"Program", programs - 1, 0x8001}, Row{count - 1, 10129, u"MIDI CC 129", 0, 0}}) {
    ParameterInfo info{};
    ASSERT_EQ(source.controller->GetParameterInfo(row.index, info), kResultOk);
    EXPECT_EQ(std::tuple(info.id, std::u16string(info.title), info.stepCount, info.flags), std::tuple(row.id, row.title, row.steps, row.flags));
  }
  // Mono or stereo, the same on every bus (the host asks while inactive), and 32-bit samples only.
  SpeakerArrangement mono[] = {SpeakerArrangements::kMono, SpeakerArrangements::kMono}, stereo[] = {3, 3};
  ProcessSetup doubles{kRealtime, kSample64, kBlock, 48000.0};
  IAudioProcessor* p = target.processor;
  EXPECT_EQ((std::tuple{target.component->SetActive(0), p->SetBusArrangements(mono, 2, mono, 1), p->SetBusArrangements(mono, 2, stereo, 1), p->SetBusArrangements(stereo, 1, stereo, 1)}),
            std::tuple(kResultOk, kResultTrue, kResultFalse, kResultFalse));
  EXPECT_EQ((std::tuple{p->CanProcessSampleSize(kSample64), p->SetupProcessing(doubles), p->SetBusArrangements(stereo, 2, stereo, 1), target.component->SetActive(1)}),
            std::tuple(kResultFalse, kResultFalse, kResultTrue, kResultOk));
  for (ParamID id = 0; id < n; ++id) source.controller->SetParamNormalized(id, 0.05 + 0.09 * (id * 7 % 11));
  const std::string state = source.State();
  KStream whole, broken;
  whole.bytes = state, broken.bytes = state.substr(0, state.size() / 2);
  EXPECT_EQ((std::pair{target.component->SetState(&whole), target.State()}), std::pair(kResultOk, state));
  EXPECT_EQ((std::pair{target.component->SetState(&broken), target.State()}), std::pair(kResultFalse, state));
  struct Text { ParamID id; double normalized; std::u16string text; };
  std::vector<Text> texts = {{32767, 1.0, u"On"}, {32767, 0.2, u"Off"}, {32766, 1.0 / (programs - 1), u"Vocal leveler"}, {10007, 1.0, u"127"}, {10129, 0.5, u"8192"}};
  for (ParamID id = 0; id < n; ++id) texts.push_back({id, target.controller->GetParamNormalized(id), source.Text(id, source.controller->GetParamNormalized(id))});
  for (double value = 0.0; Text& t : texts) {
    EXPECT_EQ(target.Text(t.id, t.normalized), t.text);
    ASSERT_EQ(target.controller->GetParamValueByString(t.id, t.text.data(), value), kResultOk) << t.id;
    EXPECT_EQ(target.Text(t.id, value), t.text);
  }
  KBlock bypassed(2, 1), silent(2, 1), filtered(1, 1);
  bypassed.Change(32767, {{0, 1.0}});  // bypassed, the main input passes unchanged
  for (size_t c = 0; c < 4; ++c) std::fill(silent.planes[c].begin(), silent.planes[c].end(), 0.0f);
  for (auto [instance, block] : {std::pair{&source, &bypassed}, std::pair{&source, &silent}, std::pair{&filter, &filtered}})
    ASSERT_EQ(instance->processor->Process(block->data), kResultOk);
  EXPECT_EQ(std::pair(bypassed.Out(0), bypassed.Out(1)), std::pair(bypassed.planes[0], bypassed.planes[1]));
  EXPECT_EQ(std::pair(bypassed.buses[2].silenceFlags, silent.buses[2].silenceFlags), std::pair(uint64_t{0}, uint64_t{3}));
  EXPECT_GT(*std::max_element(filtered.Out(0).begin(), filtered.Out(0).end()), 0.1f);
  for (KInstance* instance : {&source, &target, &filter}) instance->Stop();
}

// The program list names the plug-in's presets in order, as the program parameter's texts do;
// the parameter chooses among them from the controller at once and from the audio thread at the
// next idle, reads back as the current preset wherever it was chosen, and survives the state.
// A host that writes back the program it read reloads nothing.
TEST(VST3Adapter, TheProgramListAndParameterChooseTheFactoryPresets) {
  const auto presets = kUtilityDescription.presets;
  auto make = [&] {
    auto* plugin = new KUtilityPlugin;  // never named: no folder for the user's presets, the factory's only
    plugin->SetFactoryPresets(presets);
    return plugin;
  };
  KUtilityPlugin* plugin = make();
  KHost host;
  KInstance instance(Adapt(plugin));
  instance.Start(host);
  IUnitInfo* units = Query<IUnitInfo>(instance.component);
  ASSERT_NE(units, nullptr);
  UnitInfo unit{};
  ProgramListInfo list{};
  ASSERT_EQ(units->GetUnitInfo(0, unit) | units->GetProgramListInfo(0, list), kResultOk);
  const int32_t last = static_cast<int32_t>(presets.size()) - 1;
  EXPECT_EQ(std::tuple(std::u16string(unit.name), unit.programListId, std::u16string(list.name), list.id, list.programCount, units->GetProgramListCount()),
            std::tuple(u"Root", list.id, u"Presets", 1, last + 1, 1));
  ParameterInfo info{};
  ASSERT_EQ(instance.controller->GetParameterInfo(KUtilityPlugin::kParameterCount + 1, info), kResultOk);
  EXPECT_EQ(std::tuple(info.id, info.stepCount, info.flags), std::tuple(32766u, last, 0x8001));
  for (int32_t i = 0; i <= last; ++i) {
    String128 name = {}, named = {};
    ASSERT_EQ(units->GetProgramName(list.id, i, name) | units->GetProgramInfo(list.id, i, "Name", named), kResultOk);
    const std::string ascii = presets[static_cast<size_t>(i)].name;  // the names are plain ASCII
    const std::u16string expected(ascii.begin(), ascii.end());
    EXPECT_EQ(std::tuple(std::u16string(name), std::u16string(named), instance.Text(32766, static_cast<double>(i) / last)), std::tuple(expected, expected, expected));
    double value = -1.0;
    ASSERT_EQ(instance.controller->GetParamValueByString(32766, name, value), kResultOk);
    EXPECT_EQ(value, static_cast<double>(i) / last);
  }
  String128 none = {};
  EXPECT_EQ((std::pair{units->GetProgramName(list.id, last + 1, none), units->GetProgramName(7, 0, none)}), std::pair(kInvalidArgument, kInvalidArgument));

  // From the controller: loaded at once, and the host is told the values changed.
  ASSERT_EQ(instance.controller->SetParamNormalized(32766, 1.0 / last), kResultOk);
  EXPECT_EQ(std::tuple(plugin->ActivePresetName().ToUtf8(), plugin->IsActivePresetFactory(), instance.controller->GetParamNormalized(32766)),
            std::tuple(std::string(presets[1].name), true, 1.0 / last));
  EXPECT_NE(std::find(host.restarts.begin(), host.restarts.end(), kParamValuesChanged), host.restarts.end());
  // The user edits; a host that writes the same program back keeps the edit.
  instance.controller->SetParamNormalized(KUtilityPlugin::kGain, 0.9);
  instance.controller->SetParamNormalized(32766, instance.controller->GetParamNormalized(32766));
  EXPECT_EQ(plugin->GetParameter(KUtilityPlugin::kGain).Normalized(), 0.9);
  // From the audio thread: noted while processing, loaded at the next idle.
  KBlock block(1, 1);
  block.Change(32766, {{0, 1.0}});
  ASSERT_EQ(instance.processor->Process(block.data), kResultOk);
  EXPECT_EQ(plugin->ActivePresetName().ToUtf8(), presets[1].name);
  static_cast<KAudioPluginVST3Adapter*>(instance.component)->Idle();
  EXPECT_EQ(std::pair(plugin->ActivePresetName().ToUtf8(), instance.controller->GetParamNormalized(32766)), std::pair(std::string(presets[static_cast<size_t>(last)].name), 1.0));
  // Chosen in the plug-in (its editor): the program follows.
  plugin->SelectPreset(0);
  EXPECT_EQ(instance.controller->GetParamNormalized(32766), 0.0);

  // A project reopened: the current preset and the program come back.
  plugin->SelectPreset(1);
  KStream saved;
  saved.bytes = instance.State();
  KUtilityPlugin* other = make();
  KInstance reopened(Adapt(other));
  reopened.Start(host);
  ASSERT_EQ(reopened.component->SetState(&saved), kResultOk);
  EXPECT_EQ(std::tuple(other->ActivePresetName().ToUtf8(), other->IsActivePresetFactory(), reopened.controller->GetParamNormalized(32766)),
            std::tuple(std::string(presets[1].name), true, 1.0 / last));
  units->Release();
  reopened.Stop();
  instance.Stop();
}

// A preset the user saves joins the list after the factory's: the list, the program's step count
// and its texts grow together, and the host is told to read the parameters and the list again.
// A renamed preset changes the list's names only: the list is announced, the titles are not.
TEST(VST3Adapter, ASavedPresetJoinsTheProgramListAfterTheFactoryPresets) {
  const KUserDataFolder data;  // the user's presets go to a fresh folder
  {
    auto* plugin = new KUtilityPlugin;
    plugin->SetIdentifier("KUtilityPlugin");
    plugin->SetFactoryPresets(kUtilityDescription.presets);
    KHost host;
    KInstance instance(Adapt(plugin));
    instance.Start(host);
    const int32_t factory = plugin->FactoryPresetCount();
    plugin->SavePreset("Mine");
    ParameterInfo info{};
    ASSERT_EQ(instance.controller->GetParameterInfo(KUtilityPlugin::kParameterCount + 1, info), kResultOk);
    EXPECT_EQ(info.stepCount, factory);
    EXPECT_NE(std::find(host.restarts.begin(), host.restarts.end(), kParamValuesChanged | kParamTitlesChanged), host.restarts.end());
    EXPECT_EQ(std::pair(instance.Text(32766, 1.0), instance.controller->GetParamNormalized(32766)), std::pair(std::u16string(u"Mine"), 1.0));
    IUnitInfo* units = Query<IUnitInfo>(instance.component);
    ProgramListInfo list{};
    ASSERT_EQ(units->GetProgramListInfo(0, list), kResultOk);
    EXPECT_EQ(list.programCount, factory + 1);
    const std::pair<int32_t, int32_t> wholeList{list.id, IUnitHandler::kAllProgramInvalid};
    EXPECT_EQ(host.programListChanges, (std::vector{wholeList}));
    host.restarts.clear();
    plugin->RenamePreset("Mine", "Ours");
    EXPECT_EQ(host.programListChanges, (std::vector{wholeList, wholeList}));
    EXPECT_EQ(host.restarts, (std::vector<int32_t>{kParamValuesChanged}));
    EXPECT_EQ(instance.Text(32766, 1.0), u"Ours");
    // Deleting it shrinks the list again, and leaves the user's presets as the test found them
    // (the Windows run shares them between test programs).
    plugin->DeletePreset("Ours");
    EXPECT_EQ(host.programListChanges.size(), 3u);
    ASSERT_EQ(units->GetProgramListInfo(0, list), kResultOk);
    EXPECT_EQ(list.programCount, factory);
    units->Release();
    instance.Stop();
  }
}

TEST(VST3Adapter, AnInstrumentHas2080ControllersAnEffect130And10267IsController7OnChannel3) {
  for (const KAudioPlugin::Shape shape : {KAudioPlugin::Shape{0, 1, true, false, true}, KRecordingPlugin::kEffect}) {
    const bool instrument = shape.inputBuses == 0;
    auto* plugin = new KRecordingPlugin(4, shape, KRecordingPlugin::kChannelNumber);
    plugin->Controllers().Assign({7, 2, 1});  // controller 7 on channel 3 (counted from 1) moves parameter 1
    plugin->Controllers().SetSingleChannel(true);
    KHost host;
    KInstance instance(Adapt(plugin));
    instance.Start(host);
    ParameterInfo info{};
    ASSERT_EQ(instance.controller->GetParameterCount(), 4 + 2 + (instrument ? 2080 : 130));
    ASSERT_EQ(instance.controller->GetParameterInfo(6 + 7 + (instrument ? 260 : 0), info), kResultOk);
    EXPECT_EQ(std::u16string(info.title), instrument ? u"MIDI CC 7 channel 3" : u"MIDI CC 7");
    for (const auto& [id, moved] : {std::pair{10000u + 7 + 130 * 3, 0.0}, std::pair{10000u + 7 + 130 * 2, instrument ? 1.0 : 0.0}}) {
      KBlock block(shape.inputBuses, 1);
      block.Change(id, {{0, 1.0}});
      ASSERT_EQ(instance.processor->Process(block.data), kResultOk);
      EXPECT_EQ(plugin->GetParameter(1).Normalized(), moved) << id;
    }
  }
}

TEST(VST3Adapter, QueuePointsRampThePluginAsTheCommandLineHostDoes) {
  KUtilityPlugin direct;
  KHost host;
  KInstance instance(Adapt(new KUtilityPlugin));
  instance.Start(host);
  ASSERT_TRUE(direct.SetSampleRate(48000.0));
  direct.Reset();
  KBlock automated(1, 1), reference(1, 1), constant(1, 1);
  // The first block after a reset lands every value at once: one block each before the ramp.
  ASSERT_EQ(instance.processor->Process(constant.data), kResultOk);
  direct.ProcessHostBlock(reference.channels.data(), reference.channels.data() + 2, kBlock);
  const KAudioPluginBase::RampPoint ramp[] = {{0, 0.2}, {100, 0.9}, {300, 0.4}};
  direct.AddRamp(KUtilityPlugin::kGain, ramp, true);  // fine, as the command-line host adds its ramps
  direct.ProcessHostBlock(reference.channels.data(), reference.channels.data() + 2, kBlock);
  automated.Change(KUtilityPlugin::kGain, {{0, 0.2}, {100, 0.9}, {300, 0.4}});
  ASSERT_EQ(instance.processor->Process(automated.data), kResultOk);
  EXPECT_EQ(std::pair(automated.Out(0), automated.Out(1)), std::pair(reference.Out(0), reference.Out(1)));
  EXPECT_NE(constant.Out(0), automated.Out(0));  // the ramp did move the gain
}

TEST(VST3Adapter, ProcessDeliversNotesControllersTransportAndLatencyWithoutAllocating) {
  using C = ProcessContext;
  auto* plugin = new KRecordingPlugin(4);
  KHost host;
  KInstance instance(Adapt(plugin));
  instance.Start(host);
  KBlock block(1, 1);
  block.Change(0, {{0, 0.1}, {100, 0.5}, {300, 0.9}});
  block.Change(10007, {{50, 0.5}});
  block.events.list = {Event{0, 10, 0.0, 0, Event::kNoteOnEvent, {.noteOn = {0, 60, 0.0f, 0.8f, 0, -1}}},
                       Event{0, 20, 0.0, 0, Event::kNoteOffEvent, {.noteOff = {0, 60, 0.0f, -1, 0.0f}}}};
  auto fields = [](const KTransport& t) { return std::tuple(t.tempo, t.songPosition, t.barStart, t.samplePosition, t.numerator, t.denominator, t.cycleStart, t.cycleEnd, t.flags); };
  // Transport: 6/8 snaps the bar start to half quarters; ignored: tempo 1, an empty cycle, numerator 0, unflagged bars.
  struct Row { uint32_t state; double tempo; int32_t numerator; KTransport expected; };
  for (const Row& row : {Row{C::kTempoValid | C::kBarPositionValid | C::kTimeSigValid | C::kCycleValid | C::kPlaying, 1.0, 6, {-1.0, -1.0, 7.5, 96000, 6, 8, -1.0, -1.0, 1}},
                         Row{C::kTempoValid | C::kTimeSigValid | C::kProjectTimeMusicValid, 120.0, 0, {120.0, 2.0, -1.0, 96000, 4, 4, -1.0, -1.0, 0}}}) {
    block.context = {row.state, 48000.0, 96000, 0, 0, 2.0, 7.4, 4.0, 4.0, row.tempo, row.numerator, 8, {}, 0, {}, 0};
    KAllocationCounter counter;
    ASSERT_EQ(instance.processor->Process(block.data), kResultOk);
    EXPECT_EQ(counter.Count(), 0);
    EXPECT_EQ(fields(plugin->Transport()), fields(row.expected));
  }
  std::vector<std::pair<int32_t, int32_t>> notes;
  for (const KRecordingPlugin::Entry& e : plugin->Log()) if (e.kind == KRecordingPlugin::Entry::kNote) notes.emplace_back(e.length, e.note);
  EXPECT_EQ(notes, (std::vector<std::pair<int32_t, int32_t>>{{10, 60}, {20, 60}, {10, 60}, {20, 60}}));  // one pair per block
  EXPECT_EQ(std::pair(plugin->GetParameter(0).Normalized(), instance.controller->GetParamNormalized(10007)), std::pair(0.9, 0.5));
  plugin->ReportLatency(64);
  static_cast<KAudioPluginVST3Adapter*>(instance.component)->Idle();  // what the host's run loop calls
  EXPECT_EQ(std::pair(host.restarts, instance.processor->GetLatencySamples()), std::pair(std::vector<int32_t>{kLatencyChanged}, 64u));
}

// The host's channel reaches the plug-in (a key left out keeps its value); the second controller
// face answers; a bypass the user switches goes to the host as one whole gesture.
TEST(VST3Adapter, ChannelContextEditController2AndTheUsersBypassReachTheirTargets) {
  using namespace ChannelContext;
  auto* plugin = new KRecordingPlugin(4);
  KHost host;
  KInstance instance(Adapt(plugin));
  instance.Start(host);
  const auto [listener, controller2] = std::pair(Query<IInfoListener>(instance.component), Query<IEditController2>(instance.component));
  ASSERT_TRUE(listener && controller2);
  KAttributes channel, moved;
  channel.SetString(kChannelNameKey, u"Drums"), channel.SetInt(kChannelColorKey, 0xFF336699), channel.SetInt(kChannelPluginLocationKey, kPostVolumeFader);
  moved.SetString(kChannelPluginLocationKey, u"Insert 3");
  auto fields = [&context = plugin->ChannelContext()] { return std::tuple(context.name.ToUtf8(), context.color, context.hasColor, context.location.ToUtf8()); };
  EXPECT_EQ((std::pair{listener->SetChannelContextInfos(&channel), fields()}), std::pair(kResultTrue, decltype(fields()){"Drums", 0xFF336699u, true, "post-fader"}));
  EXPECT_EQ((std::pair{listener->SetChannelContextInfos(&moved), fields()}), std::pair(kResultTrue, decltype(fields()){"Drums", 0xFF336699u, true, "Insert 3"}));
  EXPECT_EQ((std::tuple{controller2->SetKnobMode(IEditController2::kLinearMode), controller2->SetKnobMode(3), controller2->OpenHelp(0), controller2->OpenAboutBox(0),
                        static_cast<KAudioPluginVST3Adapter*>(instance.component)->KnobMode()}),
            std::tuple(kResultTrue, kResultFalse, kResultFalse, kResultFalse, IEditController2::kLinearMode));
  plugin->SetBypassFromUser(true);
  EXPECT_EQ(std::pair(plugin->IsBypassed(), host.edits), std::pair(true, std::vector<std::tuple<char, ParamID, double>>{{'b', 32767, 0.0}, {'p', 32767, 1.0}, {'e', 32767, 0.0}}));
  listener->Release(), controller2->Release();
  instance.Stop();
}

// A host that sends each block its lane's value at the block's first and last sample, as hosts
// do: the compressor's threshold falls in a straight line. The ramps move on the plug-in's own
// grid, not the host's blocks, so any block size renders alike, here bit for bit.
TEST(VST3Bundles, AutomationRendersAlikeWhateverTheHostsBlockSize) {
  KBundle bundle("Compressor");
  const auto threshold = static_cast<ParamID>(std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin("KCompressorPlugin"))->FindParameter("threshold")->Index());
  const auto lane = [](int64_t at) { return 0.9 - 0.6 * static_cast<double>(at) / 12000.0; };
  const auto render = [&](auto nextBlock) {
    KHost host;
    KInstance instance(bundle.Create());
    instance.Start(host);
    std::vector<float> out;
    for (int64_t start = 0, n = 0; start < 12000; start += n) {
      n = start == 0 ? 64 : std::min<int64_t>(nextBlock(), 12000 - start);
      KBlock block(2, 1);
      block.data.numSamples = static_cast<int32_t>(n);
      for (int64_t i = 0; i < n; ++i) block.planes[0][i] = block.planes[1][i] = 0.8f * std::sin(0.05f * static_cast<float>(start + i));
      // The first block after activation lands values at once: it is the same for every size.
      block.Change(threshold, {{0, lane(start)}, {static_cast<int32_t>(n - 1), lane(start + n - 1)}});
      EXPECT_EQ(instance.processor->Process(block.data), kResultOk);
      out.insert(out.end(), block.Out(0).begin(), block.Out(0).begin() + n);
    }
    instance.Stop();
    return out;
  };
  const std::vector<float> reference = render([] { return 512; });
  std::mt19937 random(3);
  std::uniform_int_distribution<int32_t> anySize(1, kBlock);
  for (int32_t size : {32, 500, 0}) {
    const std::vector<float> other = render([&] { return size > 0 ? size : anySize(random); });
    float largest = 0.0f;
    for (size_t i = 0; i < other.size(); ++i) largest = std::max(largest, std::abs(other[i] - reference[i]));
    EXPECT_EQ(largest, 0.0f) << "blocks of " << (size > 0 ? std::to_string(size) : "random size");
  }
}

// What each bundle renders from a fixed input with an automated parameter, kept as raw floats in
// <bundles>-render/<Name>.f32: scripts/windows-test.sh compares the Windows bundles' files with
// the Linux bundles', which must agree bit for bit (same arithmetic on both systems).
TEST(VST3Bundles, RenderedOutputIsKeptForTheOtherSystemsBuild) {
  namespace fs = std::filesystem;
  const fs::path folder = TORVANE_VST3_DIR "-render";
  fs::create_directories(folder);
  for (const char* name : {"Compressor", "Equalizer"}) {
    KBundle bundle(name);
    ASSERT_TRUE(bundle.factory) << name;
    KHost host;
    KInstance instance(bundle.Create());
    instance.Start(host);
    std::vector<float> out;
    for (int32_t start = 0; start < 8 * kBlock; start += kBlock) {
      KBlock block(1, 1);
      // A sawtooth under a rising envelope from exact arithmetic alone: no C library's sine,
      // whose last bit differs between systems, in the input.
      for (int32_t i = 0; i < kBlock; ++i)
        block.planes[0][i] = block.planes[1][i] = static_cast<float>((start + i) * 37 % 200 - 100) / 128.0f * static_cast<float>(start + i + 512) / 4608.0f;
      block.Change(0, {{0, 0.2 + 0.6 * start / (8.0 * kBlock)}, {kBlock - 1, 0.2 + 0.6 * (start + kBlock) / (8.0 * kBlock)}});
      ASSERT_EQ(instance.processor->Process(block.data), kResultOk);
      for (int32_t c = 0; c < 2; ++c) out.insert(out.end(), block.Out(c).begin(), block.Out(c).end());
    }
    instance.Stop();
    // A render that went silent or blew up would compare equal on both systems and prove nothing.
    const float peak = std::abs(*std::max_element(out.begin(), out.end(), [](float a, float b) { return std::abs(a) < std::abs(b); }));
    EXPECT_TRUE(peak > 1e-3f && std::isfinite(peak)) << name << " peaks at " << peak;
    std::ofstream(folder / (std::string(name) + ".f32"), std::ios::binary)
        .write(reinterpret_cast<const char*>(out.data()), static_cast<std::streamsize>(out.size() * sizeof(float)));
  }
}
