#pragma once

#include <atomic>
#include <memory>

// Hands objects made on the user-interface thread to the audio thread without a lock and
// without the audio thread ever freeing memory. The user-interface thread publishes; the audio
// thread takes the newest published object at its next call and parks the one it leaves, which
// the user-interface thread frees at its next publish or collect. While a parked object waits,
// the audio thread keeps its present one, so nothing is ever dropped unfreed. Null is a valid
// object: "none".
template <class T>
class KHandOver {
public:
  explicit KHandOver(std::unique_ptr<T> first = nullptr) noexcept : current_(first.release()), latest_(current_) {}
  KHandOver(const KHandOver&) = delete;
  KHandOver& operator=(const KHandOver&) = delete;
  ~KHandOver() {
    Collect();
    if (Slot* slot = pending_.load()) {
      delete slot->object;
      delete slot;
    }
    delete current_;
  }

  // ---- user-interface thread
  void Publish(std::unique_ptr<T> object) {
    Collect();
    latest_ = object.get();
    // An object published before the audio thread took the last one is never seen: it goes.
    Slot* old = pending_.exchange(new Slot{object.release()}, std::memory_order_acq_rel);
    if (old) {
      delete old->object;
      delete old;
    }
  }
  // The newest published object: what the audio thread uses now or will at its next call.
  T* Latest() const noexcept { return latest_; }
  // Frees what the audio thread left.
  void Collect() noexcept {
    if (Slot* slot = parked_.exchange(nullptr, std::memory_order_acq_rel)) {
      delete slot->object;
      delete slot;
    }
  }

  // ---- audio thread
  // No object in use and none on its way: the common case, answered without taking anything.
  bool IsIdle() const noexcept { return !current_ && !pending_.load(std::memory_order_acquire); }
  // The object to use; `changed` tells whether it was taken over just now.
  T* Acquire(bool& changed) noexcept {
    changed = false;
    if (!pending_.load(std::memory_order_acquire) || parked_.load(std::memory_order_acquire)) return current_;
    Slot* next = pending_.exchange(nullptr, std::memory_order_acq_rel);
    if (!next) return current_;
    // The slot that carried the new object carries the old one back.
    T* old = current_;
    current_ = next->object;
    next->object = old;
    parked_.store(next, std::memory_order_release);
    changed = true;
    return current_;
  }

private:
  // A box, so that "nothing pending" and "null pending" differ.
  struct Slot {
    T* object;
  };
  std::atomic<Slot*> pending_{nullptr};
  std::atomic<Slot*> parked_{nullptr};
  T* current_;    // audio thread
  T* latest_;     // user-interface thread
};
