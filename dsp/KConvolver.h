#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <vector>


// Convolution of one channel with a long impulse response, with no added latency: the first
// `partition` taps run as a direct-form filter inside the block, and the rest as uniformly
// partitioned overlap-save convolutions in levels of growing block size (each level N starts at
// tap N, so its result for a block is ready when the block before it is complete). All work
// happens at fixed sample positions, so the output does not depend on how a host cuts its blocks.
//
// Load allocates and belongs off the audio thread; Process and Reset never allocate.
class KConvolver {
public:
  static constexpr int32_t kDefaultPartition = 64;
  static constexpr int32_t kMaxPartition = 1024;
  // Each level's block is this many times the one before it, and the largest is this long: the
  // largest level's work lands in one block, so it bounds the worst block's cost.
  static constexpr int32_t kLevelGrowth = 4;
  static constexpr int32_t kLargestBlock = 8192;

  KConvolver();
  ~KConvolver();
  KConvolver(KConvolver&&) noexcept;
  KConvolver& operator=(KConvolver&&) noexcept;

  // `partition`: a power of two from 16 to kMaxPartition; the direct head's length and the
  // smallest level's block. An empty response convolves to silence.
  void Load(std::span<const float> response, int32_t partition = kDefaultPartition);
  void Reset() noexcept;
  // out[i] = Σk response[k]·in[i−k] from the first sample on; `in` and `out` may be the same.
  void Process(const float* in, float* out, int32_t n) noexcept;

  int32_t Length() const noexcept { return length_; }
  // Samples after the input falls silent until the output is exactly zero again: the response's
  // length plus the rounding left in the largest level's blocks.
  int32_t SettleSamples() const noexcept;

private:
  struct Level;
  void CompleteBlock() noexcept;

  int32_t length_ = 0;
  int32_t partition_ = kDefaultPartition;
  std::vector<double> head_;   // taps 0 .. partition−1, reversed for the direct form
  std::vector<float> recent_;  // the previous and the current partition of input
  int32_t fill_ = 0;           // samples of the current partition received
  std::vector<std::unique_ptr<Level>> levels_;
};
