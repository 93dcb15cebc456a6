#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>

#include "core/KParameterInfo.h"
#include "core/KParameterRamp.h"
#include "kernel/KArray.h"
#include "kernel/KExport.h"

class KAudioPluginHost;

// The parameter side of every plug-in: the parameter table and the ramps that make host
// automation sample-accurate. The audio is cut into sub-blocks at the ramps' break points, and
// at every sub-block start each moving parameter holds its exact value.
//
// Threads: the Interpolation* operations and AddRamp run on the audio thread. Other threads
// (host parameter calls, the editor) hand over ramps and values with PostRamp / PostValue; the
// audio thread picks them up at the next block start (AcceptPostedRamps) without allocating.
class TORVANE_API KAudioPluginBase {
public:
  class Parameter;
  using RampPoint = ParameterRamp::Point;

  // Ramp records made at construction and reused for the life of the plug-in: the audio
  // thread's own pool (host automation arriving inside the processing call) and the pool of
  // the hand-over from other threads.
  static constexpr int32_t kAudioRampCapacity = 128;
  static constexpr int32_t kPostedRampCapacity = 64;
  // Longest sub-block normally and while a fine ramp lives. A fine ramp moves on a grid of
  // fine-cap cells counted from the stream's start (the last jump), not from the host block:
  // between grid lines its parameter holds, and it ends on a line; so the same automation sounds
  // the same whatever block size the host uses.
  static constexpr int32_t kDefaultSubBlockCap = 1024;
  static constexpr int32_t kDefaultFineSubBlockCap = 32;

  explicit KAudioPluginBase(std::span<const KParameterInfo> table);
  KAudioPluginBase(const KAudioPluginBase&) = delete;
  KAudioPluginBase& operator=(const KAudioPluginBase&) = delete;
  virtual ~KAudioPluginBase();

  // ---- parameter table
  int32_t ParameterCount() const noexcept { return parameters_.Count(); }
  Parameter& GetParameter(int32_t index) noexcept { return *parameters_[index]; }
  const Parameter& GetParameter(int32_t index) const noexcept { return *parameters_[index]; }
  // The parameter with this key, or null.
  Parameter* FindParameter(const KString& key) noexcept;
  // Held by whatever changes what the parameter table shows (a renamed parameter); hosts read
  // names and values under it with a try-lock, so that their threads never wait for it.
  std::mutex& ParameterLock() noexcept { return parameterLock_; }

  // ---- state flags (any thread)
  static constexpr uint32_t kUpdatePending = 1u << 0;
  static constexpr uint32_t kJump = 1u << 2;
  void MarkUpdatePending() noexcept { stateFlags_.fetch_or(kUpdatePending, std::memory_order_release); }
  // Makes the next block apply every ramp's final value at once (state load, reset).
  void RequestJump() noexcept { stateFlags_.fetch_or(kJump, std::memory_order_release); }
  // Clears the update-pending bit; answers whether it was set.
  // Read first: most sub-blocks find nothing pending and need no locked write.
  bool TakeUpdatePending() noexcept {
    if ((stateFlags_.load(std::memory_order_acquire) & kUpdatePending) == 0) return false;
    return (stateFlags_.fetch_and(~kUpdatePending, std::memory_order_acq_rel) & kUpdatePending) != 0;
  }

  // ---- ramps, audio thread
  // Starts a ramp now (times relative to the current sub-block; point 1 may be
  // ParameterRamp::kBlockEnd). Replaces any ramp of the same parameter. Answers false when the
  // points are unusable (fewer than 2, more than 64, bad index) or the pool is empty, in which
  // case the last point's value is applied at once so that the final value is never lost.
  // With `modulation` the ramp moves the parameter's modulation offset (KModulator) instead of
  // its value, and replaces only a modulation ramp: automation and modulation run side by side.
  bool AddRamp(int32_t parameter, std::span<const RampPoint> points, bool fine, bool modulation = false) noexcept;
  // Most blocks have no ramp, no jump and nothing posted: for them these calls are a few
  // inline tests, and the list walks stay out of line.
  int32_t InterpolationPrepare(int32_t blockLength, int32_t& subBlockCap, int32_t fineCap) noexcept {
    if (!active_.IsEmpty() || (stateFlags_.load(std::memory_order_acquire) & kJump) != 0)
      return PrepareRamps(blockLength, subBlockCap, fineCap);
    grid_ = fineCap > 0 ? fineCap : 1;
    rampsAdded_ = false;
    return blockLength < subBlockCap ? blockLength : subBlockCap;
  }
  int32_t InterpolationProcess(int32_t processedLength, int32_t remainingLength) noexcept {
    position_ += processedLength;
    return active_.IsEmpty() ? remainingLength : AdvanceRamps(processedLength, remainingLength);
  }
  void InterpolationFinish() noexcept {
    if (!active_.IsEmpty()) SettleRamps();
  }
  // Takes over what other threads posted (try-lock: when the lock is busy, the ramps wait for
  // the next block). Called at every block start.
  void AcceptPostedRamps() noexcept {
    if (overflowPending_.load(std::memory_order_relaxed) || rampsPosted_.load(std::memory_order_acquire) ||
        !postedReturns_.IsEmpty())
      TakePostedRamps();
  }
  int32_t ActiveRampCount() const noexcept { return active_.Count(); }
  int32_t SpareRampCount() const noexcept { return spare_.Count(); }

  // ---- ramps and values from other threads
  // A ramp that starts at the next block. A second post for the same parameter before the audio
  // thread took the first replaces it. When every posted record is in use, the final value is
  // kept on its own and applied at the next block start: nothing allocates, nothing is lost.
  void PostRamp(int32_t parameter, std::span<const RampPoint> points, bool fine);
  // Moves a parameter to `normalized` over `glideSamples` from its present value.
  void PostValue(int32_t parameter, double normalized, int32_t glideSamples);

  // ---- host side
  KAudioPluginHost* Interface() const noexcept { return interface_; }
  void SetInterface(KAudioPluginHost* host) noexcept { interface_ = host; }
  // Above 0 while a value sent by the plug-in is on its way to the host (so that the host's
  // echo of it is recognised).
  std::atomic<int32_t>& AutomationSending() noexcept { return automationSending_; }

protected:
  // Gives the ramps added since the last block that end "at the block end" the host block's
  // length. The processing cycle calls it before it takes a long block in pieces, so that such
  // a ramp spans the whole host block rather than its first piece.
  void ResolveBlockEnd(int32_t blockLength) noexcept {
    if (rampsAdded_) StretchToBlockEnd(blockLength);
  }

private:
  void ApplyCurrent(ParameterRamp& ramp) noexcept;
  void ApplyLast(ParameterRamp& ramp) noexcept;
  void Apply(int32_t parameter, double normalized) noexcept;
  void Apply(const ParameterRamp& ramp, double value) noexcept;
  void Retire(ParameterRamp* ramp) noexcept;
  void RetireRampsOf(int32_t parameter, bool modulation = false) noexcept;
  void ApplyOverflowValues() noexcept;
  int32_t NextBreak(const ParameterRamp& ramp) const noexcept;
  // Brings a ramp to the present position and applies its value; answers whether it retired.
  bool Settle(ParameterRamp* ramp) noexcept;
  int32_t PrepareRamps(int32_t blockLength, int32_t& subBlockCap, int32_t fineCap) noexcept;
  int32_t AdvanceRamps(int32_t processedLength, int32_t remainingLength) noexcept;
  void SettleRamps() noexcept;
  void TakePostedRamps() noexcept;
  void StretchToBlockEnd(int32_t blockLength) noexcept;
  bool OnGrid() const noexcept { return position_ % grid_ == 0; }
  int32_t ToGrid() const noexcept { return grid_ - static_cast<int32_t>(position_ % grid_); }

  KArray<Parameter*> parameters_;
  std::unique_ptr<ParameterRamp[]> records_;

  // Audio thread only.
  KRampList active_;
  KRampList spare_;
  KRampList postedReturns_;  // retired posted records, given back at the next accept
  bool rampsAdded_ = false;
  int64_t position_ = 0;  // samples processed since the last jump
  int32_t grid_ = kDefaultFineSubBlockCap;

  // Guarded by rampMutex_.
  std::mutex rampMutex_;
  KRampList postedFree_;
  KRampList posted_;
  std::atomic<bool> rampsPosted_{false};  // posted_ may hold records: set after a push
  // Final values that found no free posted record, one slot per parameter.
  std::unique_ptr<std::atomic<double>[]> overflowValues_;
  std::atomic<bool> overflowPending_{false};

  std::mutex parameterLock_;
  std::atomic<uint32_t> stateFlags_{kUpdatePending};  // derived values start unset
  std::atomic<int32_t> automationSending_{0};
  KAudioPluginHost* interface_ = nullptr;
};
