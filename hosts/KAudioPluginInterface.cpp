#include "hosts/KAudioPluginInterface.h"

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

KAudioPluginInterface::KAudioPluginInterface(KAudioPlugin& plugin, const KString& formatName, const KClock& clock)
    : plugin_(plugin), formatName_(formatName), clock_(clock) {
  // Room for every parameter at once: touching never allocates in steady state.
  touched_.Reserve(plugin.ParameterCount() > 1 ? plugin.ParameterCount() : 1);
  pendingRoom_ = kPendingSendsPerParameter * (plugin.ParameterCount() > 1 ? plugin.ParameterCount() : 1);
  pendingSends_.ReservePending(pendingRoom_);
  pendingSends_.AddListener<&KAudioPluginInterface::SendPosted>(this);
}

KAudioPluginInterface::~KAudioPluginInterface() = default;

void KAudioPluginInterface::Touch(int32_t index, uint64_t now) {
  for (Touched& entry : touched_) {
    if (entry.index == static_cast<uint32_t>(index)) {
      entry.time = now;
      return;
    }
  }
  if (touched_.Count() == touched_.Capacity()) {
    // One entry at a time up to 16, then powers of two.
    int32_t capacity = touched_.Count() + 1;
    if (capacity > 16) {
      int32_t power = 16;
      while (power < capacity) power *= 2;
      capacity = power;
    }
    touched_.Reserve(capacity);
  }
  touched_.Append(Touched{static_cast<uint32_t>(index), now});
  BeginGesture(index);
}

void KAudioPluginInterface::GestureNotice(int32_t index, int32_t kind) {
  if (index < 0 || index >= plugin_.ParameterCount()) return;
  if (kind == KAudioPluginBase::Parameter::kTouch) {
    std::lock_guard<std::mutex> lock(touchLock_);
    Touch(index, clock_.Milliseconds());
  } else if (kind == KAudioPluginBase::Parameter::kRelease) {
    bool wasTouched = false;
    {
      std::lock_guard<std::mutex> lock(touchLock_);
      for (int32_t i = 0; i < touched_.Count(); ++i) {
        if (touched_[i].index == static_cast<uint32_t>(index)) {
          touched_.RemoveAt(i);
          wasTouched = true;
          break;
        }
      }
    }
    if (wasTouched) EndGesture(index);
  }
}

// The counter only ever counts sends in flight: a stray decrement elsewhere may not leave it
// negative, or the next send would run with it at 0 and its echo would pass as a host change.
void KAudioPluginInterface::RaiseSendingCounter() noexcept {
  std::atomic<int32_t>& counter = plugin_.AutomationSending();
  int32_t value = counter.load(std::memory_order_relaxed);
  while (!counter.compare_exchange_weak(value, value > 0 ? value + 1 : 1, std::memory_order_acq_rel)) {
  }
}

void KAudioPluginInterface::LowerSendingCounter() noexcept {
  std::atomic<int32_t>& counter = plugin_.AutomationSending();
  int32_t value = counter.load(std::memory_order_relaxed);
  while (!counter.compare_exchange_weak(value, value > 0 ? value - 1 : 0, std::memory_order_acq_rel)) {
  }
}

void KAudioPluginInterface::SendAutomation(int32_t index, double normalized) {
  if (index < 0 || index >= plugin_.ParameterCount()) return;
  RaiseSendingCounter();
  {
    // Waited for even when the editor or the timer holds the list: a value sent without its
    // touch would reach the host outside a gesture, or let a gesture end amid a burst.
    std::lock_guard<std::mutex> lock(touchLock_);
    Touch(index, clock_.Milliseconds());
  }
  SendAutomationValue(index, normalized);
  LowerSendingCounter();
}

void KAudioPluginInterface::SendAutomationFromProcess(int32_t index, double normalized) noexcept {
  if (index < 0 || index >= plugin_.ParameterCount()) return;
  // The room was reserved at construction: beyond it a post would allocate on the audio thread.
  if (pendingSends_.PendingCount() >= pendingRoom_) return;
  pendingSends_.Post(PendingSend{index, normalized});
}

// Only the sends waiting when the idle began: a listener that posts again waits for the next.
void KAudioPluginInterface::SendPending() {
  for (int32_t waiting = pendingSends_.PendingCount(); waiting > 0; --waiting) pendingSends_.ExecutePendingEvent();
}

void KAudioPluginInterface::SendAllAutomation() {
  RaiseSendingCounter();
  for (int32_t i = 0; i < plugin_.ParameterCount(); ++i) {
    const KAudioPluginBase::Parameter& parameter = plugin_.GetParameter(i);
    if (parameter.IsAutomatable()) SendAutomationValue(i, parameter.Normalized());
  }
  LowerSendingCounter();
}

void KAudioPluginInterface::SendBypassAutomation(bool bypass) {
  RaiseSendingCounter();
  SendBypassValue(bypass);
  LowerSendingCounter();
}

void KAudioPluginInterface::Idle() {
  SendPending();
  EndQuietGestures();
  ReportLatencyIfRequested();
}

void KAudioPluginInterface::EndQuietGestures() {
  if (TouchedCount() == 0) return;
  const uint64_t now = clock_.Milliseconds();
  // One entry at a time, and the host is called without the lock: a host that answers the end
  // of a gesture by sending a value must find the list free, or that value would lose its touch.
  for (int32_t position = 0;;) {
    int32_t ended = -1;
    {
      std::lock_guard<std::mutex> lock(touchLock_);
      for (; position < touched_.Count(); ++position) {
        // Absolute difference: a clock that wraps around cannot keep a gesture open forever.
        const uint64_t sent = touched_[position].time;
        if ((now > sent ? now - sent : sent - now) >= kGestureTimeoutMs) {
          ended = static_cast<int32_t>(touched_[position].index);
          touched_.RemoveAt(position);  // the walk goes on at the same position
          break;
        }
      }
    }
    if (ended < 0) return;
    EndGesture(ended);
  }
}

void KAudioPluginInterface::ReportLatencyIfRequested() {
  const int32_t request = latencyRequest_.exchange(0, std::memory_order_acq_rel);
  if (request == 0) return;
  const int32_t latency = plugin_.TotalLatency();
  if (latency == reportedLatency_ && (request & kLatencyAlways) == 0) return;
  reportedLatency_ = latency;
  ReportLatency(latency);
}

int32_t KAudioPluginInterface::TouchedCount() const {
  std::lock_guard<std::mutex> lock(touchLock_);
  return touched_.Count();
}
