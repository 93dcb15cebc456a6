#pragma once

#include <array>
#include <atomic>
#include <cstdint>

#include "dsp/KFilterSection.h"

// Programme loudness as broadcasters measure it: each channel K-weighted (a high shelf for the
// head's effect, then a high-pass), mean squares summed over the channels, in LUFS:
//   L = −0.691 + 10·log10(Σ mean square)
// over 400 ms (momentary), 3 s (short-term) and the whole programme (integrated), the last
// gated in 400 ms blocks overlapping by 75 %: blocks under −70 LUFS are ignored, then blocks
// more than 10 LU under the loudness of the rest.
//
// Audio thread: Process. Readings are published every 100 ms and may be read on any thread.
class KLoudnessMeter {
public:
  static constexpr int32_t kMaxChannels = 2;  // left and right; surround weights are not needed
  static constexpr double kSilence = -200.0;  // the reading while nothing has been measured

  // Designs the K-weighting for the rate and clears everything (not on the audio thread's
  // critical path: it recomputes coefficients only).
  void Prepare(double sampleRate) noexcept;
  void Reset() noexcept;
  void Process(const float* const* channels, int32_t channelCount, int32_t n) noexcept;

  double Momentary() const noexcept { return momentary_.load(std::memory_order_relaxed); }
  double ShortTerm() const noexcept { return shortTerm_.load(std::memory_order_relaxed); }
  double Integrated() const noexcept { return integrated_.load(std::memory_order_relaxed); }
  // 100 ms parts completed since the last reset (audio thread): tells when readings moved.
  int32_t PartsSeen() const noexcept { return partsSeen_; }

  // The two stages of the K-weighting at a rate, as designed for the meter.
  static KFilterSection Shelf(double sampleRate) noexcept;
  static KFilterSection HighPass(double sampleRate) noexcept;

private:
  static constexpr int32_t kMomentaryParts = 4;   // 100 ms parts of 400 ms
  static constexpr int32_t kShortTermParts = 30;  // of 3 s
  // Gated blocks are counted in 0.01 LU bins from −70 LUFS up to +10: the relative gate is
  // placed to a hundredth of a unit, and a programme of any length needs no growing storage.
  static constexpr double kLowestBin = -70.0, kBinWidth = 0.01;
  static constexpr int32_t kBins = 8000;

  void CompletePart() noexcept;

  KFilterSection shelf_, highPass_;
  double state_[kMaxChannels][4] = {};  // per channel: two delays per stage
  int32_t partLength_ = 4800;
  int32_t partFill_ = 0;
  double partEnergy_ = 0.0;
  std::array<double, kShortTermParts> parts_{};  // mean squares of the latest parts, newest at `newest_`
  int32_t newest_ = 0;
  int32_t partsSeen_ = 0;
  std::array<uint32_t, kBins> blockCount_{};
  std::array<double, kBins> blockPower_{};
  std::atomic<double> momentary_{kSilence}, shortTerm_{kSilence}, integrated_{kSilence};
};
