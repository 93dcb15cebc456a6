#pragma once

#include <algorithm>
#include <cmath>
#include <complex>
#include <numbers>
#include <initializer_list>
#include <span>
#include <vector>

#include "core/KAudioPlugin.h"

using Channels = std::vector<std::vector<float>>;

// Plays `in` (one row per input channel) through `plugin` in host blocks whose sizes cycle
// through `sizes`, calling `beforeBlock(at)` ahead of the block that starts at sample `at`; one
// row per output channel comes back.
template <class BeforeBlock>
Channels RenderWith(KAudioPlugin& plugin, const Channels& in, std::span<const int32_t> sizes, BeforeBlock beforeBlock) {
  const size_t length = in.empty() ? 0 : in[0].size();
  Channels out(static_cast<size_t>(plugin.OutputChannelCount()), std::vector<float>(length));
  std::vector<const float*> x(in.size());
  std::vector<float*> y(out.size());
  for (size_t at = 0, k = 0; at < length; ++k) {
    const auto n = std::min<size_t>(static_cast<size_t>(sizes[k % sizes.size()]), length - at);
    for (size_t c = 0; c < in.size(); ++c) x[c] = in[c].data() + at;
    for (size_t c = 0; c < out.size(); ++c) y[c] = out[c].data() + at;
    beforeBlock(at);
    plugin.ProcessHostBlock(x.data(), y.data(), static_cast<int32_t>(n));
    at += n;
  }
  return out;
}

inline Channels Render(KAudioPlugin& plugin, const Channels& in, std::initializer_list<int32_t> sizes) {
  return RenderWith(plugin, in, std::span(sizes.begin(), sizes.size()), [](size_t) {});
}

// `channels` rows of a sine of `amplitude` at `hz` (48 kHz), from sample `from` to `to`.
inline Channels Sine(size_t channels, size_t length, double hz, double amplitude, size_t from = 0, size_t to = SIZE_MAX) {
  Channels rows(channels, std::vector<float>(length));
  for (auto& row : rows)
    for (size_t i = from; i < std::min(length, to); ++i) row[i] = static_cast<float>(amplitude * std::sin(2.0 * std::numbers::pi * hz * static_cast<double>(i) / 48000.0));
  return rows;
}

// The amplitude of the component at `hz` in samples [from, to) of `row` (48 kHz): a single
// frequency of the transform, over whole periods for a steady tone.
inline double Amplitude(const std::vector<float>& row, double hz, size_t from, size_t to) {
  std::complex<double> sum;
  for (size_t i = from; i < to; ++i) sum += static_cast<double>(row[i]) * std::polar(1.0, -2.0 * std::numbers::pi * hz * static_cast<double>(i) / 48000.0);
  return 2.0 * std::abs(sum) / static_cast<double>(to - from);
}

// The largest magnitude in samples [from, to) of every row.
inline float PeakOf(const Channels& rows, size_t from, size_t to) {
  float peak = 0.0f;
  for (const auto& row : rows)
    for (size_t i = from; i < std::min(to, row.size()); ++i) peak = std::max(peak, std::abs(row[i]));
  return peak;
}
