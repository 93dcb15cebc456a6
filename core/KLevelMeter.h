#pragma once

#include <atomic>
#include <cmath>
#include <cstdint>

// A peak meter fed by the audio thread and read by the editor. The peak holds until the meter
// is reset; a reset inside the hold time (count below the limit) also drops the hold flag.
class KLevelMeter {
public:
  void Accumulate(const float* samples, int32_t n) noexcept {
    float peak = level_.load(std::memory_order_relaxed);
    // Compare-and-select rather than fmax: the compiler turns it into packed maxima, and a NaN
    // sample is skipped just the same.
    for (int32_t i = 0; i < n; ++i) {
      const float magnitude = std::fabs(samples[i]);
      peak = magnitude > peak ? magnitude : peak;
    }
    level_.store(peak, std::memory_order_relaxed);
    count_ += n;
    hold_ = true;
  }
  void Reset() noexcept {
    if (count_ < limit_) hold_ = false;
    level_.store(resetValue_, std::memory_order_relaxed);
    count_ = 0;
  }
  float Level() const noexcept { return level_.load(std::memory_order_relaxed); }
  bool IsHolding() const noexcept { return hold_; }
  void SetHoldSamples(int32_t limit) noexcept { limit_ = limit; }

private:
  std::atomic<float> level_{0.0f};
  float resetValue_ = 0.0f;
  int32_t count_ = 0;
  int32_t limit_ = 0;
  bool hold_ = false;
};
