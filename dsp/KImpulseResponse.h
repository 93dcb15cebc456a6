#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "kernel/KString.h"

// An impulse response: one channel or more of taps at one sample rate.
struct KImpulseResponse {
  // Longer files are refused: a reverb of this length is already more than any room.
  static constexpr double kMaxSeconds = 30.0;

  double sampleRate = 0.0;
  std::vector<std::vector<float>> channels;

  int32_t Length() const noexcept { return channels.empty() ? 0 : static_cast<int32_t>(channels.front().size()); }
};

// Reads a WAV or FLAC file (anything libsndfile reads) and resamples it to `sampleRate`.
// Reads files and allocates: never on the audio thread. KException, with a sentence naming the
// file, when it cannot be read, holds no samples or is too long.
KImpulseResponse KReadImpulseResponse(const KString& path, double sampleRate);

// The response's envelope for pictures: the peak over every channel in each of `slices` even
// slices of its length, in dB below the loudest slice's (0 there; −180 for a silent slice).
std::vector<double> KImpulseEnvelope(const KImpulseResponse& response, int32_t slices);

// The same response at another rate (band-limited sinc interpolation from libsamplerate), its
// energy per second kept, so that a reverb sounds equally loud at any rate.
KImpulseResponse KResampleImpulseResponse(const KImpulseResponse& response, double sampleRate);
