#pragma once

#include <algorithm>
#include <cstdint>
#include <utility>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

// Runs a stereo pair through a plug-in at 48 kHz in host blocks of `block`, after setting
// parameters (index, working value); the two outputs.
using KStereo = std::pair<std::vector<float>, std::vector<float>>;

inline KStereo KRenderStereo(KAudioPlugin& plugin, const KStereo& in, const std::vector<std::pair<int32_t, double>>& settings,
                             int32_t block = 512) {
  plugin.SetSampleRate(48000.0);
  for (auto [index, value] : settings) plugin.GetParameter(index).SetWorking(value);
  KStereo out{std::vector<float>(in.first.size()), std::vector<float>(in.first.size())};
  for (size_t at = 0; at < in.first.size(); at += static_cast<size_t>(block)) {
    const float* i[] = {in.first.data() + at, in.second.data() + at};
    float* o[] = {out.first.data() + at, out.second.data() + at};
    plugin.ProcessHostBlock(i, o, static_cast<int32_t>(std::min<size_t>(static_cast<size_t>(block), in.first.size() - at)));
  }
  return out;
}

// An impulse of 1 at sample 0 in both channels (or the left only), then silence.
inline KStereo KImpulse(size_t length, bool leftOnly = false) {
  KStereo s{std::vector<float>(length), std::vector<float>(length)};
  std::fill_n(s.first.begin(), std::min<size_t>(length, 1), 1.0f);
  std::fill_n(s.second.begin(), std::min<size_t>(length, leftOnly ? 0 : 1), 1.0f);
  return s;
}

// The index of the first sample that is not exactly zero, or the length.
inline size_t KFirstSound(const std::vector<float>& s) {
  return static_cast<size_t>(std::find_if(s.begin(), s.end(), [](float v) { return v != 0.0f; }) - s.begin());
}

inline double KEnergy(const std::vector<float>& s, size_t from, size_t to) {
  double e = 0.0;
  for (size_t i = from; i < std::min(to, s.size()); ++i) e += static_cast<double>(s[i]) * s[i];
  return e;
}
