#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

struct kiss_fftr_state;

// The spectrum of the latest audio: the audio thread appends the channels' mean to a ring, and
// a reader (the editor, on its timer) transforms the newest stretch through a Hann window. A
// sine of amplitude A centred on a bin reads 20·log10(A) dB there.
//
// Push is for the audio thread and never allocates; Measure allocates when the size changes and
// serves one reader at a time.
class KSpectrumAnalyser {
public:
  static constexpr int32_t kMinSize = 256, kMaxSize = 8192;
  static constexpr double kSilence = -200.0;  // the reading of an empty bin

  KSpectrumAnalyser();
  ~KSpectrumAnalyser();

  void Push(const float* const* channels, int32_t channelCount, int32_t n) noexcept;
  void Reset() noexcept;
  // `size` (a power of two from kMinSize to kMaxSize, clamped) samples' spectrum: size/2 + 1
  // levels in dB, bin k at k·rate/size Hz.
  void Measure(int32_t size, std::vector<double>& decibels);

private:
  std::unique_ptr<std::atomic<float>[]> ring_;
  std::atomic<int64_t> written_{0};
  // The reader's transform, window and buffers, for the size last measured.
  int32_t size_ = 0;
  kiss_fftr_state* plan_ = nullptr;
  std::vector<float> window_, frame_;
  std::vector<float> spectrum_;  // interleaved complex
};
