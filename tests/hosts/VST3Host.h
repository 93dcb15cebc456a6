#pragma once
// A small VST 3 host for the tests: its objects, bundles loaded as a host loads them, instances.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <deque>
#include <map>

#include "hosts/vst3/KVST3Controller.h"
#include "hosts/vst3/KVST3Factory.h"
#include "kernel/platform/KPlatformLibrary.h"

namespace KVST3Test {
using namespace KVST3;
constexpr int32_t kBlock = 512;
using Points = std::vector<std::pair<int32_t, double>>;

// Host objects live on the test's stack; their reference counts are not kept.
template <class... Faces>
struct KHostObject : Faces... {
  virtual ~KHostObject() = default;
  TResult QueryInterface(const char* iid, void** object) override {
    *object = nullptr;
    ((*object = *object ? *object : (Faces::kIID.Is(iid) || FUnknown::kIID.Is(iid) ? static_cast<Faces*>(this) : nullptr)), ...);
    return *object ? kResultOk : kNoInterface;
  }
  uint32_t AddRef() override { return 1; }
  uint32_t Release() override { return 1; }
};

struct KStream final : KHostObject<IBStream> {
  std::string bytes;  // read from `at` on; every write appends
  size_t at = 0, writes = 0;
  TResult Read(void* to, int32_t n, int32_t* got) override {
    std::memcpy(to, bytes.data() + at, static_cast<size_t>(*got = static_cast<int32_t>(std::min(static_cast<size_t>(n), bytes.size() - at))));
    return at += static_cast<size_t>(*got), kResultOk;
  }
  TResult Write(void* from, int32_t n, int32_t* put) override { return bytes.append(static_cast<char*>(from), static_cast<size_t>(*put = n)), ++writes, kResultOk; }
  TResult Seek(int64_t, int32_t, int64_t*) override { return kNotImplemented; }  // a host's stream may refuse to seek
  TResult Tell(int64_t* position) override { return *position = static_cast<int64_t>(at), kResultOk; }
};

struct KQueue final : KHostObject<IParamValueQueue> {
  ParamID id; Points points;
  KQueue(ParamID queueId, Points queuePoints) : id(queueId), points(std::move(queuePoints)) {}
  ParamID GetParameterId() override { return id; }
  int32_t GetPointCount() override { return static_cast<int32_t>(points.size()); }
  TResult GetPoint(int32_t i, int32_t& at, double& value) override { return std::tie(at, value) = points.at(static_cast<size_t>(i)), kResultOk; }
  TResult AddPoint(int32_t at, double value, int32_t& i) override { return i = GetPointCount(), points.emplace_back(at, value), kResultOk; }
};

struct KChanges final : KHostObject<IParameterChanges> {
  std::deque<KQueue> queues;
  int32_t GetParameterCount() override { return static_cast<int32_t>(queues.size()); }
  IParamValueQueue* GetParameterData(int32_t i) override { return &queues.at(static_cast<size_t>(i)); }
  IParamValueQueue* AddParameterData(const ParamID& id, int32_t& i) override { return i = GetParameterCount(), &queues.emplace_back(id, Points{}); }
};

struct KEvents final : KHostObject<IEventList> {
  std::vector<Event> list;
  int32_t GetEventCount() override { return static_cast<int32_t>(list.size()); }
  TResult GetEvent(int32_t i, Event& event) override { return event = list.at(static_cast<size_t>(i)), kResultOk; }
  TResult AddEvent(Event& event) override { return list.push_back(event), kResultOk; }
};

struct KHost final : KHostObject<IHostApplication, IComponentHandler, IUnitHandler> {  // keeps edits, restart requests, list notices
  std::vector<int32_t> restarts;
  std::vector<std::pair<int32_t, int32_t>> programListChanges;  // list id, program index
  std::vector<std::tuple<char, ParamID, double>> edits;  // 'b'egin, 'p'erform with its value, 'e'nd
  TResult GetName(String128 name) override { return std::copy_n(u"Test host", 10, name), kResultOk; }
  TResult CreateInstance(char*, char*, void**) override { return kNotImplemented; }
  TResult BeginEdit(ParamID id) override { return edits.emplace_back('b', id, 0.0), kResultOk; }
  TResult PerformEdit(ParamID id, double value) override { return edits.emplace_back('p', id, value), kResultOk; }
  TResult EndEdit(ParamID id) override { return edits.emplace_back('e', id, 0.0), kResultOk; }
  TResult RestartComponent(int32_t flags) override { return restarts.push_back(flags), kResultOk; }
  TResult NotifyUnitSelection(int32_t) override { return kResultOk; }
  TResult NotifyProgramListChange(int32_t list, int32_t program) override { return programListChanges.emplace_back(list, program), kResultOk; }
};

struct KAttributes final : KHostObject<IAttributeList> {  // texts and integers; a text must fit whole
  std::map<std::string, std::u16string> texts; std::map<std::string, int64_t> numbers;
  TResult SetInt(AttrID id, int64_t value) override { return numbers[id] = value, kResultTrue; }
  TResult GetInt(AttrID id, int64_t& value) override { return numbers.contains(id) ? (value = numbers[id], kResultTrue) : kResultFalse; }
  TResult SetFloat(AttrID, double) override { return kNotImplemented; }
  TResult GetFloat(AttrID, double&) override { return kResultFalse; }
  TResult SetString(AttrID id, const TChar* text) override { return texts[id] = text, kResultTrue; }
  TResult GetString(AttrID id, TChar* text, uint32_t bytes) override {
    const auto found = texts.find(id);
    return found == texts.end() || found->second.size() >= bytes / 2 ? kResultFalse : (std::copy_n(found->second.c_str(), found->second.size() + 1, text), kResultTrue);
  }
  TResult SetBinary(AttrID, const void*, uint32_t) override { return kNotImplemented; }
  TResult GetBinary(AttrID, const void*&, uint32_t&) override { return kResultFalse; }
};

struct KBlock {  // one processing call: stereo buses (inputs carry sines), queues, events
  std::vector<std::vector<float>> planes; std::vector<float*> channels; std::vector<AudioBusBuffers> buses;
  KChanges changes; KEvents events, produced; ProcessContext context{}; ProcessData data{};
  KBlock(int32_t inputs, int32_t outputs) : planes(static_cast<size_t>(2 * (inputs + outputs)), std::vector<float>(kBlock)) {
    for (size_t c = 0; c < planes.size(); channels.push_back(planes[c++].data()))
      for (size_t i = 0; c < static_cast<size_t>(2 * inputs) && i < kBlock; ++i) planes[c][i] = 0.5f * std::sin(0.01f * static_cast<float>(i * (c + 1)));
    for (int32_t b = 0; b < inputs + outputs; ++b) buses.push_back({2, 0, {channels.data() + 2 * b}});
    data = {kRealtime, kSample32, kBlock, inputs, outputs, buses.data(), buses.data() + inputs, &changes, nullptr, &events, &produced, &context};
  }
  void Change(ParamID id, Points points) { changes.queues.emplace_back(id, std::move(points)); }
  const std::vector<float>& Out(int32_t c) const { return planes[static_cast<size_t>(2 * data.numInputs + c)]; }
};

template <class Face>  // the interface `Face` of an object (a new reference), or null
Face* Query(FUnknown* object) {
  void* face = nullptr;
  return object && object->QueryInterface(Face::kIID.bytes, &face) == kResultOk ? static_cast<Face*>(face) : nullptr;
}

struct KInstance {  // as a host holds it: the component and its processor and controller faces
  IComponent* component;
  IAudioProcessor* processor = Query<IAudioProcessor>(component);
  IEditController* controller = Query<IEditController>(component);
  explicit KInstance(FUnknown* object) : component(static_cast<IComponent*>(object)) { EXPECT_TRUE(processor && controller); }
  ~KInstance() { for (FUnknown* face : {static_cast<FUnknown*>(controller), static_cast<FUnknown*>(processor), static_cast<FUnknown*>(component)}) if (face) face->Release(); }
  void Start(KHost& host) {  // initialised, stereo on every bus, 48 kHz, active and processing
    ASSERT_EQ(component->Initialize(static_cast<IHostApplication*>(&host)) | controller->SetComponentHandler(&host), kResultOk);
    const int32_t ins = component->GetBusCount(kAudio, kInput), outs = component->GetBusCount(kAudio, kOutput);
    std::vector<SpeakerArrangement> in(static_cast<size_t>(ins), 3), out(static_cast<size_t>(outs), 3);
    ProcessSetup setup{kRealtime, kSample32, kBlock, 48000.0};
    ASSERT_EQ(processor->SetBusArrangements(in.data(), ins, out.data(), outs), kResultTrue);
    ASSERT_EQ(processor->SetupProcessing(setup) | component->SetActive(1) | processor->SetProcessing(1), kResultOk);
  }
  void Stop() { EXPECT_EQ(processor->SetProcessing(0) | component->SetActive(0) | component->Terminate(), kResultOk); }
  std::string State() {  // which arrives in one write
    KStream stream;
    EXPECT_EQ((std::pair{component->GetState(&stream), stream.writes}), std::pair(kResultOk, size_t{1}));
    return stream.bytes;
  }
  std::u16string Text(ParamID id, double normalized) {
    String128 text = {};
    EXPECT_EQ(controller->GetParamStringByValue(id, normalized, text), kResultOk) << id;
    return text;
  }
};

// A bundle's files: its module (named as the bundle on Windows) and the kernel beside it.
inline std::string BundleBinaries(const std::string& name) { return TORVANE_VST3_DIR "/" + name + ".vst3/Contents/" TORVANE_VST3_ARCH "/"; }
#if defined(_WIN32)
inline constexpr const char* kModuleSuffix = ".vst3";
inline constexpr const char* kKernelFile = "torvane.dll";
#else
inline constexpr const char* kModuleSuffix = ".so";
inline constexpr const char* kKernelFile = "libtorvane.so";
#endif

// The module's first and last calls, by the names the system's hosts use (null when missing).
inline bool EnterModule(void* library) {
#if defined(_WIN32)
  const auto entry = reinterpret_cast<ModuleExitFunction>(KPlatform::FindSymbol(library, "InitDll"));
  return entry && entry();
#else
  const auto entry = reinterpret_cast<ModuleEntryFunction>(KPlatform::FindSymbol(library, "ModuleEntry"));
  return entry && entry(library);
#endif
}
inline bool ExitModule(void* library) {
#if defined(_WIN32)
  const auto exit = reinterpret_cast<ModuleExitFunction>(KPlatform::FindSymbol(library, "ExitDll"));
#else
  const auto exit = reinterpret_cast<ModuleExitFunction>(KPlatform::FindSymbol(library, "ModuleExit"));
#endif
  return exit && exit();
}

// A bundle loaded as a host loads it (module, ModuleEntry with its handle, factory), and unloaded.
// A bundle that is missing or broken fails the test; the factory is then null.
struct KBundle {
  void* library; IPluginFactory* factory = nullptr;
  explicit KBundle(const std::string& name) : library(KPlatform::OpenLibrary(BundleBinaries(name) + name + kModuleSuffix)) {
    const auto get = reinterpret_cast<GetPluginFactoryFunction>(KPlatform::FindSymbol(library, "GetPluginFactory"));
    const bool entered = library && EnterModule(library);
    EXPECT_TRUE(entered && get) << name << ": " << KPlatform::LibraryError();
    factory = get && entered ? get() : nullptr;
  }
  ~KBundle() {
    if (factory) factory->Release();
    if (!library) return;
    EXPECT_TRUE(ExitModule(library));
    KPlatform::CloseLibrary(library);
  }
  FUnknown* Create() {
    PClassInfo info{}; void* object = nullptr;
    EXPECT_EQ(factory->GetClassInfo(0, &info) | factory->CreateInstance(info.cid, IComponent::kIID.bytes, &object), kResultOk);
    return static_cast<IComponent*>(object);
  }
};
}  // namespace KVST3Test
