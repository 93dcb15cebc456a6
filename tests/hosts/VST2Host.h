#pragma once
// A small VST 2 host for the tests: its callback, modules loaded as a host loads them, instances
// driven only through the AEffect record.
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <string>
#include <tuple>
#include <vector>

#include "hosts/vst2/KVST2Interface.h"
#include "kernel/platform/KPlatformLibrary.h"

namespace KVST2Test {
using namespace KVST2;

// What the host answers and what it was told. One host at a time answers the callback.
struct KHost {
  int32_t version = kVstVersion;
  int32_t processLevel = kVstProcessLevelRealtime;
  bool giveTime = true;
  VstTimeInfo time{};
  int32_t askedFilter = 0;
  std::vector<std::tuple<char, int32_t, float>> edits;  // 'b'egin, 'a'utomate with its value, 'e'nd
  std::vector<VstMidiEvent> midi;                       // what the plug-in sent
  int32_t ioChanges = 0, displayUpdates = 0;
  std::vector<std::pair<int32_t, int32_t>> windowSizes;  // what sizeWindow asked for
  bool acceptWindowSize = false;
  std::function<void()> whileSizing;                      // run inside sizeWindow

  static inline KHost* current = nullptr;
  KHost() { current = this; }
  ~KHost() { current = nullptr; }

  static intptr_t Callback(AEffect*, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt) {
    KHost& host = *current;
    switch (opcode) {
      case audioMasterVersion: return host.version;
      case audioMasterGetProductString: return std::strcpy(static_cast<char*>(ptr), "Test host"), 1;
      case audioMasterGetCurrentProcessLevel: return host.processLevel;
      case audioMasterGetTime: return host.askedFilter = static_cast<int32_t>(value), host.giveTime ? reinterpret_cast<intptr_t>(&host.time) : 0;
      case audioMasterBeginEdit: return host.edits.emplace_back('b', index, 0.0f), 1;
      case audioMasterAutomate: return host.edits.emplace_back('a', index, opt), 1;
      case audioMasterEndEdit: return host.edits.emplace_back('e', index, 0.0f), 1;
      case audioMasterIOChanged: return ++host.ioChanges, 1;
      case audioMasterUpdateDisplay: return ++host.displayUpdates, 1;
      case audioMasterSizeWindow:
        host.windowSizes.emplace_back(index, static_cast<int32_t>(value));
        if (host.whileSizing) host.whileSizing();
        return host.acceptWindowSize ? 1 : 0;
      case audioMasterProcessEvents: {
        const auto* events = static_cast<const VstEvents*>(ptr);
        for (int32_t i = 0; i < events->numEvents; ++i) host.midi.push_back(*reinterpret_cast<const VstMidiEvent*>(events->events[i]));
        return 1;
      }
      default: return 0;
    }
  }
};

// One instance as a host holds it: only the record and its dispatcher.
struct KInstance {
  AEffect* effect;
  explicit KInstance(AEffect* made) : effect(made) { EXPECT_TRUE(effect && effect->magic == kEffectMagic); }
  ~KInstance() { if (effect) Call(effClose); }
  intptr_t Call(int32_t opcode, int32_t index = 0, intptr_t value = 0, void* ptr = nullptr, float opt = 0.0f) {
    return effect->dispatcher(effect, opcode, index, value, ptr, opt);
  }
  void Start(float rate = 48000.0f, int32_t block = 512) {
    Call(effOpen);
    Call(effSetSampleRate, 0, 0, nullptr, rate);
    Call(effSetBlockSize, 0, block);
    Call(effMainsChanged, 0, 1);
  }
  std::string Text(int32_t opcode, int32_t index = 0) {
    char text[256] = {};
    Call(opcode, index, 0, text);
    return text;
  }
  std::string Chunk() {
    void* data = nullptr;
    const auto size = Call(effGetChunk, 0, 0, &data);
    return data ? std::string(static_cast<const char*>(data), static_cast<size_t>(size)) : std::string();
  }
  intptr_t SetChunk(std::string text) { return Call(effSetChunk, 0, static_cast<intptr_t>(text.size()), text.data()); }
  intptr_t CanDo(const char* text) { return Call(effCanDo, 0, 0, const_cast<char*>(text)); }
  void Process(std::vector<float*>& inputs, std::vector<float*>& outputs, int32_t frames) {
    effect->processReplacing(effect, inputs.data(), outputs.data(), frames);
  }
};

// A module's file: <Name>.dll on Windows, <Name>.so on Linux.
#if defined(_WIN32)
inline constexpr const char* kVST2ModuleSuffix = ".dll";
#else
inline constexpr const char* kVST2ModuleSuffix = ".so";
#endif

// A module loaded as a host loads it, and unloaded.
struct KModuleFile {
  void* library;
  MainFunction main = nullptr, legacyMain = nullptr;
  explicit KModuleFile(const std::string& name) : library(KPlatform::OpenLibrary(TORVANE_VST2_DIR "/" + name + kVST2ModuleSuffix)) {
    main = reinterpret_cast<MainFunction>(KPlatform::FindSymbol(library, "VSTPluginMain"));
    legacyMain = reinterpret_cast<MainFunction>(KPlatform::FindSymbol(library, "main"));
    EXPECT_TRUE(library && main && legacyMain) << KPlatform::LibraryError();
  }
  ~KModuleFile() { KPlatform::CloseLibrary(library); }
  AEffect* Create(HostCallback callback = &KHost::Callback) { return main(callback); }
};

// Planar float channels for a block.
struct KBuffers {
  std::vector<std::vector<float>> planes;
  std::vector<float*> pointers;
  KBuffers(int32_t channels, int32_t frames) : planes(static_cast<size_t>(channels), std::vector<float>(static_cast<size_t>(frames))) {
    for (auto& plane : planes) pointers.push_back(plane.data());
  }
};

// A MIDI event as a host sends it.
inline VstMidiEvent Midi(int32_t deltaFrames, uint8_t status, uint8_t data1, uint8_t data2) {
  VstMidiEvent event{kVstMidiType, static_cast<int32_t>(sizeof(VstMidiEvent)), deltaFrames, 0, 0, 0, {}, 0, 0, 0, 0};
  event.midiData[0] = static_cast<char>(status), event.midiData[1] = static_cast<char>(data1), event.midiData[2] = static_cast<char>(data2);
  return event;
}
}  // namespace KVST2Test
