#pragma once

#include <emmintrin.h>

#include <cstdint>

// Channels that run through one instruction stream, one per lane of a double-precision value.
// Per-sample kernels are written once over KDoubleLanes<N> and instantiated for a lone channel
// and for a pair, whose two channels then cost about as much as one.
template <int N>
struct KDoubleLanes;

template <>
struct KDoubleLanes<1> {
  using Value = double;

  static double Splat(double x) noexcept { return x; }
  static double Load(const double* lanes) noexcept { return lanes[0]; }
  static void Store(double* lanes, double v) noexcept { lanes[0] = v; }
  static double Read(const float* const* channels, int32_t i) noexcept { return channels[0][i]; }
  static void Write(float* const* channels, int32_t i, double v) noexcept { channels[0][i] = static_cast<float>(v); }
};

// Two doubles in one SSE2 register (the x86-64 baseline).
struct KDoublePair {
  __m128d v;

  friend KDoublePair operator+(KDoublePair a, KDoublePair b) noexcept { return {_mm_add_pd(a.v, b.v)}; }
  friend KDoublePair operator*(KDoublePair a, KDoublePair b) noexcept { return {_mm_mul_pd(a.v, b.v)}; }
};

template <>
struct KDoubleLanes<2> {
  using Value = KDoublePair;

  static KDoublePair Splat(double x) noexcept { return {_mm_set1_pd(x)}; }
  static KDoublePair Load(const double* lanes) noexcept { return {_mm_loadu_pd(lanes)}; }
  static void Store(double* lanes, KDoublePair v) noexcept { _mm_storeu_pd(lanes, v.v); }
  static KDoublePair Read(const float* const* channels, int32_t i) noexcept {
    return {_mm_set_pd(channels[1][i], channels[0][i])};
  }
  static void Write(float* const* channels, int32_t i, KDoublePair v) noexcept {
    channels[0][i] = static_cast<float>(_mm_cvtsd_f64(v.v));
    channels[1][i] = static_cast<float>(_mm_cvtsd_f64(_mm_unpackhi_pd(v.v, v.v)));
  }
};
