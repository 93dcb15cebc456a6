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

// One size of partition: `count` partitions of `size` taps each, the first at tap `size`. Its
// block's output is the second half of an overlap-save transform of the last two blocks of
// input, computed when the block before it is complete.
struct KConvolver::Level {
  Level(std::span<const float> taps, int32_t blockSize, int32_t partitions)
      : size(blockSize), bins(blockSize + 1), count(partitions), forward(MakePlan(2 * size, false)),
        inverse(MakePlan(2 * size, true)), input(2 * static_cast<size_t>(size)), spectra(static_cast<size_t>(count) * bins),
        history(spectra.size()),
        sum(static_cast<size_t>(bins)), result(input.size()) {
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
  }

  void Reset() noexcept {
    std::fill(input.begin(), input.end(), 0.0f);
    std::fill(history.begin(), history.end(), kiss_fft_cpx{0.0f, 0.0f});
    std::fill(result.begin(), result.end(), 0.0f);
    newest = 0;
    position = 0;
  }

  // The input block is complete: the output of the next one.
  void Transform() noexcept {
    newest = newest + 1 == count ? 0 : newest + 1;
    kiss_fftr(forward.get(), input.data(), history.data() + static_cast<size_t>(newest) * bins);
    std::fill(sum.begin(), sum.end(), kiss_fft_cpx{0.0f, 0.0f});
    // Partition k meets the input spectrum k blocks old.
    for (int32_t k = 0, slot = newest; k < count; ++k, slot = slot == 0 ? count - 1 : slot - 1)
      MultiplyAdd(spectra.data() + static_cast<size_t>(k) * bins, history.data() + static_cast<size_t>(slot) * bins, sum.data(),
                  bins);
    kiss_fftri(inverse.get(), sum.data(), result.data());
    std::copy(input.begin() + size, input.end(), input.begin());
    position = 0;
  }

  const float* Output() const noexcept { return result.data() + size + position; }

  int32_t size, bins, count;
  Plan forward, inverse;
  std::vector<float> input;  // the previous block, then the current one as it arrives
  std::vector<kiss_fft_cpx> spectra, history, sum;
  std::vector<float> result;  // the last inverse transform; its second half is the output
  int32_t newest = 0;         // history slot of the latest input spectrum
  int32_t position = 0;       // samples of the current block received (and played)
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
  // Each level runs from tap N to tap growth·N, where the next level begins; the largest takes
  // whatever is left.
  for (int32_t size = partition, start = partition; start < length_; start += levels_.back()->count * size, size *= kLevelGrowth) {
    int32_t count = (length_ - start + size - 1) / size;
    if (size * kLevelGrowth <= kLargestBlock) count = std::min(count, kLevelGrowth - 1);
    levels_.push_back(std::make_unique<Level>(response.subspan(static_cast<size_t>(start)), size, count));
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
  for (auto& level : levels_)
    if (level->position == level->size) level->Transform();
}
