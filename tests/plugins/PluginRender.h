#pragma once

#include <algorithm>
#include <cmath>
#include <vector>

#include "core/KAudioPlugin.h"

// Channels of samples, and a plug-in played over them as a host plays it.
using KChannels = std::vector<std::vector<float>>;

// Runs `input` through `plugin` in host blocks of `block` samples.
inline KChannels KRender(KAudioPlugin& plugin, const KChannels& input, size_t block = 512) {
  KChannels output(static_cast<size_t>(plugin.OutputChannelCount()), std::vector<float>(input[0].size(), 99.0f));
  for (size_t start = 0; start < input[0].size(); start += block) {
    std::vector<const float*> in;
    std::vector<float*> out;
    for (const std::vector<float>& channel : input) in.push_back(channel.data() + start);
    for (std::vector<float>& channel : output) out.push_back(channel.data() + start);
    plugin.ProcessHostBlock(in.data(), out.data(), static_cast<int32_t>(std::min(block, input[0].size() - start)));
  }
  return output;
}

// `n` samples of a sine of `hz` at 48 kHz with peaks at `amplitude`, starting at `phase`.
inline std::vector<float> KSine(size_t n, double hz, double amplitude, double phase = 0.0) {
  std::vector<float> x(n);
  for (size_t i = 0; i < n; ++i) x[i] = static_cast<float>(amplitude * std::sin(6.283185307179586 * hz * static_cast<double>(i) / 48000.0 + phase));
  return x;
}

inline double KRms(const std::vector<float>& x, size_t from = 0) {
  double sum = 0.0;
  for (size_t i = from; i < x.size(); ++i) sum += static_cast<double>(x[i]) * x[i];
  return std::sqrt(sum / static_cast<double>(x.size() - from));
}
