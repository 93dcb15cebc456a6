// The built AAX bundles driven only through their exports as an AAX host drives them; the
// adapter in this process around test plug-ins.
#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/aax/KAAXDispatch.h"
#include "hosts/aax/KAudioPluginAAXAdapter.h"
#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KPluginIdentifiers.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"
#include "tests/core/TraceCapture.h"
#include "tests/hosts/AAXHost.h"
#include "tests/hosts/VST3Host.h"
#include "tests/tools/CliFixture.h"

#include <stdexcept>

using namespace KAAXTest;

namespace {
// The name is copied: the registry keeps the names it was asked for.
std::unique_ptr<KAudioPlugin> Make(const char* key) { return std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString::Widen(key))); }

// The VST 3 bundle's state text for the same plug-in with parameter i at `values(i)`.
template <class Values>
std::string VST3State(const std::string& name, int32_t count, Values values) {
  KVST3Test::KBundle bundle(name);
  KVST3Test::KHost host;
  KVST3Test::KInstance instance(bundle.Create());
  instance.Start(host);
  for (int32_t i = 0; i < count; ++i) instance.controller->SetParamNormalized(static_cast<KVST3::ParamID>(i), values(i));
  std::string state = instance.State();
  instance.Stop();
  return state;
}
}  // namespace

TEST(AAXBundles, EveryCataloguePluginRegistersThroughTheACFEntriesWithItsStemsAndIdentifiers) {
  for (const KString& key : GetTorvanePluginList()) {
    const std::string utf8 = key.ToUtf8();
    const std::unique_ptr<KAudioPlugin> plugin = Make(utf8.c_str());
    const KAudioPlugin::Shape& shape = plugin->GetShape();
    KBundle bundle(KPluginIds::BundleName(utf8));
    ASSERT_TRUE(bundle.definition);
    ASSERT_EQ(bundle.definition->Count(), 1) << utf8;  // the bundle's own plug-in, not the catalogue
    const KAAXPluginInformation& information = bundle.Information();
    const KPluginDescription& description = *KFindDescription(KProductCatalogue(), utf8);
    EXPECT_EQ(std::tuple(std::string(information.key), std::string(information.name), information.manufacturerId, information.productId),
              std::tuple(utf8, std::string(description.name), KFourCC("Torv"), static_cast<uint32_t>(KPluginIds::AAXProductId(description.vst2Id))));
    EXPECT_EQ(information.configurations[0].pluginId, static_cast<uint32_t>(KPluginIds::AAXPluginId(description.identity)));
    ASSERT_EQ(information.configurationCount, 2);  // stereo first, then mono
    for (int32_t c = 0; c < 2; ++c) {
      const auto& configuration = information.configurations[c];
      const uint32_t stem = c == 0 ? kStemFormatStereo : kStemFormatMono;
      EXPECT_EQ(std::tuple(configuration.inputStem, configuration.outputStem, configuration.sideChainStem),
                std::tuple(shape.inputBuses ? stem : kStemFormatNone, stem, shape.inputBuses > 1 ? stem : kStemFormatNone)) << utf8;
    }
    EXPECT_NE(information.configurations[0].pluginId, information.configurations[1].pluginId);
    EXPECT_EQ(std::pair(information.acceptsMIDI, information.producesMIDI), std::pair(shape.acceptsMIDI, shape.producesMIDI));
    // Components and class factories are not how AAX makes anything.
    void* nothing = &bundle;
    EXPECT_EQ(bundle.Entry<ACFResult (*)(IACFUnknown*, uint32_t, void**)>("ACFRegisterComponent")(nullptr, 0, &nothing), kACFOk);
    EXPECT_EQ(nothing, nullptr);
    EXPECT_EQ(bundle.Entry<ACFResult (*)(IACFUnknown*, const void*, const void*, void**)>("ACFGetClassFactory")(nullptr, nullptr, nullptr, &nothing),
              kACFNotImplemented);
  }
  // Inside the kernel linked here (no bundle around it) the definition is the whole catalogue.
  IACFPluginDefinition* all = nullptr;
  ASSERT_EQ(ACFRegisterPlugin(nullptr, &all), kACFOk);
  EXPECT_EQ(all->Count(), GetTorvanePluginList().Count());
  EXPECT_EQ(std::string(all->At(1)->key), GetTorvanePluginList()[1].ToUtf8());
  EXPECT_EQ(std::pair(all->At(1)->category, all->At(2)->category), std::pair(kCategoryDynamics, kCategoryEQ));
  all->Release();
}

TEST(AAXBundles, CompressorNamesTextsValuesChunksGUIBypassAndUnload) {
  const std::unique_ptr<KAudioPlugin> reference = Make("KCompressorPlugin");
  const int32_t n = reference->ParameterCount();
  ASSERT_GE(n, 13);
  KBundle bundle("Compressor");
  const auto unload = bundle.Entry<ACFEntry>("ACFCanUnloadNow");
  KController controller;
  KAutomation automation;
  KEffectParameters* source = bundle.Create(controller, automation);
  KEffectParameters* target = bundle.Create(controller, automation);
  ASSERT_TRUE(source && target);
  EXPECT_EQ(unload(nullptr), kACFFalse);  // effects alive

  // The master bypass's names by the host's label length; plug-in names cut to it.
  std::vector<std::string> names;
  for (const int32_t length : {13, 12, 8, 7, 6, 5}) names.push_back(Name(*source, kMasterBypassId, length));
  EXPECT_EQ(names, (std::vector<std::string>{"Master Bypass", "Mast Byp", "Mast Byp", "MstByp", "MstByp", "MByp"}));
  const std::string thirteenth = reference->GetParameter(12).Name().ToUtf8();
  char name[128] = {};
  EXPECT_EQ(source->GetParameterName("12", name, sizeof name), kSuccess);
  EXPECT_EQ(std::pair(std::string(name), Name(*source, "12", 3)), std::pair(thirteenth, thirteenth.substr(0, 3)));
  for (const ParamId unknown : {"13x", "-1", "", "99999999999"}) EXPECT_EQ(source->GetParameterName(unknown, name, sizeof name), kErrorInvalidParameterId);
  EXPECT_EQ(source->GetParameterName(std::to_string(n).c_str(), name, sizeof name), kErrorInvalidParameterId);

  // Values both ways: identifier "12" moves the thirteenth parameter; texts are the plug-in's.
  auto value = [](int32_t i) { return 0.05 + 0.09 * (i * 7 % 11); };
  for (int32_t i = 0; i < n; ++i) ASSERT_EQ(source->SetParameterNormalizedValue(std::to_string(i).c_str(), value(i)), kSuccess);
  double read = -1.0;
  EXPECT_EQ(source->GetParameterNormalizedValue("12", &read), kSuccess);
  EXPECT_DOUBLE_EQ(read, value(12));
  EXPECT_EQ(source->SetParameterNormalizedRelative("12", 0.1), kSuccess);
  EXPECT_EQ(source->GetParameterNormalizedValue("12", &read), kSuccess);
  EXPECT_DOUBLE_EQ(read, value(12) + 0.1);
  EXPECT_EQ(source->SetParameterNormalizedValue("12", value(12)), kSuccess);
  EXPECT_EQ(automation.posts.back(), std::make_tuple('s', std::string("12"), value(12)));
  for (int32_t i = 0; i < n; ++i)
    EXPECT_EQ(Text(*source, std::to_string(i).c_str(), 0.3), reference->GetParameter(i).TextForNormalized(0.3).ToUtf8()) << i;
  EXPECT_EQ(std::pair(Text(*source, kMasterBypassId, 1.0), Text(*source, kMasterBypassId, 0.2)), std::pair(std::string("On"), std::string("Off")));

  // The 'Torv' chunk is the VST 3 state text for the same settings, and restores another effect.
  const std::string state = GetChunk(*source, KFourCC("Torv")).Data();
  EXPECT_EQ(state, VST3State("Compressor", n, value));
  KChunk chunk = KChunk::Of(state);
  EXPECT_EQ(target->SetChunk(KFourCC("Torv"), chunk.Get()), kSuccess);
  EXPECT_EQ(GetChunk(*target, KFourCC("Torv")).Data(), state);
  EXPECT_EQ(target->GetParameterNormalizedValue("5", &read), kSuccess);
  EXPECT_NEAR(read, value(5), 1e-12);  // through the state's working value
  // Any other identifier reaches the base: the host-side values as "identifier=value" lines,
  // which land on the plug-in too when set.
  const std::string base = GetChunk(*target, KFourCC("elck")).Data();
  EXPECT_TRUE(base.starts_with("MasterBypassID=0\n0=")) << base;
  const size_t five = base.find("\n5=");
  ASSERT_NE(five, std::string::npos) << base;
  EXPECT_NEAR(std::strtod(base.c_str() + five + 3, nullptr), value(5), 1e-12);
  KChunk other = KChunk::Of("3=0.25\nnonsense\n");
  EXPECT_EQ(target->SetChunk(KFourCC("Othr"), other.Get()), kSuccess);
  EXPECT_EQ(target->GetParameterNormalizedValue("3", &read), kSuccess);
  EXPECT_DOUBLE_EQ(read, 0.25);
  EXPECT_NE(GetChunk(*target, KFourCC("Torv")).Data(), state);

  // The GUI: made, framed at the editor's size (a container without a window gets no window of
  // its own), destroyed. The window itself is the editor tests' (under a display).
  KView view;
  KAAXGUI* gui = bundle.Information().createGUI(source);
  ASSERT_NE(gui, nullptr);
  int32_t width = -1, height = -1;
  EXPECT_EQ(gui->CreateViewContents(), kErrorNotInitialized);  // not framed yet
  EXPECT_EQ(gui->GetViewSize(&width, &height), kSuccess);
  EXPECT_EQ(std::pair(width, height), std::pair(0, 0));
  EXPECT_EQ(gui->Create(&view), kSuccess);
  EXPECT_EQ(gui->CreateViewContents(), kSuccess);
  EXPECT_EQ(gui->GetViewSize(&width, &height), kSuccess);
  EXPECT_GT(width, 100);
  EXPECT_GT(height, 100);
  EXPECT_EQ(view.sizes, (std::vector<std::pair<int32_t, int32_t>>{{width, height}}));
  EXPECT_EQ(gui->TimerWakeup(), kSuccess);
  gui->Release();
  EXPECT_EQ(bundle.Information().createGUI(nullptr), nullptr);

  // Bypass from the host: the main input passes unchanged.
  KTransportState transport;
  KBuffer buffer(4, 2);
  for (size_t c = 0; c < 4; ++c)
    for (size_t i = 0; i < kBlock; ++i) buffer.in[c][i] = 0.5f * std::sin(0.01f * static_cast<float>(i * (c + 1)));
  EXPECT_EQ(source->UpdateParameterNormalizedValue(kMasterBypassId, 1.0), kSuccess);
  KAAXProcessContext* contexts[] = {buffer.Context(source, &transport)};
  bundle.Information().processCallback(contexts, contexts + 1);
  EXPECT_EQ(std::pair(buffer.out[0], buffer.out[1]), std::pair(buffer.in[0], buffer.in[1]));
  EXPECT_EQ(source->UpdateParameterNormalizedValue(kMasterBypassId, 0.0), kSuccess);
  bundle.Information().processCallback(contexts, contexts + 1);
  EXPECT_NE(buffer.out[0], buffer.in[0]);

  source->Release();
  EXPECT_EQ(unload(nullptr), kACFFalse);
  target->Release();
  EXPECT_EQ(unload(nullptr), kACFFalse);  // the host still holds the plug-in definition
  bundle.definition->Release();
  bundle.definition = nullptr;
  EXPECT_EQ(unload(nullptr), kACFOk);
}

// The same input through the AAX bundle (with a playing transport and MIDI notes that these
// effects ignore) and through `torvane render`: the same samples, bit for bit.
class AAXRender : public CliTest {};

TEST_F(AAXRender, CompressorEqualizerAndSaturatorSoundAsTheCommandLineRendersThem) {
  const Audio input = AudioFile(Work() / "in.wav");
  const size_t frames = input.samples.size() / 2;
  struct Case { const char* key; int32_t parameter; double normalized; };
  for (const Case& c : {Case{"KCompressorPlugin", 5, 0.3}, Case{"KEqualizerPlugin", 3, 0.8}, Case{"KSampleWarmer", 0, 0.7}}) {
    SCOPED_TRACE(c.key);
    const std::unique_ptr<KAudioPlugin> reference = Make(c.key);
    const KAudioPluginBase::Parameter& parameter = reference->GetParameter(c.parameter);
    char working[64];
    std::snprintf(working, sizeof working, "%.17g", parameter.Kind().ToWorking(c.normalized));
    const Audio rendered = Render({c.key, "in.wav", "--set", parameter.Key().ToUtf8() + "=" + working});
    ASSERT_EQ(rendered.samples.size(), input.samples.size());

    KBundle bundle(KPluginIds::BundleName(c.key));
    KController controller;
    KAutomation automation;
    KEffectParameters* effect = bundle.Create(controller, automation);
    ASSERT_NE(effect, nullptr);
    // What the command line does with the same working value.
    const double normalized = parameter.Kind().ToNormalized(std::strtod(working, nullptr));
    ASSERT_EQ(effect->SetParameterNormalizedValue(std::to_string(c.parameter).c_str(), normalized), kSuccess);
    KTransportState transport;
    std::vector<float> output(input.samples.size());
    for (size_t start = 0; start < frames; start += kBlock) {
      const int32_t length = static_cast<int32_t>(std::min<size_t>(kBlock, frames - start));
      KBuffer buffer(reference->InputChannelCount(), 2, length);
      for (int32_t i = 0; i < length; ++i)
        for (size_t ch = 0; ch < 2; ++ch) buffer.in[ch][static_cast<size_t>(i)] = input.samples[2 * (start + static_cast<size_t>(i)) + ch];
      buffer.midi.in = {{10, 3, {0x90, 60, 100, 0}, false}, {100, 3, {0xB0, 1, 64, 0}, false}, {300, 3, {0x80, 60, 0, 0}, false}};
      transport.samples = static_cast<int64_t>(start);
      KAAXProcessContext* contexts[] = {buffer.Context(effect, &transport)};
      bundle.Information().processCallback(contexts, contexts + 1);
      for (int32_t i = 0; i < length; ++i)
        for (size_t ch = 0; ch < 2; ++ch) output[2 * (start + static_cast<size_t>(i)) + ch] = buffer.out[ch][static_cast<size_t>(i)];
    }
    EXPECT_EQ(effect->TimerWakeup(), kSuccess);  // the latency, as the host learns it
    const size_t latency = controller.latencies.empty() ? 0 : static_cast<size_t>(controller.latencies.back());
    const Audio aax{2, 48000, std::vector<float>(output.begin() + static_cast<std::ptrdiff_t>(2 * latency), output.end())};
    const Audio cli{2, 48000, std::vector<float>(rendered.samples.begin(), rendered.samples.end() - static_cast<std::ptrdiff_t>(2 * latency))};
    EXPECT_TRUE(Same(aax, cli));
    effect->Release();
  }
}

// In this process, around a recording plug-in: what KAAXProcessCallback hands over.
TEST(AAXAdapter, ProcessCallbackDeliversTransportNotesAndMIDIOutWithoutAllocating) {
  auto* first = new KRecordingPlugin(4), *second = new KRecordingPlugin(4);
  KController controller;
  KAutomation automation;
  KAudioPluginAAXAdapter one{std::unique_ptr<KAudioPlugin>(first)}, two{std::unique_ptr<KAudioPlugin>(second)};
  EXPECT_EQ(std::pair(one.FormatName(), one.HostApplication()), std::pair(KString("AAX"), KString("ProTools")));
  EXPECT_EQ(first->SampleRate(), 44100.0);  // until the host tells its own
  for (KAudioPluginAAXAdapter* adapter : {&one, &two}) ASSERT_EQ(adapter->Initialize(&controller, &automation), kSuccess);
  EXPECT_EQ(first->SampleRate(), kRate);
  KTransportState transport;
  transport.samples = 96000;
  KBuffer a(2, 2), b(2, 2);  // stereo, as the plug-in starts
  a.midi.in = {{10, 3, {0x90, 60, 100, 0}, false}, {20, 3, {0x80, 60, 0, 0}, false}, {30, 0, {}, false}};
  KAAXProcessContext* contexts[] = {a.Context(&one, &transport), b.Context(&two, nullptr)};
  const uint8_t out[4] = {0x90, 64, 90, 0};
  {
    KAllocationCounter counter;
    one.SendMIDIEvent(7, out);
    KAAXProcessCallback(contexts, contexts + 2);
    EXPECT_EQ(counter.Count(), 0);
  }
  const KTransport& t = first->Transport();
  EXPECT_EQ(std::tuple(t.tempo, t.songPosition, t.barStart, t.samplePosition, t.numerator, t.denominator, t.cycleStart, t.cycleEnd, t.flags),
            std::tuple(120.0, 4.0, 7.5, int64_t{96000}, 6, 8, 0.0, 6.0, 1u));
  EXPECT_EQ(std::pair(second->Transport().tempo, second->Transport().samplePosition), std::pair(-1.0, KTransport::kUnknownSamplePosition));
  std::vector<std::pair<int32_t, int32_t>> notes;
  for (const KRecordingPlugin::Entry& e : first->Log()) if (e.kind == KRecordingPlugin::Entry::kNote) notes.emplace_back(e.length, e.note);
  EXPECT_EQ(notes, (std::vector<std::pair<int32_t, int32_t>>{{10, 60}, {20, 60}}));  // the empty packet is dropped
  ASSERT_EQ(a.midi.output.mBufferSize, 1u);
  EXPECT_EQ(std::tuple(a.midi.out[0].mTimestamp, a.midi.out[0].mData[1], b.midi.output.mBufferSize), std::tuple(7u, uint8_t{64}, 0u));
  // A buffer of no samples or without outputs does nothing.
  first->ClearLog();
  a.size = 0;
  KAAXProcessCallback(contexts, contexts + 1);
  EXPECT_TRUE(first->Log().empty());

  // The plug-in's way back: gestures and values on the parameter's identifier, the bypass as one
  // whole gesture, the latency at the host's timer.
  automation.posts.clear();
  one.SendAutomation(2, 0.75);
  first->SetBypassFromUser(true);
  first->ReportLatency(64);
  EXPECT_EQ(one.TimerWakeup(), kSuccess);
  using P = std::tuple<char, std::string, double>;
  EXPECT_EQ(automation.posts, (std::vector<P>{P{'t', "2", 0.0}, P{'s', "2", 0.75}, P{'t', kMasterBypassId, 0.0}, P{'s', kMasterBypassId, 1.0},
                                              P{'r', kMasterBypassId, 0.0}}));
  EXPECT_EQ(controller.latencies, std::vector<int32_t>{64});
  double value = 0.0;
  EXPECT_EQ(std::pair(one.GetParameterNormalizedValue(kMasterBypassId, &value), value), std::pair(kSuccess, 1.0));
  // The editor's size goes to the host's frame while a GUI is framed.
  KView view;
  KAAXGUI* gui = KAAXDispatchCreateGUI(&one);
  ASSERT_NE(gui, nullptr);
  EXPECT_FALSE(one.ResizeEditor(300, 200));  // not framed yet
  EXPECT_EQ(gui->Create(&view), kSuccess);
  EXPECT_TRUE(one.ResizeEditor(300, 200));
  int32_t width = 0, height = 0;
  EXPECT_EQ(gui->GetViewSize(&width, &height), kSuccess);
  EXPECT_EQ(view.sizes, (std::vector<std::pair<int32_t, int32_t>>{{300, 200}}));
  EXPECT_EQ(std::pair(width, height), std::pair(300, 200));
  gui->Release();
  EXPECT_FALSE(one.ResizeEditor(300, 200));
  // Names and values wait for nobody: with the parameter lock held elsewhere the host gets what
  // it saw last.
  std::lock_guard busy(first->ParameterLock());
  first->GetParameter(1).SetNormalized(0.9);
  EXPECT_EQ(std::pair(one.GetParameterNormalizedValue("1", &value), value), std::pair(kSuccess, first->GetParameter(1).DefaultNormalized()));
}

namespace {
// A plug-in whose own settings fail with something that is not a KException.
class KThrowingPlugin final : public KRecordingPlugin {
public:
  void StorePluginSettings(Element&, uint32_t) override { throw std::runtime_error("broken"); }
};

// A host whose objects throw from inside the calls that reach them.
struct KThrowingController final : IController {
  Result GetSampleRate(double*) const override { throw std::runtime_error("no rate"); }
  Result SetSignalLatency(int32_t) override { return kSuccess; }
};
struct KThrowingTransport final : ITransport {
  Result GetCurrentTempo(double*) const override { throw std::runtime_error("no tempo"); }
  Result GetCurrentMeter(int32_t*, int32_t*) const override { return kErrorUnimplemented; }
  Result IsTransportPlaying(bool*) const override { return kErrorUnimplemented; }
  Result GetCurrentNativeSampleLocation(int64_t*) const override { return kErrorUnimplemented; }
  Result GetCurrentTickPosition(int64_t*) const override { return kErrorUnimplemented; }
  Result GetBarStartTickPosition(int64_t*) const override { return kErrorUnimplemented; }
  Result GetCurrentLoopPosition(bool*, int64_t*, int64_t*) const override { return kErrorUnimplemented; }
  Result IsOffline(bool*) const override { return kErrorUnimplemented; }
};
}  // namespace

TEST(AAXAdapter, NoExceptionLeavesAnExportOrAHostCall) {
  KTraceCapture trace;
  auto* plugin = new KThrowingPlugin;
  KAudioPluginAAXAdapter adapter{std::unique_ptr<KAudioPlugin>(plugin)};
  KThrowingController controller;
  EXPECT_EQ(adapter.Initialize(&controller, nullptr), kErrorNotInitialized);
  EXPECT_EQ(adapter.EffectInit(), kErrorNotInitialized);  // the host's rate is asked again, and fails again
  uint32_t size = 0;
  EXPECT_EQ(adapter.GetChunkSize(KAudioPluginAAXAdapter::kStateChunk, &size), kErrorNullObject);
  KThrowingTransport transport;
  KBuffer buffer(2, 2);
  KAAXProcessContext* contexts[] = {buffer.Context(&adapter, &transport)};
  KAAXProcessCallback(contexts, contexts + 1);
  // A 'Torv' chunk that is no state is refused quietly (a KException) and changes nothing.
  KChunk broken = KChunk::Of("<TorvaneState");
  EXPECT_EQ(adapter.SetChunk(KAudioPluginAAXAdapter::kStateChunk, broken.Get()), kErrorNullObject);
  EXPECT_EQ(trace.Lines(), (std::vector<std::string>{"SYSTEM EXCEPTION! KAudioPluginAAXAdapter::EffectInit",
                                                     "SYSTEM EXCEPTION! KAudioPluginAAXAdapter::EffectInit",
                                                     "SYSTEM EXCEPTION! KAudioPluginAAXAdapter::GetChunkSize",
                                                     "SYSTEM EXCEPTION! KAudioPluginAAXAdapter::Process"}));
  // Exports with nonsense: null answers, never a throw.
  EXPECT_EQ(KAAXDispatchCreateInstance("KNoSuchPlugin", ""), nullptr);
  EXPECT_EQ(KAAXDispatchCreateInstance("", "\xff"), nullptr);
  KAAXPluginInformation information{};
  EXPECT_EQ(KAAXDispatchGetPluginInformation("KNoSuchPlugin", &information), kErrorNullObject);
  EXPECT_EQ(KAAXDispatchGetPluginInformation("KCompressorPlugin", nullptr), kErrorNullObject);
  EXPECT_EQ(ACFRegisterPlugin(nullptr, nullptr), kACFPointer);
  EXPECT_EQ(ACFGetSDKVersion(nullptr), kACFPointer);
  KAAXProcessCallback(nullptr, nullptr);
  KAAXProcessContext* none[] = {nullptr};
  KAAXProcessCallback(none, none + 1);
}
