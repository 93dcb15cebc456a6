#pragma once

#include <cstdint>
#include <mutex>
#include <optional>
#include <type_traits>

#include "kernel/KArray.h"
#include "kernel/KGuard.h"

// Values a listener binds besides its target (a selector, an index); handed back to its thunk
// on every call.
struct KEventBinding {
  uint64_t context = 0;
  int32_t tag = 0;
};

// What a dispatcher of pending events needs without knowing the argument type, and the one
// lock that the pending queues of all events in the process share.
class KEventBase {
public:
  KEventBase() noexcept = default;
  KEventBase(const KEventBase&) = delete;
  KEventBase& operator=(const KEventBase&) = delete;
  virtual ~KEventBase();

  // Calls the listeners with the oldest pending argument, if there is one.
  virtual void ExecutePendingEvent() noexcept = 0;
  // Arguments posted and not executed yet.
  virtual int32_t PendingCount() const noexcept = 0;

protected:
  static std::mutex pendingLock_;
};

// An event with listeners, called either at once (ExecuteImmediately) or later with a posted
// argument, one argument per ExecutePendingEvent, on the thread that executes it.
//
// Threading: Post and PendingCount may run on any thread, the audio thread included, at the
// same time as everything else; they hold the process-wide lock only for the append or the
// read (ReservePending beforehand keeps the append from allocating). The listener list belongs
// to the thread that executes the event: adding and removing listeners, ExecuteImmediately and
// ExecutePendingEvent all run there. Listeners are called outside the lock, so they may post to
// this or any other event. A round of calls reads the listener count once: listeners added
// during it wait for the next round, listeners removed during it are not called any more.
// Nothing may post once the event's destruction has begun.
template <class Argument>
class KEvent : public KEventBase {
  static_assert(std::is_trivially_copyable_v<Argument> && sizeof(Argument) <= 2 * sizeof(uint64_t),
                "an event argument is a small value of at most two words, copied by value");

public:
  using Thunk = void (*)(void* target, const KEventBinding* binding, const Argument* argument);
  static constexpr uint32_t kListenerCalled = 1;

  struct Listener {
    void* target;
    KEventBinding binding;
    Thunk thunk;  // null once removed while a round of calls still walks the list
  };

  void AddListener(void* target, Thunk thunk, KEventBinding binding = {}) {
    listeners_.Append(Listener{target, binding, thunk});
  }
  // Binds a member function taking the argument: event.AddListener<&KView::Refresh>(view).
  template <auto Method, class Target>
  void AddListener(Target* target) {
    AddListener(target, &CallMember<Method, Target>);
  }

  // Removes every record equal to the one given.
  void RemoveListener(const void* target, Thunk thunk, KEventBinding binding = {}) noexcept {
    RemoveWhere([&](const Listener& l) {
      return l.target == target && l.thunk == thunk && l.binding.context == binding.context &&
             l.binding.tag == binding.tag;
    });
  }
  template <auto Method, class Target>
  void RemoveListener(Target* target) noexcept {
    RemoveListener(target, &CallMember<Method, Target>);
  }
  // Removes every record of the target (an object going away).
  void RemoveListeners(const void* target) noexcept {
    RemoveWhere([&](const Listener& l) { return l.target == target; });
  }

  // Calls every listener now. Bit 0 of the answer is set when at least one was called.
  uint32_t ExecuteImmediately(Argument argument) noexcept {
    uint32_t result = 0;
    KGuard("KEvent::ExecuteImmediately", [&] { CallListeners(argument, result); });
    return result;
  }

  // Queues the argument for a later ExecutePendingEvent; equal arguments are not coalesced. If
  // the queue cannot grow, the argument is dropped with a trace line.
  void Post(Argument argument) noexcept {
    KGuard("KEvent::Post", [&] {
      std::lock_guard lock(pendingLock_);
      pending_.Append(argument);
    });
  }

  // Room for `capacity` pending arguments, so that posting up to that many does not allocate.
  void ReservePending(int32_t capacity) {
    std::lock_guard lock(pendingLock_);
    pending_.Reserve(capacity);
  }

  void ExecutePendingEvent() noexcept override {
    KGuard("KEvent::ExecutePendingEvent", [this] {
      if (const std::optional<Argument> argument = TakeOldest()) {
        uint32_t called = 0;
        CallListeners(*argument, called);
      }
    });
  }

  int32_t PendingCount() const noexcept override {
    std::lock_guard lock(pendingLock_);
    return pending_.Count();
  }

private:
  // Marks a round of calls; list entries removed meanwhile are only blanked, and swept out when
  // the outermost round ends (also when a listener threw).
  class Round {
  public:
    explicit Round(KEvent& event) noexcept : event_(event) { ++event_.rounds_; }
    Round(const Round&) = delete;
    Round& operator=(const Round&) = delete;
    ~Round() {
      if (--event_.rounds_ == 0) event_.RemoveWhere([](const Listener& l) { return l.thunk == nullptr; });
    }

  private:
    KEvent& event_;
  };

  template <auto Method, class Target>
  static void CallMember(void* target, const KEventBinding*, const Argument* argument) {
    (static_cast<Target*>(target)->*Method)(*argument);
  }

  std::optional<Argument> TakeOldest() {
    std::lock_guard lock(pendingLock_);
    if (pending_.Count() < 1) return std::nullopt;
    const Argument oldest = pending_[0];
    pending_.RemoveAt(0);
    return oldest;
  }

  // The count is read once: listeners added by a listener wait for the next round.
  void CallListeners(const Argument& argument, uint32_t& result) {
    Round round(*this);
    const int32_t count = listeners_.Count();
    for (int32_t i = 0; i < count; ++i) {
      const Listener listener = listeners_[i];  // a listener that adds one may move the array
      if (!listener.thunk) continue;
      listener.thunk(listener.target, &listener.binding, &argument);
      result |= kListenerCalled;
    }
  }

  template <class Match>
  void RemoveWhere(Match match) noexcept {
    for (int32_t i = listeners_.Count() - 1; i >= 0; --i) {
      if (!match(listeners_[i])) continue;
      if (rounds_ > 0) {
        listeners_[i].thunk = nullptr;  // the running round indexes the list; keep it in place
      } else {
        listeners_.RemoveAt(i);
      }
    }
  }

  KArray<Listener> listeners_;
  KArray<Argument> pending_;  // guarded by pendingLock_
  int32_t rounds_ = 0;        // rounds of calls running on the executing thread (they may nest)
};
