#pragma once

#include <cstdint>

#include "dsp/KFilterSection.h"
#include "dsp/KGlide.h"

// Runs a cascade of filter sections, then an output gain, over the channels of float buffers,
// in double precision and transposed direct form II, one state per section and channel.
// Channels go through in pairs, two per register. Nothing here allocates, locks or throws, so
// it belongs on the audio thread.
//
// A new design either lands at once (SetSections) or glides there (Aim): every coefficient and
// the gain travel in a straight line, sample by sample. Second-order sections are stable exactly
// when (a1, a2) lies in a triangle, which is convex, so every point on the way between two stable
// designs is stable too. A section that is exactly flat (numerator equal to denominator, as a
// peak or shelf at 0 dB is designed) at both ends of its way, and whose state has died away,
// leaves the cascade: it would pass its input unchanged anyway.
class KSectionRunner {
public:
  static constexpr int32_t kMaxSections = 8;
  static constexpr int32_t kMaxChannels = 16;
  static constexpr int32_t kGain = 5 * kMaxSections;  // the gain's place after the coefficients

  // The coefficients of one section in the record's order (b0, −a1, b1, −a2, b2).
  using Row = double[5];
  static constexpr Row kPassThrough = {1.0, 0.0, 0.0, 0.0, 0.0};
  // Every section's coefficients in position order, then the output gain.
  using Glide = KGlide<kGain + 1>;
  // The two state values of every section with one channel per column, so that a channel pair's
  // state is contiguous.
  using State = double[kMaxSections][2][kMaxChannels];
  using Kernel = void (*)(KSectionRunner& runner, int32_t channel, const float* const* inputs, float* const* outputs,
                          int32_t frames) noexcept;

  KSectionRunner() noexcept;

  // Runs the designs of `sections` at positions 0..count − 1 from the next sample on, at unity
  // gain (count clamped to 0..kMaxSections; none copies the input). A redesign keeps the state
  // of its position so that it does not click; positions newly taken into use start from silence.
  void SetSections(const KFilterSection* sections, int32_t count) noexcept;
  // Heads for the rows and the gain over `samples` samples, or lands at once when `jump` is set;
  // the same targets again let a glide go on as it was.
  void Aim(const Row* rows, int32_t count, double gain, int32_t samples, bool jump) noexcept;
  int32_t SectionCount() const noexcept { return count_; }
  // Sections in the cascade now, and samples until a glide ends.
  int32_t EngagedCount() const noexcept { return engagedCount_; }
  int32_t GlideLeft() const noexcept { return glide_.left; }

  void Reset() noexcept;

  // Samples after which the impulse response of `count` sections in series has fallen below
  // `fall` of its start, taking each section's slowest pole; flat sections ring not at all.
  // UINT32_MAX for a section that is not stable.
  static uint32_t RingSamples(const Row* rows, int32_t count, double fall) noexcept;

  // Filters `frames` samples of each channel; channels beyond kMaxChannels are left alone. An
  // output may be its own input's buffer. A NaN or infinity spoils the rest of its block only.
  void Process(const float* const* inputs, float* const* outputs, int32_t channels, int32_t frames) noexcept;

private:
  template <class Lanes, int Count, bool Gliding>
  friend struct KCascade;

  void Run(bool gliding, const float* const* inputs, float* const* outputs, int32_t channels, int32_t frames) noexcept;
  // Chooses the sections that run: every one not flat on its way or at rest, and every flat
  // one still ringing from before.
  void Engage() noexcept;
  void Settle(int32_t channels) noexcept;

  Glide glide_;
  double next_[kGain + 1] = {};  // where a gliding run leaves the values
  State state_ = {};
  int32_t engaged_[kMaxSections] = {};  // the positions in the cascade, in order
  int32_t engagedCount_ = 0;
  int32_t count_ = 0;
  bool ringing_ = false;  // a flat section still rings: look again after the next block
};
