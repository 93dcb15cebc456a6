#pragma once

#include <xmmintrin.h>

#include <atomic>
#include <cmath>
#include <cstdint>

// A peak meter fed by the audio thread and read by the editor. The peak holds until the meter
// is reset; a reset inside the hold time (count below the limit) also drops the hold flag.
class KLevelMeter {
public:
  void Accumulate(const float* samples, int32_t n) noexcept {
    float peak = level_.load(std::memory_order_relaxed);
    // Sixteen samples at a time in four registers, so that no compare waits for the one before.
    // maxps answers its second operand when either is NaN: a NaN sample is skipped.
    const __m128 sign = _mm_set1_ps(-0.0f);
    __m128 a = _mm_set1_ps(peak), b = a, c = a, d = a;
    int32_t i = 0;
    for (; i + 16 <= n; i += 16) {
      a = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i)), a);
      b = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 4)), b);
      c = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 8)), c);
      d = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 12)), d);
    }
    __m128 top = _mm_max_ps(_mm_max_ps(a, b), _mm_max_ps(c, d));
    top = _mm_max_ps(top, _mm_movehl_ps(top, top));
    top = _mm_max_ss(top, _mm_shuffle_ps(top, top, 1));
    peak = _mm_cvtss_f32(top);
    for (; i < n; ++i) {
      const float magnitude = std::fabs(samples[i]);
      peak = magnitude > peak ? magnitude : peak;
    }
    level_.store(peak, std::memory_order_relaxed);
    // A reader's take between this load and store is lost, and it sees this peak once more.
    if (peak > unread_.load(std::memory_order_relaxed)) unread_.store(peak, std::memory_order_relaxed);
    count_ += n;
    hold_ = true;
  }
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

private:
  std::atomic<float> level_{0.0f};
  std::atomic<float> unread_{0.0f};
  float resetValue_ = 0.0f;
  int32_t count_ = 0;
  int32_t limit_ = 0;
  bool hold_ = false;
};
