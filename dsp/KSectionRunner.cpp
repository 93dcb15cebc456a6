#include "dsp/KSectionRunner.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include "dsp/KDoubleLanes.h"

namespace {

enum Coefficient { kB0, kMinusA1, kB1, kMinusA2, kB2 };

// State below this (−400 dB) is taken as silence; clearing it keeps denormals out.
constexpr double kSilent = 1e-20;
// A flat section whose state has fallen below this leaves the cascade; the ringing it drops is
// 180 dB down, far under the last bit of any float sample one could hear.
constexpr double kResidue = 1e-9;

// Exactly unity at every frequency: the numerator equals the denominator (1, a1, a2). A straight
// glide between two flat designs stays flat, because the steps of b1 and −a1 (and of b2 and −a2)
// are exact negatives.
bool Flat(const double* k) noexcept { return k[kB0] == 1.0 && k[kB1] == -k[kMinusA1] && k[kB2] == -k[kMinusA2]; }

template <class Lanes>
double FirstLane(typename Lanes::Value v) noexcept {
  double lanes[2];
  Lanes::Store(lanes, v);
  return lanes[0];
}

}  // namespace

// One group of Lanes channels through a cascade of a fixed number of sections and the gain. With
// the count known at compile time the sections unroll and their state can live in registers;
// the sample loop then carries no tests at all. Gliding adds each coefficient's step before the
// sample that uses it and leaves the values reached in next_, alike for every channel group.
template <class Lanes, int Count, bool Gliding>
struct KCascade {
  static void Run(KSectionRunner& r, int32_t channel, const float* const* inputs, float* const* outputs,
                  int32_t frames) noexcept {
    using V = typename Lanes::Value;
    constexpr int kSlots = Count > 0 ? Count : 1;
    const double* value = r.glide_.value;
    const double* step = r.glide_.step;
    V c[kSlots][5], d[kSlots][5], s1[kSlots], s2[kSlots];
    for (int j = 0; j < Count; ++j) {
      const int32_t at = r.engaged_[j];
      for (int m = 0; m < 5; ++m) {
        c[j][m] = Lanes::Splat(value[5 * at + m]);
        if constexpr (Gliding) d[j][m] = Lanes::Splat(step[5 * at + m]);
      }
      s1[j] = Lanes::Load(&r.state_[at][0][channel]);
      s2[j] = Lanes::Load(&r.state_[at][1][channel]);
    }
    V gain = Lanes::Splat(value[KSectionRunner::kGain]);
    const V gainStep = Lanes::Splat(step[KSectionRunner::kGain]);
    const float* const* in = inputs + channel;
    float* const* out = outputs + channel;
    for (int32_t i = 0; i < frames; ++i) {
      V x = Lanes::Read(in, i);
      for (int j = 0; j < Count; ++j) {
        if constexpr (Gliding)
          for (int m = 0; m < 5; ++m) c[j][m] = c[j][m] + d[j][m];
        const V y = c[j][kB0] * x + s1[j];
        s1[j] = c[j][kB1] * x + s2[j] + c[j][kMinusA1] * y;
        s2[j] = c[j][kB2] * x + c[j][kMinusA2] * y;
        x = y;
      }
      if constexpr (Gliding) gain = gain + gainStep;
      Lanes::Write(out, i, gain * x);
    }
    for (int j = 0; j < Count; ++j) {
      const int32_t at = r.engaged_[j];
      Lanes::Store(&r.state_[at][0][channel], s1[j]);
      Lanes::Store(&r.state_[at][1][channel], s2[j]);
      if constexpr (Gliding)
        for (int m = 0; m < 5; ++m) r.next_[5 * at + m] = FirstLane<Lanes>(c[j][m]);
    }
    if constexpr (Gliding) r.next_[KSectionRunner::kGain] = FirstLane<Lanes>(gain);
  }
};

namespace {

// The kernels for every engaged count from 0 to kMaxSections, indexed by the count.
template <class Lanes, bool Gliding, size_t... counts>
constexpr std::array<KSectionRunner::Kernel, sizeof...(counts)> Kernels(std::index_sequence<counts...>) {
  return {KCascade<Lanes, static_cast<int>(counts), Gliding>::Run...};
}
constexpr auto kCounts = std::make_index_sequence<KSectionRunner::kMaxSections + 1>();
// Indexed [gliding][channel pair].
constexpr std::array<std::array<std::array<KSectionRunner::Kernel, KSectionRunner::kMaxSections + 1>, 2>, 2> kKernels = {{
    {{Kernels<KDoubleLanes<1>, false>(kCounts), Kernels<KDoubleLanes<2>, false>(kCounts)}},
    {{Kernels<KDoubleLanes<1>, true>(kCounts), Kernels<KDoubleLanes<2>, true>(kCounts)}},
}};

}  // namespace

KSectionRunner::KSectionRunner() noexcept { Aim(nullptr, 0, 1.0, 0, true); }

void KSectionRunner::SetSections(const KFilterSection* sections, int32_t count) noexcept {
  count = std::clamp(count, 0, kMaxSections);
  Row rows[kMaxSections];
  for (int32_t j = 0; j < count; ++j) {
    const double row[5] = {sections[j].b0, sections[j].minusA1, sections[j].b1, sections[j].minusA2, sections[j].b2};
    std::copy_n(row, 5, rows[j]);
  }
  Aim(rows, count, 1.0, 0, true);
}

void KSectionRunner::Aim(const Row* rows, int32_t count, double gain, int32_t samples, bool jump) noexcept {
  count = std::clamp(count, 0, kMaxSections);
  double to[kGain + 1];
  for (int32_t j = 0; j < kMaxSections; ++j) std::copy_n(j < count ? rows[j] : kPassThrough, 5, to + 5 * j);
  to[kGain] = gain;
  for (int32_t j = count_; j < count; ++j) std::memset(state_[j], 0, sizeof state_[j]);
  count_ = count;
  glide_.Aim(to, samples, jump);
  Engage();
}

void KSectionRunner::Engage() noexcept {
  engagedCount_ = 0;
  ringing_ = false;
  for (int32_t j = 0; j < count_; ++j) {
    double ringing = 0.0;
    for (const auto& row : state_[j])
      for (double s : row) ringing = std::max(ringing, std::abs(s));
    const bool flat = Flat(glide_.value + 5 * j) && Flat(glide_.target + 5 * j);
    if (!flat || ringing > kResidue) {
      engaged_[engagedCount_++] = j;
      ringing_ = ringing_ || Flat(glide_.target + 5 * j);  // it will fall silent and leave
    } else {
      std::memset(state_[j], 0, sizeof state_[j]);
    }
  }
}

uint32_t KSectionRunner::RingSamples(const Row* rows, int32_t count, double fall) noexcept {
  double samples = 0.0;
  for (int32_t j = 0; j < count; ++j) {
    const double* k = rows[j];
    if (Flat(k)) continue;
    // Poles: roots of z² + a1·z + a2, with a1 = −(−a1) and a2 = −(−a2) as stored.
    const double a1 = -k[kMinusA1], a2 = -k[kMinusA2];
    const double discriminant = a1 * a1 - 4.0 * a2;
    const double root = std::sqrt(std::abs(discriminant));
    const double radius = discriminant < 0.0 ? std::sqrt(a2) : std::max(std::abs(-a1 + root), std::abs(-a1 - root)) / 2.0;
    if (!(radius < 1.0)) return UINT32_MAX;
    samples += 2.0 + (radius > 0.0 ? std::log(fall) / std::log(radius) : 0.0);  // two for the numerator's taps
  }
  return samples < 4e9 ? static_cast<uint32_t>(std::ceil(samples)) : UINT32_MAX;
}

void KSectionRunner::Reset() noexcept {
  std::memset(state_, 0, sizeof state_);
  Engage();
}

void KSectionRunner::Process(const float* const* inputs, float* const* outputs, int32_t channels,
                             int32_t frames) noexcept {
  if (frames <= 0) return;
  channels = std::min(channels, kMaxChannels);
  const int32_t gliding = std::min(glide_.left, frames);
  if (gliding > 0) {
    Run(true, inputs, outputs, channels, gliding);
    for (int32_t j = 0; j < engagedCount_; ++j) std::copy_n(next_ + 5 * engaged_[j], 5, glide_.value + 5 * engaged_[j]);
    glide_.value[kGain] = next_[kGain];
    glide_.Passed(gliding);
  }
  if (gliding < frames) {
    const float* in[kMaxChannels];
    float* out[kMaxChannels];
    for (int32_t c = 0; c < channels; ++c) {
      in[c] = inputs[c] + gliding;
      out[c] = outputs[c] + gliding;
    }
    Run(false, in, out, channels, frames - gliding);
  }
  Settle(channels);
  if (ringing_) Engage();
}

void KSectionRunner::Run(bool gliding, const float* const* inputs, float* const* outputs, int32_t channels,
                         int32_t frames) noexcept {
  const auto& kernels = kKernels[gliding ? 1 : 0];
  const Kernel pair = kernels[1][static_cast<size_t>(engagedCount_)];
  int32_t c = 0;
  for (; c + 1 < channels; c += 2) pair(*this, c, inputs, outputs, frames);
  if (c < channels) kernels[0][static_cast<size_t>(engagedCount_)](*this, c, inputs, outputs, frames);
}

// Once per block: state too small to hear becomes exactly zero, so that silence decays to
// zero instead of lingering in slow denormals, and state that a NaN or infinity reached
// starts again from silence instead of poisoning every later block.
void KSectionRunner::Settle(int32_t channels) noexcept {
  for (int32_t j = 0; j < engagedCount_; ++j) {
    for (auto& row : state_[engaged_[j]]) {
      for (int32_t c = 0; c < channels; ++c) {
        const double magnitude = std::abs(row[c]);
        if (!(magnitude >= kSilent && magnitude <= std::numeric_limits<double>::max())) row[c] = 0.0;
      }
    }
  }
}
