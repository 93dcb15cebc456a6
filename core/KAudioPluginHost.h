#pragma once

#include <cstdint>

#include "kernel/KExport.h"

// What a plug-in may ask of the host that carries it, whatever the host format. The host layer
// implements it (KAudioPluginInterface: gesture bookkeeping, the sending counter, latency
// reports) and each adapter fills the slots with its format's calls; the plug-in holds a pointer
// to it, null while no host is attached.
class TORVANE_API KAudioPluginHost {
public:
  // Latency requests: report when changed, or report in any case.
  static constexpr int32_t kLatencyIfChanged = 1;
  static constexpr int32_t kLatencyAlways = 2;

  KAudioPluginHost() = default;
  KAudioPluginHost(const KAudioPluginHost&) = delete;
  KAudioPluginHost& operator=(const KAudioPluginHost&) = delete;

  // The slots, in the order every adapter expects them.
  virtual ~KAudioPluginHost() = default;
  // kind 0 touches the parameter, kind 3 releases it; other kinds, and indices outside the
  // parameter table, are ignored.
  virtual void GestureNotice(int32_t index, int32_t kind) = 0;
  virtual void BeginGesture(int32_t index) = 0;
  virtual void SendAutomationValue(int32_t index, double normalized) = 0;
  // A second form of the send; formats with a single automation call leave it as the first.
  virtual void SendAutomationValueSecondForm(int32_t index, double normalized) {
    SendAutomationValue(index, normalized);
  }
  virtual void EndGesture(int32_t index) = 0;
  // Reserved: keeps the slots after it where every adapter expects them.
  virtual void Reserved() {}
  virtual void SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) = 0;
  virtual void ReportLatency(int32_t samples) = 0;
  virtual void UpdateParameterNames() = 0;
  virtual void NotifyPresetChanged() = 0;
  // Answers whether the host accepted the new editor size.
  virtual bool ResizeEditor(int32_t width, int32_t height) = 0;
  // The plug-in's bypass to the host; a host format without a bypass parameter leaves it empty.
  virtual void SendBypassValue(bool /*bypass*/) {}

  // The plug-in's requests, carried out by the host layer around the slots above.
  // One parameter's new normalised value to the host, inside a gesture (user-interface thread).
  virtual void SendAutomation(int32_t index, double normalized) = 0;
  // The same from the audio thread: handed to the user-interface thread, which sends it at its
  // next idle. Never blocks and never allocates.
  virtual void SendAutomationFromProcess(int32_t index, double normalized) noexcept = 0;
  // Every automatable parameter's present value.
  virtual void SendAllAutomation() = 0;
  // The plug-in's own bypass switch to the host (user-interface thread).
  virtual void SendBypassAutomation(bool bypass) = 0;
  // Any thread. Until the next idle, requests add up: "always" is never weakened to "if changed".
  virtual void RequestLatencyReport(int32_t mode) noexcept = 0;
};
