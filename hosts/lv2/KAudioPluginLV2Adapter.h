#pragma once

#include <lv2/core/lv2.h>
#include <lv2/state/state.h>
#include <lv2/urid/urid.h>

#include <cstdint>
#include <memory>
#include <string_view>

#include "core/KAudioPlugin.h"
#include "hosts/KAudioPluginInterface.h"
#include "hosts/common/KHostMIDIList.h"
#include "hosts/common/KHostState.h"
#include "hosts/lv2/KLV2Ports.h"
#include "hosts/lv2/KLV2Time.h"

// A plug-in of the kernel as one LV2 instance. Ports follow KPortLayout. Control inputs carry
// working units; a control whose value differs from the one seen at the previous run reaches the
// plug-in as one point at the block start, as a VST 3 host's single point does. The state is
// the plug-in's UTF-8 state text under one property. The transport comes from time:Position
// objects in the atom input, where the plug-in has one (KLV2::KTimeReader). Any block length runs: the processing
// cycle takes long blocks in pieces, so neither the options nor the buffer-size feature is asked
// for, and an unconnected side-chain reads as silence.
//
// The host's URID map is needed only for MIDI and for the state: an audio effect runs in a host
// that offers no features at all. Run neither allocates nor waits for a lock; every entry is
// guarded so that nothing escapes into the host.
class KAudioPluginLV2Adapter final : public KAudioPluginInterface {
public:
  // The property that holds the state text, and its type.
  static constexpr const char* kStateKey = "urn:torvane:state";

  // Null `map`: no MIDI ports may be connected, and the state cannot be saved or restored.
  KAudioPluginLV2Adapter(std::unique_ptr<KAudioPlugin> plugin, const LV2_URID_Map* map);
  ~KAudioPluginLV2Adapter() override;

  void ConnectPort(uint32_t port, void* data) noexcept;
  void Activate() noexcept;
  void Run(uint32_t samples) noexcept;
  LV2_State_Status Save(LV2_State_Store_Function store, LV2_State_Handle handle) noexcept;
  LV2_State_Status Restore(LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle) noexcept;

  KAudioPlugin& Plugin() noexcept { return *plugin_; }
  const KLV2::KPortLayout& Layout() const noexcept { return layout_; }

  // ---- KAudioPluginInterface. LV2 has no gestures without an editor and reads the latency
  // from its port at every run, so only MIDI output goes anywhere.
  void BeginGesture(int32_t) override {}
  void SendAutomationValue(int32_t, double) override {}
  void EndGesture(int32_t) override {}
  void SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) override { midiOut_.Append(sampleOffset, bytes); }
  void ReportLatency(int32_t) override {}
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }

private:
  struct URIDs {
    LV2_URID midiEvent = 0;
    LV2_URID sequence = 0;
    LV2_URID string = 0;
    LV2_URID stateKey = 0;
  };

  void ApplyControls() noexcept;
  void ReadMIDI() noexcept;
  void WriteMIDI() noexcept;
  void WriteOutputs() noexcept;

  std::unique_ptr<KAudioPlugin> plugin_;
  KLV2::KPortLayout layout_;
  URIDs urids_;
  bool mapped_;
  // One pointer per port, as the host connected it (null: not connected).
  std::unique_ptr<void*[]> ports_;
  // The value of each control input at the previous run; NaN until the first.
  std::unique_ptr<float[]> seen_;
  KHostMIDIList midiOut_;
  KHostState state_;
  KLV2::KTimeReader time_;  // the host's positions from the atom input
};
