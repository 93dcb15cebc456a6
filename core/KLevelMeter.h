#pragma once

#include <atomic>
#include <cstdint>

#include "kernel/KExport.h"

// A peak meter fed by the audio thread and read by the editor. The peak holds until the meter
// is reset; a reset inside the hold time (count below the limit) also drops the hold flag.
class TORVANE_API KLevelMeter {
public:
  void Accumulate(const float* samples, int32_t n) noexcept { Take(Peak(samples, n, Level()), n); }
  // Both meters of a channel pair in one pass, as Accumulate on each.
  static void AccumulatePair(KLevelMeter& left, KLevelMeter& right, const float* l, const float* r, int32_t n) noexcept {
    float peaks[2] = {left.Level(), right.Level()};
    PeakPair(l, r, n, peaks);
    left.Take(peaks[0], n);
    right.Take(peaks[1], n);
  }
  // A peak magnitude that the processing found over n samples as it went (never NaN), taken as
  // Accumulate would take the samples themselves.
  void AccumulatePeak(float peak, int32_t n) noexcept { Take(peak > Level() ? peak : Level(), n); }
  void Reset() noexcept {
    if (count_ < limit_) hold_ = false;
    level_.store(resetValue_, std::memory_order_relaxed);
    count_ = 0;
  }
  float Level() const noexcept { return level_.load(std::memory_order_relaxed); }
  // The largest magnitude since the last take, resets or not (for a reader on another thread,
  // which polls it and so misses no block in between).
  float TakePeak() noexcept { return unread_.exchange(0.0f, std::memory_order_relaxed); }
  bool IsHolding() const noexcept { return hold_; }
  void SetHoldSamples(int32_t limit) noexcept { limit_ = limit; }

  // The larger of `peak` and the largest magnitude among the samples; a NaN sample is skipped.
  // Eight samples per instruction where the processor has AVX, four otherwise.
  static float Peak(const float* samples, int32_t n, float peak) noexcept;
  // The same over two channels at once, each into its own peak.
  static void PeakPair(const float* l, const float* r, int32_t n, float (&peaks)[2]) noexcept;

private:
  void Take(float peak, int32_t n) noexcept {
    level_.store(peak, std::memory_order_relaxed);
    // A reader's take between this load and store is lost, and it sees this peak once more.
    if (peak > unread_.load(std::memory_order_relaxed)) unread_.store(peak, std::memory_order_relaxed);
    count_ += n;
    hold_ = true;
  }

  std::atomic<float> level_{0.0f};
  std::atomic<float> unread_{0.0f};
  float resetValue_ = 0.0f;
  int32_t count_ = 0;
  int32_t limit_ = 0;
  bool hold_ = false;
};
