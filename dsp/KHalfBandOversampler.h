#pragma once

#include <cstdint>

// Raises one channel to 2 or 4 times its sample rate and brings it back, so that a nonlinearity
// can run where its new harmonics do not fold back into the audio band.
//
// Each doubling is a linear-phase half-band FIR (a Kaiser-windowed sinc): every second tap is
// zero and the centre tap is 1/2, so one polyphase branch of the interpolator is a plain delay
// and the other a symmetric sum of tap pairs. The first doubling keeps 20 kHz of a 44.1 kHz
// stream (0.4535 of the base rate) flat to ±0.0005 dB and cuts everything from 0.5465 of the
// base rate on by 85 dB; the second needs only a wide transition and cuts its stop band by 93 dB.
// Coefficients are computed on construction.
//
// A round trip Up → Down delays the signal by Latency() samples of the base rate, a whole
// number: with 4x the outer decimator takes the other polyphase phase, which absorbs the odd
// delay of the inner pair. Processing allocates nothing, locks nothing and throws nothing.
class KHalfBandOversampler {
public:
  // Tap pairs of each doubling: the first sets the audio band's edge and the latency, the second
  // only has to clear the first one's images.
  static constexpr int32_t kOuterPairs = 29;
  static constexpr int32_t kInnerPairs = 7;

  // Factor 1, 2 or 4 (anything else is taken as 1); starts from silence.
  explicit KHalfBandOversampler(int32_t factor = 2) noexcept;

  void SetFactor(int32_t factor) noexcept;
  int32_t Factor() const noexcept { return factor_; }
  // Base-rate samples between a sample entering Up and its counterpart leaving Down.
  int32_t Latency() const noexcept { return LatencyFor(factor_); }
  static constexpr int32_t LatencyFor(int32_t factor) noexcept {
    return factor == 2 ? 2 * kOuterPairs - 1 : factor == 4 ? 2 * kOuterPairs + kInnerPairs - 2 : 0;
  }

  // Back to silence.
  void Reset() noexcept;

  // `frames` base-rate samples in, Factor()·frames out. `output` must not overlap `input`.
  void Up(const double* input, double* output, int32_t frames) noexcept;
  // Factor()·frames samples in, `frames` base-rate samples out. The input buffer serves as
  // scratch space and is overwritten.
  void Down(double* input, double* output, int32_t frames) noexcept;

private:
  // One doubling: its taps and the histories of both directions.
  class Stage {
  public:
    static constexpr int32_t kMaxPairs = 32;

    Stage(int32_t pairs, double beta) noexcept;
    // The decimator's polyphase phase (0 or 1): which sample of an input pair is the centre of
    // the window. Phase 1 delays by one sample of the high rate less than phase 0.
    void SetPhase(int32_t phase) noexcept;
    void Reset() noexcept;
    // `frames` samples in, 2·frames out. The output may lie over the input as long as writing
    // output[2i + 1] never passes input[i] unread (the output starting 2·frames before the
    // input's end, say).
    void Up(const double* input, double* output, int32_t frames) noexcept;
    // 2·frames samples in, `frames` out; the output may be the input itself.
    void Down(const double* input, double* output, int32_t frames) noexcept;

  private:
    // The latest `length` samples of a stream readable as one contiguous window, oldest first:
    // every sample is written twice, so the window never wraps.
    struct History {
      double data[4 * kMaxPairs] = {};
      int32_t length = 0;
      int32_t at = 0;
      void Push(double x) noexcept {
        data[at] = data[at + length] = x;
        if (++at == length) at = 0;
      }
      const double* Window() const noexcept { return data + at; }
    };
    // Σ taps[j] · (window[K − 1 − j] + window[K + j]): the tap pairs around the window's middle.
    double PairSum(const double* window, const double* taps) const noexcept;

    int32_t pairs_;
    int32_t phase_ = 0;
    double taps_[kMaxPairs] = {};
    double doubled_[kMaxPairs] = {};  // the interpolator's taps: twice as loud for the zeros between samples
    History up_;
    History paired_;   // decimator: the stream that meets the tap pairs
    History centres_;  // decimator: the other stream, delayed to the window's centre
  };

  int32_t factor_ = 1;
  Stage outer_;
  Stage inner_;
};
