#pragma once
// A small LV2 host for the tests: a URID map, an instance with a buffer for every port, and the
// state extension driven as a host drives it.
#include <gtest/gtest.h>

#include <lv2/core/lv2.h>
#include <lv2/state/state.h>
#include <lv2/urid/urid.h>

#include <cmath>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/lv2/KLV2Dispatch.h"
#include "kernel/KPluginIdentifiers.h"
#include "hosts/lv2/KLV2Ports.h"

namespace KLV2Test {
using KLV2::KPort;

struct KURIDMap {
  std::vector<std::string> uris;
  LV2_URID_Map map{this, [](LV2_URID_Map_Handle self, const char* uri) -> LV2_URID {
                     auto& known = static_cast<KURIDMap*>(self)->uris;
                     for (size_t i = 0; i < known.size(); ++i)
                       if (known[i] == uri) return static_cast<LV2_URID>(i + 1);
                     known.emplace_back(uri);
                     return static_cast<LV2_URID>(known.size());
                   }};
  LV2_Feature feature{LV2_URID__map, &map};
  const LV2_Feature* features[2] = {&feature, nullptr};
};

// A saved state as a host keeps it: one value per key, with its type.
struct KSavedState {
  struct Value {
    std::string bytes;
    LV2_URID type;
  };
  std::map<LV2_URID, Value> values;
  static LV2_State_Status Store(LV2_State_Handle self, uint32_t key, const void* value, size_t size, uint32_t type, uint32_t) {
    static_cast<KSavedState*>(self)->values[key] = {std::string(static_cast<const char*>(value), size), type};
    return LV2_STATE_SUCCESS;
  }
  static const void* Retrieve(LV2_State_Handle self, uint32_t key, size_t* size, uint32_t* type, uint32_t* flags) {
    auto& values = static_cast<KSavedState*>(self)->values;
    const auto found = values.find(key);
    if (found == values.end()) return nullptr;
    *size = found->second.bytes.size(), *type = found->second.type, *flags = LV2_STATE_IS_POD;
    return found->second.bytes.data();
  }
};

// An instance of the plug-in `key` made through the kernel's descriptor, every port connected:
// audio inputs carry sines, controls start at their defaults.
struct KInstance {
  static constexpr uint32_t kMaxBlock = 4096;
  const LV2_Descriptor* descriptor;
  std::unique_ptr<KAudioPlugin> described;  // the plug-in the ports are laid out from
  KLV2::KPortLayout layout{*described};
  std::vector<std::vector<float>> buffers;
  LV2_Handle handle = nullptr;

  KInstance(const std::string& key, const LV2_Feature* const* features)
      : KInstance(KLV2DispatchDescriptor(KPluginIds::BundleName(key.c_str()).c_str()), key, features) {}
  // Through a descriptor a bundle's loader gave.
  KInstance(const LV2_Descriptor* made, const std::string& key, const LV2_Feature* const* features)
      : descriptor(made), described(KHostCreatePlugin(key.c_str(), "")) {
    described->SetChannelsPerBus(2);
    EXPECT_TRUE(descriptor) << key;
    handle = descriptor ? descriptor->instantiate(descriptor, 48000.0, "", features) : nullptr;
    for (int32_t p = 0; p < layout.Count(); ++p) {
      const KPort& port = layout.Ports()[p];
      buffers.emplace_back(port.kind == KPort::Kind::kMIDIIn || port.kind == KPort::Kind::kMIDIOut ? 0 : kMaxBlock);
      if (port.kind == KPort::Kind::kParameter) buffers.back()[0] = static_cast<float>(described->GetParameter(port.index).Info().defaultValue);
      for (uint32_t i = 0; port.kind == KPort::Kind::kAudioIn && i < kMaxBlock; ++i)
        buffers.back()[i] = 0.5f * std::sin(0.01f * static_cast<float>(i * static_cast<uint32_t>(port.index + 1)));
      if (handle) descriptor->connect_port(handle, static_cast<uint32_t>(p), buffers.back().empty() ? nullptr : buffers.back().data());
    }
    if (handle) descriptor->activate(handle);
  }
  ~KInstance() {
    if (handle) descriptor->deactivate(handle), descriptor->cleanup(handle);
  }
  float& Control(const char* parameterKey) {
    return buffers[static_cast<size_t>(layout.First(KPort::Kind::kParameter) + described->FindParameter(KString::Static(parameterKey))->Index())][0];
  }
  float Output(KPort::Kind kind, int32_t index = 0) const { return buffers[static_cast<size_t>(layout.First(kind) + index)][0]; }
  const std::vector<float>& Audio(int32_t channel) const { return buffers[static_cast<size_t>(layout.First(KPort::Kind::kAudioOut) + channel)]; }
  void Run(uint32_t samples) { descriptor->run(handle, samples); }
  const LV2_State_Interface* State() const { return static_cast<const LV2_State_Interface*>(descriptor->extension_data(LV2_STATE__interface)); }
  LV2_State_Status Save(KSavedState& saved) { return State()->save(handle, KSavedState::Store, &saved, 0, nullptr); }
  LV2_State_Status Restore(KSavedState& saved) { return State()->restore(handle, KSavedState::Retrieve, &saved, 0, nullptr); }
};

}  // namespace KLV2Test
