#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <vector>


// Convolution of one channel with a long impulse response, with no added latency: the first
// `partition` taps run as a direct-form filter inside the block, and the rest as uniformly
// partitioned overlap-save convolutions in levels of growing block size. Each smaller level N
// starts at tap N, so its result for a block is computed when the block before it is complete.
// The largest level starts at twice its block size: its result for a block may take the whole
// block before, and its transforms and products are spread over that block's partitions, so that
// no host block carries its work at once. All work happens at fixed sample positions, so the
// output does not depend on how a host cuts its blocks.
//
// Load allocates and belongs off the audio thread; Process and Reset never allocate.
class KConvolver {
public:
  static constexpr int32_t kDefaultPartition = 64;
  static constexpr int32_t kMaxPartition = 1024;
  // Each level's block is this many times the one before it, up to the largest level, whose block
  // is at most half this long (its transforms are this long).
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
