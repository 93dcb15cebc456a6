#pragma once

#include "hosts/KAudioPluginInterface.h"

// The command line as a host: a fourth host kind ("CLI"). It has no automation lanes, no
// editor and no MIDI output to write to, so gestures, automation sends and MIDI from the
// plug-in end here; the latency it hears about is compensated by the renderer.
class KCliHost final : public KAudioPluginInterface {
public:
  explicit KCliHost(KAudioPlugin& plugin) : KAudioPluginInterface(plugin, "CLI") {}

  void BeginGesture(int32_t) override {}
  void SendAutomationValue(int32_t, double) override {}
  void EndGesture(int32_t) override {}
  void SendMIDIEvent(int32_t, const uint8_t[4]) override {}
  void ReportLatency(int32_t) override {}
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }
};
