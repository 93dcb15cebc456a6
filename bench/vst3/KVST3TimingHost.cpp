// Times the processing call of Linux VST 3 plug-ins, each as a host would drive it: the bundle's
// module opened, ModuleEntry called with its handle, the first audio processor of its factory
// created, set up for 48 kHz stereo in 64-sample blocks and fed the same stereo noise. Plug-ins
// are timed in turns, a slice of each per round, so that all meet the same clock speed and the
// same neighbours; the best round of each counts, in processor time.
//
//   torvane_vst3_timing [--seconds S] [--rounds R] <bundle.vst3>...
//
// Prints nanoseconds per stereo frame for each bundle, and how many times faster than the first
// one it ran.
#include <algorithm>
#include <ctime>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "hosts/vst3/KVST3Factory.h"
#include "hosts/vst3/KVST3Processing.h"
#include "kernel/platform/KPlatformLibrary.h"

namespace {
using namespace KVST3;

constexpr double kRate = 48000.0;
constexpr int32_t kBlock = 64;
constexpr int32_t kNoiseFrames = 1 << 16;  // a power of two, many blocks long

// A host object of one interface. Host objects live as long as the program; their reference
// counts are not kept.
template <class Face>
class KHostObject : public Face {
public:
  virtual ~KHostObject() = default;
  TResult QueryInterface(const char* iid, void** object) override {
    *object = Face::kIID.Is(iid) || FUnknown::kIID.Is(iid) ? this : nullptr;
    return *object ? kResultOk : kNoInterface;
  }
  uint32_t AddRef() override { return 1; }
  uint32_t Release() override { return 1; }
};

class KHostApplication final : public KHostObject<IHostApplication> {
public:
  TResult GetName(String128 name) override {
    const char16_t text[] = u"Torvane timing host";
    std::copy(std::begin(text), std::end(text), name);
    return kResultOk;
  }
  TResult CreateInstance(char*, char*, void** object) override {
    *object = nullptr;
    return kNotImplemented;
  }
};
KHostApplication gHost;

// A parameter's points of one block, kept as a host keeps them (without allocating).
class KPointQueue final : public KHostObject<IParamValueQueue> {
public:
  static constexpr int32_t kCapacity = 64;
  ParamID id = 0;
  int32_t count = 0;

  ParamID GetParameterId() override { return id; }
  int32_t GetPointCount() override { return count; }
  TResult GetPoint(int32_t index, int32_t& sampleOffset, ParamValue& value) override {
    if (index < 0 || index >= count) return kInvalidArgument;
    sampleOffset = offsets_[index], value = values_[index];
    return kResultOk;
  }
  TResult AddPoint(int32_t sampleOffset, ParamValue value, int32_t& index) override {
    if (count == kCapacity) return kResultFalse;
    offsets_[count] = sampleOffset, values_[count] = value;
    index = count++;
    return kResultOk;
  }

private:
  int32_t offsets_[kCapacity] = {};
  ParamValue values_[kCapacity] = {};
};

// The parameter changes of one block: none come in; what a plug-in sends out (its meters, say)
// is taken and dropped before the next block, as a host would read and forget it.
class KParameterChanges final : public KHostObject<IParameterChanges> {
public:
  static constexpr int32_t kCapacity = 256;
  void Clear() noexcept { count_ = 0; }

  int32_t GetParameterCount() override { return count_; }
  IParamValueQueue* GetParameterData(int32_t index) override { return index >= 0 && index < count_ ? &queues_[index] : nullptr; }
  IParamValueQueue* AddParameterData(const ParamID& id, int32_t& index) override {
    for (index = 0; index < count_; ++index)
      if (queues_[index].id == id) return &queues_[index];
    if (count_ == kCapacity) return nullptr;
    queues_[count_].id = id, queues_[count_].count = 0;
    return &queues_[index = count_++];
  }

private:
  KPointQueue queues_[kCapacity];
  int32_t count_ = 0;
};

// An event list that stays empty: no MIDI comes in, and what goes out is dropped.
class KEventList final : public KHostObject<IEventList> {
public:
  int32_t GetEventCount() override { return 0; }
  TResult GetEvent(int32_t, Event&) override { return kInvalidArgument; }
  TResult AddEvent(Event&) override { return kResultOk; }
};

// Uniform noise in ±0.5, the same for every plug-in (a fixed xorshift sequence).
std::vector<float> Noise(uint32_t seed) {
  std::vector<float> samples(kNoiseFrames);
  for (float& s : samples) {
    seed ^= seed << 13, seed ^= seed >> 17, seed ^= seed << 5;
    s = static_cast<float>(seed) / 4294967296.0f - 0.5f;
  }
  return samples;
}

// Stops the program with a message.
[[noreturn]] void Fail(const std::string& bundle, const std::string& what) {
  std::fprintf(stderr, "%s: %s\n", bundle.c_str(), what.c_str());
  std::exit(1);
}

// One plug-in, loaded and set up, ready to process.
class KTimedPlugin {
public:
  explicit KTimedPlugin(const std::string& bundle) : bundle_(bundle) {
    const std::filesystem::path folder = std::filesystem::path(bundle) / "Contents" / "x86_64-linux";
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator(folder, error))
      if (entry.path().extension() == ".so" && entry.path().stem() == std::filesystem::path(bundle).stem()) module_ = entry.path();
    if (module_.empty()) Fail(bundle, "no module named after the bundle in " + folder.string());
    library_ = KPlatform::OpenLibrary(module_.string());
    if (!library_) Fail(bundle, KPlatform::LibraryError());
    if (auto entry = reinterpret_cast<ModuleEntryFunction>(KPlatform::FindSymbol(library_, "ModuleEntry")); entry && !entry(library_))
      Fail(bundle, "ModuleEntry failed");
    const auto getFactory = reinterpret_cast<GetPluginFactoryFunction>(KPlatform::FindSymbol(library_, "GetPluginFactory"));
    IPluginFactory* factory = getFactory ? getFactory() : nullptr;
    if (!factory) Fail(bundle, "no plug-in factory");
    for (int32_t i = 0; i < factory->CountClasses() && !component_; ++i) {
      PClassInfo info{};
      if (factory->GetClassInfo(i, &info) != kResultOk || std::string(info.category) != kAudioModuleClass) continue;
      void* object = nullptr;
      if (factory->CreateInstance(info.cid, IComponent::kIID.bytes, &object) == kResultOk) component_ = static_cast<IComponent*>(object);
    }
    factory->Release();
    if (!component_ || component_->Initialize(&gHost) != kResultOk) Fail(bundle, "no audio processor could be created");
    void* object = nullptr;
    if (component_->QueryInterface(IAudioProcessor::kIID.bytes, &object) != kResultOk) Fail(bundle, "no IAudioProcessor");
    processor_ = static_cast<IAudioProcessor*>(object);
    SetUp();
  }

  ~KTimedPlugin() {
    processor_->SetProcessing(false);
    component_->SetActive(false);
    processor_->Release();
    component_->Terminate();
    component_->Release();
    if (auto exit = reinterpret_cast<ModuleExitFunction>(KPlatform::FindSymbol(library_, "ModuleExit"))) exit();
    KPlatform::CloseLibrary(library_);
  }

  const std::string& Bundle() const noexcept { return bundle_; }

  // Processes `blocks` blocks of the noise, starting at block `first`; answers the processor
  // seconds taken (the program's own, so that other programs sharing the machine do not count).
  double Run(const std::vector<float>& left, const std::vector<float>& right, int64_t first, int64_t blocks) {
    const std::clock_t start = std::clock();
    for (int64_t k = first; k < first + blocks; ++k) {
      const auto at = static_cast<size_t>(k * kBlock % kNoiseFrames);
      std::copy_n(left.data() + at, kBlock, in_[0].data());
      std::copy_n(right.data() + at, kBlock, in_[1].data());
      outputChanges_.Clear();
      processor_->Process(data_);
    }
    return static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC;
  }

private:
  // Stereo on every audio bus, the main buses active, 32-bit samples, realtime processing.
  void SetUp() {
    const int32_t inputs = component_->GetBusCount(kAudio, kInput);
    const int32_t outputs = component_->GetBusCount(kAudio, kOutput);
    std::vector<SpeakerArrangement> in(static_cast<size_t>(inputs), SpeakerArrangements::kStereo);
    std::vector<SpeakerArrangement> out(static_cast<size_t>(outputs), SpeakerArrangements::kStereo);
    processor_->SetBusArrangements(in.data(), inputs, out.data(), outputs);
    if (inputs > 0) component_->ActivateBus(kAudio, kInput, 0, true);
    if (outputs > 0) component_->ActivateBus(kAudio, kOutput, 0, true);
    ProcessSetup setup{kRealtime, kSample32, kBlock, kRate};
    if (processor_->SetupProcessing(setup) != kResultOk) Fail(bundle_, "setupProcessing refused 48 kHz stereo");
    component_->SetActive(true);
    processor_->SetProcessing(true);

    // The main input carries the noise; any further bus (a side-chain) is silent, every output
    // has its own buffers.
    for (auto& channel : in_) channel.assign(kBlock, 0.0f);
    for (auto& channel : silence_) channel.assign(kBlock, 0.0f);
    for (auto& channel : out_) channel.assign(static_cast<size_t>(2 * std::max(outputs, 1)) * kBlock, 0.0f);
    mainIn_[0] = in_[0].data(), mainIn_[1] = in_[1].data();
    silent_[0] = silence_[0].data(), silent_[1] = silence_[1].data();
    for (int32_t b = 0; b < inputs; ++b) inputBuses_.push_back({2, 0, {b == 0 ? mainIn_ : silent_}});
    for (int32_t b = 0; b < outputs; ++b) {
      outputChannels_.push_back(std::make_unique<float*[]>(2));
      for (size_t c = 0; c < 2; ++c) outputChannels_.back()[c] = out_[c].data() + static_cast<size_t>(b) * kBlock;
      outputBuses_.push_back({2, 0, {outputChannels_.back().get()}});
    }
    data_ = ProcessData{kRealtime, kSample32, kBlock, inputs, outputs, inputBuses_.data(), outputBuses_.data(),
                        &inputChanges_, &outputChanges_, &inputEvents_, &outputEvents_, &context_};
    context_.sampleRate = kRate;  // a stopped transport: only the rate is valid
  }

  std::string bundle_;
  std::filesystem::path module_;
  void* library_ = nullptr;
  IComponent* component_ = nullptr;
  IAudioProcessor* processor_ = nullptr;
  std::vector<float> in_[2], silence_[2], out_[2];
  float* mainIn_[2] = {};
  float* silent_[2] = {};
  std::vector<std::unique_ptr<float*[]>> outputChannels_;
  std::vector<AudioBusBuffers> inputBuses_, outputBuses_;
  KParameterChanges inputChanges_, outputChanges_;
  KEventList inputEvents_, outputEvents_;
  ProcessContext context_{};
  ProcessData data_{};
};

}  // namespace

int main(int argc, char** argv) {
  double seconds = 60.0;  // of audio per plug-in and round
  int32_t rounds = 5;
  std::vector<std::string> bundles;
  for (int i = 1; i < argc; ++i) {
    const std::string arg = argv[i];
    if (arg == "--seconds" && i + 1 < argc) seconds = std::atof(argv[++i]);
    else if (arg == "--rounds" && i + 1 < argc) rounds = std::atoi(argv[++i]);
    else bundles.push_back(arg);
  }
  if (bundles.empty() || !(seconds > 0.0) || rounds < 1) {
    std::fprintf(stderr, "usage: %s [--seconds S] [--rounds R] <bundle.vst3>...\n", argv[0]);
    return 2;
  }
  std::vector<std::unique_ptr<KTimedPlugin>> plugins;
  for (const std::string& bundle : bundles) plugins.push_back(std::make_unique<KTimedPlugin>(bundle));

  const std::vector<float> left = Noise(0x9E3779B9u), right = Noise(0x7F4A7C15u);
  const auto blocks = static_cast<int64_t>(seconds * kRate / kBlock);
  std::vector<double> best(plugins.size(), 1e300);
  for (auto& plugin : plugins) plugin->Run(left, right, 0, blocks / 10);  // warm caches and detectors
  for (int32_t round = 0; round < rounds; ++round)
    for (size_t p = 0; p < plugins.size(); ++p) best[p] = std::min(best[p], plugins[p]->Run(left, right, round * blocks, blocks));

  const double frames = static_cast<double>(blocks * kBlock);
  std::printf("%-60s %14s %8s\n", "bundle (48 kHz stereo noise, 64-sample blocks)", "ns per frame", "ratio");
  for (size_t p = 0; p < plugins.size(); ++p)
    std::printf("%-60s %14.2f %8.2f\n", plugins[p]->Bundle().c_str(), best[p] / frames * 1e9, best[0] / best[p]);
  return 0;
}
