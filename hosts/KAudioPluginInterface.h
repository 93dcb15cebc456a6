#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>

#include "core/KClock.h"
#include "kernel/KArray.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

class KAudioPlugin;

// The one door through which a plug-in talks to the host format that carries it. Each adapter
// derives from it and fills the virtual operations with its format's calls. The common logic
// lives here: a parameter the plug-in sends stays "touched" until no value has come for more
// than a second, so that the host sees a begin and an end around every burst of changes.
class TORVANE_API KAudioPluginInterface {
public:
  static constexpr uint64_t kGestureTimeoutMs = 1001;
  // Latency requests: report when changed, or report in any case.
  static constexpr int32_t kLatencyIfChanged = 1;
  static constexpr int32_t kLatencyAlways = 2;

  KAudioPluginInterface(KAudioPlugin& plugin, const KString& formatName, const KClock& clock = KClock::System());
  KAudioPluginInterface(const KAudioPluginInterface&) = delete;
  KAudioPluginInterface& operator=(const KAudioPluginInterface&) = delete;

  // Operations in slot order; adapters override them.
  virtual ~KAudioPluginInterface();
  // kind 0 touches the parameter, kind 3 releases it; other kinds, and indices outside the
  // parameter table, are ignored.
  virtual void GestureNotice(int32_t index, int32_t kind);
  virtual void BeginGesture(int32_t index) = 0;
  virtual void SendAutomationValue(int32_t index, double normalized) = 0;
  // The same send, from inside the processing call.
  virtual void SendAutomationValueFromProcess(int32_t index, double normalized) { SendAutomationValue(index, normalized); }
  virtual void EndGesture(int32_t index) = 0;
  // Reserved: keeps the slots after it where every adapter expects them.
  virtual void Reserved() {}
  virtual void SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) = 0;
  virtual void ReportLatency(int32_t samples) = 0;
  virtual void UpdateParameterNames() = 0;
  virtual void NotifyPresetChanged() = 0;
  // Answers whether the host accepted the new editor size.
  virtual bool ResizeEditor(int32_t width, int32_t height) = 0;
  // The plug-in's bypass to the host. Appended so that every slot before it keeps its place;
  // a host format without a bypass parameter leaves it empty.
  virtual void SendBypassValue(bool /*bypass*/) {}

  // One parameter's new normalised value to the host, inside a gesture.
  void SendAutomation(int32_t index, double normalized);
  // Every automatable parameter's present value.
  void SendAllAutomation();
  // The plug-in's own bypass switch to the host (user-interface thread), counted as a send so
  // that the host's echo of it passes for what it is.
  void SendBypassAutomation(bool bypass);
  // Runs on the interface's timer: ends gestures that went quiet, reports a changed latency.
  void Idle();
  // Any thread. Until the next idle, requests add up: "always" is never weakened to "if changed".
  void RequestLatencyReport(int32_t mode) noexcept { latencyRequest_.fetch_or(mode, std::memory_order_acq_rel); }

  const KString& FormatName() const noexcept { return formatName_; }
  bool IsOffline() const noexcept { return offline_; }
  void SetOffline(bool offline) noexcept { offline_ = offline; }
  int32_t ReportedLatency() const noexcept { return reportedLatency_; }
  int32_t TouchedCount() const;

protected:
  KAudioPlugin& Plugin() noexcept { return plugin_; }
  // The plug-in's automation-sending counter, above 0 while a value is on its way to the host;
  // lowering never leaves it below 0.
  void RaiseSendingCounter() noexcept;
  void LowerSendingCounter() noexcept;

private:
  struct Touched {
    uint32_t index;
    uint64_t time;
  };
  void Touch(int32_t index, uint64_t now);  // with the touch lock held
  void EndQuietGestures();
  void ReportLatencyIfRequested();

  KAudioPlugin& plugin_;
  KString formatName_;
  const KClock& clock_;
  mutable std::mutex touchLock_;
  KArray<Touched> touched_;
  bool offline_ = false;
  int32_t reportedLatency_ = 0;
  std::atomic<int32_t> latencyRequest_{0};
};
