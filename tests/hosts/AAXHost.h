#pragma once
// A small AAX host for the tests: its objects, a bundle loaded and registered as a host does it,
// effects made, initialised and run only through what registration hands over.
#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <tuple>
#include <vector>

#include "hosts/aax/KAAXEffectParameters.h"
#include "hosts/aax/KAAXGUI.h"
#include "hosts/aax/KAAXPluginInformation.h"
#include "kernel/platform/KPlatformLibrary.h"

namespace KAAXTest {
using namespace KAAX;
constexpr int32_t kBlock = 512;
constexpr double kRate = 48000.0;

struct KController final : IController {
  double rate = kRate;
  std::vector<int32_t> latencies;
  Result GetSampleRate(double* sampleRate) const override { return *sampleRate = rate, kSuccess; }
  Result SetSignalLatency(int32_t samples) override { return latencies.push_back(samples), kSuccess; }
};

struct KAutomation final : IAutomationDelegate {  // 't'ouch, 's'et with its value, 'r'elease
  std::vector<std::tuple<char, std::string, double>> posts;
  Result PostTouchRequest(ParamId id) override { return posts.emplace_back('t', id, 0.0), kSuccess; }
  Result PostSetValueRequest(ParamId id, double value) override { return posts.emplace_back('s', id, value), kSuccess; }
  Result PostReleaseRequest(ParamId id) override { return posts.emplace_back('r', id, 0.0), kSuccess; }
};

// Playing at 120 bpm in 6/8, looping bars 1 to 3; positions advance with Advance.
struct KTransportState final : ITransport {
  double tempo = 120.0;
  int32_t numerator = 6, denominator = 8;
  bool playing = true, offline = false, looping = true;
  int64_t samples = 0;
  double bar = 7.4;  // quarter notes; 6/8 snaps it to halves
  Result GetCurrentTempo(double* t) const override { return *t = tempo, kSuccess; }
  Result GetCurrentMeter(int32_t* n, int32_t* d) const override { return *n = numerator, *d = denominator, kSuccess; }
  Result IsTransportPlaying(bool* p) const override { return *p = playing, kSuccess; }
  Result GetCurrentNativeSampleLocation(int64_t* s) const override { return *s = samples, kSuccess; }
  Result GetCurrentTickPosition(int64_t* ticks) const override { return *ticks = Ticks(Quarters()), kSuccess; }
  Result GetBarStartTickPosition(int64_t* ticks) const override { return *ticks = Ticks(bar), kSuccess; }
  Result GetCurrentLoopPosition(bool* l, int64_t* start, int64_t* end) const override { return *l = looping, *start = Ticks(0.0), *end = Ticks(6.0), kSuccess; }
  Result IsOffline(bool* o) const override { return *o = offline, kSuccess; }
  double Quarters() const { return static_cast<double>(samples) * tempo / 60.0 / kRate; }
  static int64_t Ticks(double quarters) { return std::llround(quarters * kTicksPerQuarter); }
};

struct KView final : IViewContainer {
  int32_t type = kViewContainerNull;
  void* window = nullptr;
  std::vector<std::pair<int32_t, int32_t>> sizes;
  int32_t GetType() override { return type; }
  void* GetPtr() override { return window; }
  Result SetViewSize(int32_t width, int32_t height) override { return sizes.emplace_back(width, height), kSuccess; }
};

// The MIDI nodes of one buffer: notes in, room for the plug-in's messages out.
struct KMidi {
  std::vector<MidiPacket> in, out = std::vector<MidiPacket>(64);
  MidiStream input{0, 0, nullptr}, output{0, 64, nullptr};
  void Ready() { input = {static_cast<uint32_t>(in.size()), static_cast<uint32_t>(in.size()), in.data()}, output.mBuffer = out.data(); }
};

// One buffer of an instance: stereo planes for its inputs and outputs.
struct KBuffer {
  std::vector<std::vector<float>> in, out;
  std::vector<const float*> inputs; std::vector<float*> outputs;
  int32_t size;
  KMidi midi;
  KAAXProcessContext context{};
  KBuffer(int32_t inputChannels, int32_t outputChannels, int32_t samples = kBlock)
      : in(static_cast<size_t>(inputChannels), std::vector<float>(static_cast<size_t>(samples))),
        out(static_cast<size_t>(outputChannels), std::vector<float>(static_cast<size_t>(samples))), size(samples) {
    for (auto& plane : in) inputs.push_back(plane.data());
    for (auto& plane : out) outputs.push_back(plane.data());
  }
  KAAXProcessContext* Context(KEffectParameters* effect, const ITransport* transport) {
    midi.Ready();
    context = {inputs.empty() ? nullptr : inputs.data(), outputs.data(), &size, &midi.input, &midi.output, transport,
               reinterpret_cast<KAudioPluginAAXAdapter*>(effect)};  // the host's instance pointer, as created
    return &context;
  }
};

// A chunk as a host holds one: header and data.
struct KChunk {
  std::vector<char> bytes;
  PluginChunk* Get() { return reinterpret_cast<PluginChunk*>(bytes.data()); }
  std::string Data() { return std::string(Get()->fData, static_cast<size_t>(Get()->fSize)); }
  static KChunk Of(const std::string& data) {
    KChunk chunk{std::vector<char>(kChunkHeaderSize + data.size() + 1)};
    chunk.Get()->fSize = static_cast<int32_t>(data.size());
    std::copy(data.begin(), data.end(), chunk.Get()->fData);
    return chunk;
  }
};

inline KChunk GetChunk(KEffectParameters& effect, ChunkId id) {  // sized first, as a host does
  uint32_t size = 0;
  EXPECT_EQ(effect.GetChunkSize(id, &size), kSuccess);
  KChunk chunk = KChunk::Of(std::string(size, '\0'));
  EXPECT_EQ(effect.GetChunk(id, chunk.Get()), kSuccess);
  return chunk;
}

using ACFEntry = ACFResult (*)(IACFUnknown*);
// The loader's file name ends as the bundle's on Windows.
#if defined(_WIN32)
inline constexpr const char* kLoaderSuffix = ".aaxplugin";
#else
inline constexpr const char* kLoaderSuffix = ".so";
#endif

// A bundle's loader opened, started and registered as an AAX host does; shut down and unloaded.
struct KBundle {
  void* library;
  IACFPluginDefinition* definition = nullptr;
  template <class Function>
  Function Entry(const char* name) { return reinterpret_cast<Function>(KPlatform::FindSymbol(library, name)); }
  explicit KBundle(const std::string& name)
      : library(KPlatform::OpenLibrary(TORVANE_AAX_DIR "/" + name + ".aaxplugin/Contents/" TORVANE_AAX_ARCH "/" + name + kLoaderSuffix)) {
    EXPECT_NE(library, nullptr) << KPlatform::LibraryError();
    uint64_t version = 0;
    EXPECT_EQ(Entry<ACFEntry>("ACFStartup")(nullptr), kACFOk);
    EXPECT_EQ(Entry<ACFResult (*)(uint64_t*)>("ACFGetSDKVersion")(&version), kACFOk);
    EXPECT_EQ(version, kSDKVersion);
    EXPECT_EQ(Entry<ACFResult (*)(IACFUnknown*, IACFPluginDefinition**)>("ACFRegisterPlugin")(nullptr, &definition), kACFOk);
  }
  ~KBundle() {
    if (definition) definition->Release();
    EXPECT_EQ(Entry<ACFEntry>("ACFCanUnloadNow")(nullptr), kACFOk);
    EXPECT_EQ(Entry<ACFEntry>("ACFShutdown")(nullptr), kACFOk);
    KPlatform::CloseLibrary(library);
  }
  const KAAXPluginInformation& Information() { return *definition->At(0); }
  // An effect made and initialised through the registration's entries.
  KEffectParameters* Create(KController& controller, KAutomation& automation) {
    KEffectParameters* effect = Information().createInstance(Information().key, "");
    EXPECT_NE(effect, nullptr);
    if (effect) {
      EXPECT_EQ(effect->Initialize(&controller, &automation), kSuccess);
    }
    return effect;
  }
};

inline std::string Name(const KEffectParameters& effect, ParamId id, int32_t length) {
  std::vector<char> name(static_cast<size_t>(length) + 1, '#');
  EXPECT_EQ(effect.GetParameterNameOfLength(id, name.data(), length), kSuccess) << id << " " << length;
  return name.data();
}

inline std::string Text(const KEffectParameters& effect, ParamId id, double normalized) {
  char text[64] = {};
  EXPECT_EQ(effect.GetParameterStringFromValue(id, normalized, text, sizeof text), kSuccess) << id;
  return text;
}
}  // namespace KAAXTest
