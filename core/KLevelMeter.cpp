#include "core/KLevelMeter.h"

#include <immintrin.h>

#include <cmath>

namespace {
// maxps answers its second operand when either is NaN: with the running peak second, a NaN
// sample is skipped.
float Reduce(__m128 top) noexcept {
  top = _mm_max_ps(top, _mm_movehl_ps(top, top));
  return _mm_cvtss_f32(_mm_max_ss(top, _mm_shuffle_ps(top, top, 1)));
}

// Sixteen samples at a time in four registers, so that no compare waits for the one before.
float PeakNarrow(const float* samples, int32_t n, float peak) noexcept {
  const __m128 sign = _mm_set1_ps(-0.0f);
  int32_t i = 0;
  if (n >= 16) {
    __m128 a = _mm_set1_ps(peak), b = a, c = a, d = a;
    for (; i + 16 <= n; i += 16) {
      a = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i)), a);
      b = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 4)), b);
      c = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 8)), c);
      d = _mm_max_ps(_mm_andnot_ps(sign, _mm_loadu_ps(samples + i + 12)), d);
    }
    peak = Reduce(_mm_max_ps(_mm_max_ps(a, b), _mm_max_ps(c, d)));
  }
  for (; i < n; ++i) {
    const float magnitude = std::fabs(samples[i]);
    peak = magnitude > peak ? magnitude : peak;
  }
  return peak;
}

// Thirty-two samples at a time; what is left over goes the narrow way.
[[gnu::target("avx")]] float PeakWide(const float* samples, int32_t n, float peak) noexcept {
  if (n < 32) return PeakNarrow(samples, n, peak);
  const __m256 sign = _mm256_set1_ps(-0.0f);
  __m256 a = _mm256_set1_ps(peak), b = a, c = a, d = a;
  int32_t i = 0;
  for (; i + 32 <= n; i += 32) {
    a = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(samples + i)), a);
    b = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(samples + i + 8)), b);
    c = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(samples + i + 16)), c);
    d = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(samples + i + 24)), d);
  }
  const __m256 top = _mm256_max_ps(_mm256_max_ps(a, b), _mm256_max_ps(c, d));
  const __m128 half = _mm_max_ps(_mm256_castps256_ps128(top), _mm256_extractf128_ps(top, 1));
  _mm256_zeroupper();  // code without AVX after this must not pay for the upper halves
  peak = Reduce(half);
  return i < n ? PeakNarrow(samples + i, n - i, peak) : peak;
}
void PeakPairNarrow(const float* l, const float* r, int32_t n, float (&peaks)[2]) noexcept {
  peaks[0] = PeakNarrow(l, n, peaks[0]);
  peaks[1] = PeakNarrow(r, n, peaks[1]);
}

// Sixteen samples of each channel at a time in two registers each, and one reduction for both.
[[gnu::target("avx")]] void PeakPairWide(const float* l, const float* r, int32_t n, float (&peaks)[2]) noexcept {
  if (n < 16) return PeakPairNarrow(l, r, n, peaks);
  const __m256 sign = _mm256_set1_ps(-0.0f);
  __m256 a = _mm256_set1_ps(peaks[0]), b = a, c = _mm256_set1_ps(peaks[1]), d = c;
  int32_t i = 0;
  for (; i + 16 <= n; i += 16) {
    a = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(l + i)), a);
    b = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(l + i + 8)), b);
    c = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(r + i)), c);
    d = _mm256_max_ps(_mm256_andnot_ps(sign, _mm256_loadu_ps(r + i + 8)), d);
  }
  const __m256 left = _mm256_max_ps(a, b), right = _mm256_max_ps(c, d);
  const __m128 x = _mm_max_ps(_mm256_castps256_ps128(left), _mm256_extractf128_ps(left, 1));
  const __m128 y = _mm_max_ps(_mm256_castps256_ps128(right), _mm256_extractf128_ps(right, 1));
  _mm256_zeroupper();
  // Lanes 0 and 1 of each side against lanes 2 and 3, then neighbours: left in lane 0, right in 2.
  __m128 m = _mm_max_ps(_mm_shuffle_ps(x, y, _MM_SHUFFLE(1, 0, 1, 0)), _mm_shuffle_ps(x, y, _MM_SHUFFLE(3, 2, 3, 2)));
  m = _mm_max_ps(m, _mm_shuffle_ps(m, m, _MM_SHUFFLE(2, 3, 0, 1)));
  peaks[0] = _mm_cvtss_f32(m);
  peaks[1] = _mm_cvtss_f32(_mm_movehl_ps(m, m));
  if (i < n) PeakPairNarrow(l + i, r + i, n - i, peaks);
}
}  // namespace

void KLevelMeter::PeakPair(const float* l, const float* r, int32_t n, float (&peaks)[2]) noexcept {
  static const auto chosen = __builtin_cpu_supports("avx") ? PeakPairWide : PeakPairNarrow;
  chosen(l, r, n, peaks);
}

float KLevelMeter::Peak(const float* samples, int32_t n, float peak) noexcept {
  static const auto chosen = __builtin_cpu_supports("avx") ? PeakWide : PeakNarrow;
  return chosen(samples, n, peak);
}
