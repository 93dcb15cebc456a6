#include "dsp/KConvolver.h"

#include <kiss_fftr.h>

#include <algorithm>
#include <bit>
#include <cstdlib>

#include "kernel/KException.h"

namespace {
using Plan = std::unique_ptr<kiss_fftr_state, void (*)(void*)>;

Plan MakePlan(int32_t size, bool inverse) {
  Plan plan(kiss_fftr_alloc(size, inverse ? 1 : 0, nullptr, nullptr), &free);
  if (!plan) throw KException(KString("There is not enough memory for the impulse response."));
  return plan;
}

// sum += a · b over `bins` complex values.
void MultiplyAdd(const kiss_fft_cpx* a, const kiss_fft_cpx* b, kiss_fft_cpx* sum, int32_t bins) noexcept {
  for (int32_t i = 0; i < bins; ++i) {
    sum[i].r += a[i].r * b[i].r - a[i].i * b[i].i;
    sum[i].i += a[i].r * b[i].i + a[i].i * b[i].r;
  }
}
}  // namespace

// One size of partition: `count` partitions of `size` taps each. Its block's output is the second
// half of an overlap-save transform of two consecutive blocks of input. A level that starts at
// tap `size` computes it at once when the block before is complete; a spread level starts at tap
// 2·size and computes it over the next block, a share of its work each time `steps` more
// partitions of input have passed, into `pending`, which plays from the block after.
struct KConvolver::Level {
  Level(std::span<const float> taps, int32_t blockSize, int32_t partitions, int32_t spreadSteps)
      : size(blockSize), bins(blockSize + 1), count(partitions), steps(spreadSteps), forward(MakePlan(2 * size, false)),
        inverse(MakePlan(2 * size, true)), input(2 * static_cast<size_t>(size)), frame(steps > 0 ? input.size() : 0),
        spectra(static_cast<size_t>(count) * bins), history(spectra.size()), sum(static_cast<size_t>(bins)), result(input.size()),
        pending(frame.size()) {
    // Each partition zero-padded to two blocks, transformed, and scaled so that the unscaled
    // inverse transform comes back at unit gain.
    std::vector<float> padded(input.size());
    const float scale = 1.0f / static_cast<float>(2 * size);
    for (int32_t k = 0; k < count; ++k) {
      std::fill(padded.begin(), padded.end(), 0.0f);
      const std::span<const float> part = taps.subspan(std::min(taps.size(), static_cast<size_t>(k) * size));
      std::transform(part.begin(), part.begin() + std::min<ptrdiff_t>(size, std::ssize(part)), padded.begin(),
                     [scale](float t) { return t * scale; });
      kiss_fftr(forward.get(), padded.data(), spectra.data() + static_cast<size_t>(k) * bins);
    }
    Reset();
  }

  void Reset() noexcept {
    for (std::vector<float>* v : {&input, &frame, &result, &pending}) std::fill(v->begin(), v->end(), 0.0f);
    std::fill(history.begin(), history.end(), kiss_fft_cpx{0.0f, 0.0f});
    newest = 0;
    position = 0;
    step = 0;
    done = Items();  // nothing owed before the first block is complete
  }

  // The forward transform, a product per partition, the inverse transform.
  int32_t Items() const noexcept { return count + 2; }
  void Work(int32_t item, const float* frameIn, float* out) noexcept {
    if (item == 0) {
      newest = newest + 1 == count ? 0 : newest + 1;
      kiss_fftr(forward.get(), frameIn, history.data() + static_cast<size_t>(newest) * bins);
      std::fill(sum.begin(), sum.end(), kiss_fft_cpx{0.0f, 0.0f});
    } else if (item <= count) {
      // Partition k meets the input spectrum k blocks old.
      const int32_t k = item - 1, slot = newest >= k ? newest - k : newest - k + count;
      MultiplyAdd(spectra.data() + static_cast<size_t>(k) * bins, history.data() + static_cast<size_t>(slot) * bins, sum.data(), bins);
    } else {
      kiss_fftri(inverse.get(), sum.data(), out);
    }
  }

  // The input block is complete.
  void CompleteBlock() noexcept {
    if (steps == 0) {
      for (int32_t item = 0; item < Items(); ++item) Work(item, input.data(), result.data());
    } else {
      // What was computed over the block just complete plays from now; the block itself waits in
      // `frame` for its share of work over the next.
      std::swap(result, pending);
      std::swap(input, frame);
      step = done = 0;
    }
    const std::vector<float>& complete = frame.empty() ? input : frame;
    std::copy(complete.begin() + size, complete.end(), input.begin());
    position = 0;
  }

  // Another partition of the next block has passed: a spread level does its share, evenly, so
  // that everything is done by the last partition before the block is complete.
  void Step() noexcept {
    if (steps == 0 || done == Items()) return;
    ++step;
    for (const int32_t target = (step * Items() + steps - 1) / steps; done < target && done < Items(); ++done)
      Work(done, frame.data(), pending.data());
  }

  const float* Output() const noexcept { return result.data() + size + position; }

  int32_t size, bins, count;
  int32_t steps;              // partitions a spread level's work is shared over; 0 when not spread
  Plan forward, inverse;
  std::vector<float> input;   // the previous block, then the current one as it arrives
  std::vector<float> frame;   // spread: the two blocks whose transform is under way
  std::vector<kiss_fft_cpx> spectra, history, sum;
  std::vector<float> result;  // the transform that plays; its second half is the output
  std::vector<float> pending; // spread: the transform under way
  int32_t newest = 0;         // history slot of the latest input spectrum
  int32_t position = 0;       // samples of the current block received (and played)
  int32_t step = 0, done = 0; // spread: partitions passed and items done in the current block
};

KConvolver::KConvolver() { Load({}); }
KConvolver::~KConvolver() = default;
KConvolver::KConvolver(KConvolver&&) noexcept = default;
KConvolver& KConvolver::operator=(KConvolver&&) noexcept = default;

void KConvolver::Load(std::span<const float> response, int32_t partition) {
  if (partition < 16 || partition > kMaxPartition || !std::has_single_bit(static_cast<uint32_t>(partition)))
    throw KException(KString("The convolution partition must be a power of two from 16 to 1024."));
  length_ = static_cast<int32_t>(response.size());
  partition_ = partition;
  const auto taps = static_cast<size_t>(std::min(length_, partition));
  head_.assign(taps, 0.0);
  for (size_t k = 0; k < taps; ++k) head_[k] = response[taps - 1 - k];
  recent_.assign(2 * static_cast<size_t>(partition), 0.0f);
  fill_ = 0;
  levels_.clear();
  // Each level runs from tap N to tap growth·N, where the next level begins; the one before the
  // largest runs on to twice the largest's block, so that the largest may spread its work over a
  // block; the largest takes whatever is left.
  for (int32_t size = partition, start = partition; start < length_; start += levels_.back()->count * size, size *= kLevelGrowth) {
    const bool largest = 2 * size * kLevelGrowth > kLargestBlock;
    const bool beforeLargest = !largest && 2 * size * kLevelGrowth * kLevelGrowth > kLargestBlock;
    int32_t count = (length_ - start + size - 1) / size;
    if (!largest) count = std::min(count, beforeLargest ? 2 * kLevelGrowth - 1 : kLevelGrowth - 1);
    const int32_t steps = start >= 2 * size ? size / partition - 1 : 0;
    levels_.push_back(std::make_unique<Level>(response.subspan(static_cast<size_t>(start)), size, count, steps));
  }
}

void KConvolver::Reset() noexcept {
  std::fill(recent_.begin(), recent_.end(), 0.0f);
  fill_ = 0;
  for (auto& level : levels_) level->Reset();
}

int32_t KConvolver::SettleSamples() const noexcept { return length_ + (levels_.empty() ? 0 : 2 * levels_.back()->size); }

void KConvolver::Process(const float* in, float* out, int32_t n) noexcept {
  const int32_t taps = static_cast<int32_t>(head_.size());
  double mix[kMaxPartition];
  while (n > 0) {
    const int32_t m = std::min(n, partition_ - fill_);
    float* const current = recent_.data() + partition_ + fill_;
    std::copy_n(in, m, current);
    for (auto& level : levels_) std::copy_n(in, m, level->input.data() + level->size + level->position);
    for (int32_t i = 0; i < m; ++i) {
      const float* x = current + i + 1 - taps;  // oldest first, as the head's taps are reversed
      double acc = 0.0;
      for (int32_t k = 0; k < taps; ++k) acc += head_[static_cast<size_t>(k)] * x[k];
      mix[i] = acc;
    }
    for (auto& level : levels_) {
      const float* y = level->Output();
      for (int32_t i = 0; i < m; ++i) mix[i] += y[i];
      level->position += m;
    }
    for (int32_t i = 0; i < m; ++i) out[i] = static_cast<float>(mix[i]);
    fill_ += m;
    in += m;
    out += m;
    n -= m;
    if (fill_ == partition_) CompleteBlock();
  }
}

void KConvolver::CompleteBlock() noexcept {
  std::copy(recent_.begin() + partition_, recent_.end(), recent_.begin());
  fill_ = 0;
  for (auto& level : levels_) {
    if (level->position == level->size) level->CompleteBlock();
    else level->Step();
  }
}
