#pragma once

#include <cstdint>

#include "dsp/KFilterSection.h"

// Runs a cascade of filter sections over the channels of float buffers, in double precision and
// transposed direct form II, one state per section and channel. Channels go through in pairs,
// two per register. Nothing here allocates, locks or throws, so it belongs on the audio thread.
class KSectionRunner {
public:
  static constexpr int32_t kMaxSections = 8;
  static constexpr int32_t kMaxChannels = 16;

  // Coefficients in the record's order (b0, −a1, b1, −a2, b2), and the two state values of
  // every section with one channel per column, so that a channel pair's state is contiguous.
  using Coefficients = double[kMaxSections][5];
  using State = double[kMaxSections][2][kMaxChannels];
  using Kernel = void (*)(const Coefficients& k, State& state, int32_t channel, const float* const* inputs,
                          float* const* outputs, int32_t frames) noexcept;

  KSectionRunner() noexcept;

  // Runs the first `count` sections in series (count clamped to 0..kMaxSections; none copies
  // the input). A redesign keeps the state of its position so that it does not click; positions
  // newly taken into use start from silence.
  void SetSections(const KFilterSection* sections, int32_t count) noexcept;
  int32_t SectionCount() const noexcept { return count_; }

  void Reset() noexcept;

  // Filters `frames` samples of each channel; channels beyond kMaxChannels are left alone. An
  // output may be its own input's buffer. A NaN or infinity spoils the rest of its block only.
  void Process(const float* const* inputs, float* const* outputs, int32_t channels, int32_t frames) noexcept;

private:
  void Settle(int32_t channels) noexcept;

  Kernel single_;
  Kernel pair_;
  int32_t count_ = 0;
  Coefficients coefficients_ = {};
  State state_ = {};
};
