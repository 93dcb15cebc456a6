#include "dsp/KSectionRunner.h"

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include "dsp/KDoubleLanes.h"

namespace {

enum Coefficient { kB0, kMinusA1, kB1, kMinusA2, kB2 };

// State below this (−400 dB) is taken as silence; clearing it keeps denormals out.
constexpr double kSilent = 1e-20;

// One group of Lanes channels through a cascade of a fixed number of sections. With the count
// known at compile time the sections unroll and their state can live in registers; the sample
// loop then carries no tests at all.
template <class Lanes, int Sections>
void RunCascade(const KSectionRunner::Coefficients& k, KSectionRunner::State& state, int32_t channel,
                const float* const* inputs, float* const* outputs, int32_t frames) noexcept {
  using V = typename Lanes::Value;
  std::array<std::array<V, 5>, Sections> c;
  std::array<V, Sections> s1, s2;
  for (int j = 0; j < Sections; ++j) {
    for (int m = 0; m < 5; ++m) c[j][m] = Lanes::Splat(k[j][m]);
    s1[j] = Lanes::Load(&state[j][0][channel]);
    s2[j] = Lanes::Load(&state[j][1][channel]);
  }
  const float* const* in = inputs + channel;
  float* const* out = outputs + channel;
  for (int32_t i = 0; i < frames; ++i) {
    V x = Lanes::Read(in, i);
    for (int j = 0; j < Sections; ++j) {
      const V y = c[j][kB0] * x + s1[j];
      s1[j] = c[j][kB1] * x + s2[j] + c[j][kMinusA1] * y;
      s2[j] = c[j][kB2] * x + c[j][kMinusA2] * y;
      x = y;
    }
    Lanes::Write(out, i, x);
  }
  for (int j = 0; j < Sections; ++j) {
    Lanes::Store(&state[j][0][channel], s1[j]);
    Lanes::Store(&state[j][1][channel], s2[j]);
  }
}

// The kernels for every section count from 0 to kMaxSections, indexed by the count.
template <class Lanes, size_t... counts>
constexpr std::array<KSectionRunner::Kernel, sizeof...(counts)> Kernels(std::index_sequence<counts...>) {
  return {RunCascade<Lanes, static_cast<int>(counts)>...};
}
constexpr auto kCounts = std::make_index_sequence<KSectionRunner::kMaxSections + 1>();
constexpr auto kSingleKernels = Kernels<KDoubleLanes<1>>(kCounts);
constexpr auto kPairKernels = Kernels<KDoubleLanes<2>>(kCounts);

}  // namespace

KSectionRunner::KSectionRunner() noexcept : single_(kSingleKernels[0]), pair_(kPairKernels[0]) {}

void KSectionRunner::SetSections(const KFilterSection* sections, int32_t count) noexcept {
  count = count < 0 ? 0 : (count > kMaxSections ? kMaxSections : count);
  for (int32_t j = 0; j < count; ++j) {
    double* k = coefficients_[j];
    k[kB0] = sections[j].b0;
    k[kMinusA1] = sections[j].minusA1;
    k[kB1] = sections[j].b1;
    k[kMinusA2] = sections[j].minusA2;
    k[kB2] = sections[j].b2;
  }
  for (int32_t j = count_; j < count; ++j) std::memset(state_[j], 0, sizeof state_[j]);
  count_ = count;
  single_ = kSingleKernels[static_cast<size_t>(count)];
  pair_ = kPairKernels[static_cast<size_t>(count)];
}

void KSectionRunner::Reset() noexcept { std::memset(state_, 0, sizeof state_); }

void KSectionRunner::Process(const float* const* inputs, float* const* outputs, int32_t channels,
                             int32_t frames) noexcept {
  if (frames <= 0) return;
  if (channels > kMaxChannels) channels = kMaxChannels;
  int32_t c = 0;
  for (; c + 1 < channels; c += 2) pair_(coefficients_, state_, c, inputs, outputs, frames);
  if (c < channels) single_(coefficients_, state_, c, inputs, outputs, frames);
  Settle(channels);
}

// Once per block: state too small to hear becomes exactly zero, so that silence decays to
// zero instead of lingering in slow denormals, and state that a NaN or infinity reached
// starts again from silence instead of poisoning every later block.
void KSectionRunner::Settle(int32_t channels) noexcept {
  for (int32_t j = 0; j < count_; ++j) {
    for (auto& row : state_[j]) {
      for (int32_t c = 0; c < channels; ++c) {
        const double magnitude = std::abs(row[c]);
        if (!(magnitude >= kSilent && magnitude <= std::numeric_limits<double>::max())) row[c] = 0.0;
      }
    }
  }
}
