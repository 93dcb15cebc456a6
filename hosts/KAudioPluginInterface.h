#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>

#include "core/KAudioPluginHost.h"
#include "core/KClock.h"
#include "core/KEvent.h"
#include "kernel/KArray.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

class KAudioPlugin;

// The host layer's side of the one door through which a plug-in talks to the host format that
// carries it. Each adapter derives from it and fills the slots with its format's calls. The
// common logic lives here: a parameter the plug-in sends stays "touched" until no value has come
// for more than a second, so that the host sees a begin and an end around every burst of changes.
class TORVANE_API KAudioPluginInterface : public KAudioPluginHost {
public:
  static constexpr uint64_t kGestureTimeoutMs = 1001;

  KAudioPluginInterface(KAudioPlugin& plugin, const KString& formatName, const KClock& clock = KClock::System());
  KAudioPluginInterface(const KAudioPluginInterface&) = delete;
  KAudioPluginInterface& operator=(const KAudioPluginInterface&) = delete;

  ~KAudioPluginInterface() override;
  void GestureNotice(int32_t index, int32_t kind) override;

  // Any thread but the audio thread: the touch lock is waited for, so that the value never
  // reaches the host outside its gesture.
  void SendAutomation(int32_t index, double normalized) final;
  // Posted to the pending-event queue and sent by the next Idle. Sends beyond the room reserved
  // for one burst (kPendingSendsPerParameter per parameter) are dropped rather than allocate.
  void SendAutomationFromProcess(int32_t index, double normalized) noexcept final;
  void SendAllAutomation() final;
  // Counted as a send, so that the host's echo of it passes for what it is.
  void SendBypassAutomation(bool bypass) final;
  void RequestLatencyReport(int32_t mode) noexcept final { latencyRequest_.fetch_or(mode, std::memory_order_acq_rel); }
  // Runs on the interface's timer (user-interface thread): sends the values the audio thread
  // handed over, ends gestures that went quiet, reports a changed latency. Adapters add what
  // their format hands over from the audio thread.
  virtual void Idle();

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
  static constexpr int32_t kPendingSendsPerParameter = 4;
  struct PendingSend {
    int32_t index;
    double normalized;
  };
  struct Touched {
    uint32_t index;
    uint64_t time;
  };
  void Touch(int32_t index, uint64_t now);  // with the touch lock held
  void EndQuietGestures();
  void ReportLatencyIfRequested();
  void SendPending();
  void SendPosted(PendingSend send) { SendAutomation(send.index, send.normalized); }

  KAudioPlugin& plugin_;
  KString formatName_;
  const KClock& clock_;
  mutable std::mutex touchLock_;
  KArray<Touched> touched_;
  bool offline_ = false;
  int32_t reportedLatency_ = 0;
  std::atomic<int32_t> latencyRequest_{0};
  KEvent<PendingSend> pendingSends_;
  int32_t pendingRoom_ = 0;
};
