#pragma once

#include <cstdint>
#include <vector>

// Splits a signal into 2 to 6 bands at ascending crossover frequencies, with fourth-order
// Linkwitz-Riley crossovers: two Butterworth sections down, two up. A low and a high half of one
// crossover sum to that crossover's second-order all-pass, so each band below a crossover also
// passes that all-pass; then every band carries the same phase turn and the bands sum to an
// all-pass of the input: a flat magnitude with no notch or bump at a crossover.
//
// Prepare allocates; everything else runs on the audio thread without allocating, locking or
// throwing. Arithmetic is double; the bands come out as float.
class KMultibandSplitter {
public:
  static constexpr int32_t kMinBands = 2;
  static constexpr int32_t kMaxBands = 6;
  static constexpr int32_t kMaxCrossovers = kMaxBands - 1;
  static constexpr int32_t kMaxChannels = 16;
  // Crossovers are kept within these limits, and each at least at the one below it.
  static constexpr double kLowestFrequency = 10.0;
  static constexpr double kHighestShare = 0.45;  // of the sample rate

  // Room for blocks of up to `maxFrames` samples; clears the state.
  void Prepare(int32_t maxFrames);
  // `bands` (clamped to 2..6) bands with bands − 1 crossovers from `frequencies` in Hz. A new
  // design with the same band count keeps the filters' state, so that a moving crossover does
  // not restart the bands from silence.
  void SetCrossovers(const double* frequencies, int32_t bands, double sampleRate) noexcept;
  int32_t BandCount() const noexcept { return bands_; }
  // The frequency crossover `k` was designed at, after the limits.
  double Crossover(int32_t k) const noexcept { return frequencies_[k]; }
  void Reset() noexcept;
  // Samples after which every band's impulse response has fallen below `fall` of its start:
  // no band's path passes more than two sections of any crossover, all with the same poles.
  uint32_t RingSamples(double fall) const noexcept;

  // Splits `frames` samples (at most the prepared length) of `channel` (below kMaxChannels)
  // into BandCount() buffers, the lowest band first. A NaN or infinity spoils the rest of its
  // block only: state it reached, and state too small to matter, is cleared after each block.
  void Process(int32_t channel, const float* input, float* const* bands, int32_t frames) noexcept;

  // The five coefficients of one section (b0, −a1, b1, −a2, b2) and its two states.
  struct Section {
    double b0 = 1.0, minusA1 = 0.0, b1 = 0.0, minusA2 = 0.0, b2 = 0.0;
  };
  struct State {
    double s1 = 0.0, s2 = 0.0;
  };

private:
  // Each crossover's low half twice, high half twice; then, per band below it, its all-pass.
  enum : int32_t { kLow1, kLow2, kHigh1, kHigh2, kSplitSections };
  struct ChannelState {
    State split[kMaxCrossovers][kSplitSections];
    State phase[kMaxBands][kMaxCrossovers];  // [band][crossover whose all-pass it passes]
  };

  // One crossover over a block: its low half, through the `Turns` all-passes of the crossovers
  // above, becomes a band; its high half stays in `rest` for the next. With the count known
  // while compiling, every state can live in a register and the sample loop carries no tests.
  template <int Turns>
  static void Split(const KMultibandSplitter& self, int32_t k, ChannelState& state, double* rest, float* out,
                    int32_t frames) noexcept;
  void Settle(ChannelState& state) noexcept;

  int32_t bands_ = kMinBands;
  int32_t maxFrames_ = 0;
  double frequencies_[kMaxCrossovers] = {};
  Section low_[kMaxCrossovers], high_[kMaxCrossovers], allPass_[kMaxCrossovers];
  ChannelState channels_[kMaxChannels];
  std::vector<double> rest_;  // what is left above the crossovers so far
};
