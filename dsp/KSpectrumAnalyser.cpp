#include "dsp/KSpectrumAnalyser.h"

#include <kiss_fftr.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdlib>

#include "kernel/KException.h"

KSpectrumAnalyser::KSpectrumAnalyser() : ring_(new std::atomic<float>[kMaxSize]) { Reset(); }

KSpectrumAnalyser::~KSpectrumAnalyser() { free(plan_); }

void KSpectrumAnalyser::Reset() noexcept {
  for (int32_t i = 0; i < kMaxSize; ++i) ring_[i].store(0.0f, std::memory_order_relaxed);
  written_.store(0, std::memory_order_release);
}

void KSpectrumAnalyser::Push(const float* const* channels, int32_t channelCount, int32_t n) noexcept {
  const int64_t start = written_.load(std::memory_order_relaxed);
  const double share = 1.0 / std::max(channelCount, 1);
  for (int32_t i = 0; i < n; ++i) {
    double sum = 0.0;
    for (int32_t c = 0; c < channelCount; ++c) sum += channels[c][i];
    // Only the picture would suffer from a NaN, but it would stay in it for a whole window.
    const double mean = std::isfinite(sum) ? sum * share : 0.0;
    ring_[(start + i) & (kMaxSize - 1)].store(static_cast<float>(mean), std::memory_order_relaxed);
  }
  written_.store(start + n, std::memory_order_release);
}

void KSpectrumAnalyser::Measure(int32_t size, std::vector<double>& decibels) {
  size = std::bit_floor(static_cast<uint32_t>(std::clamp(size, kMinSize, kMaxSize)));
  if (size != size_) {
    kiss_fftr_state* plan = kiss_fftr_alloc(size, 0, nullptr, nullptr);
    if (!plan) throw KException(KString("There is not enough memory for the spectrum."));
    free(plan_);
    plan_ = plan;
    size_ = size;
    window_.resize(static_cast<size_t>(size));
    // Hann, scaled so that a bin-centred sine of amplitude A comes out as A: the window's mean
    // is one half and a real sine splits its energy between two bins.
    for (int32_t i = 0; i < size; ++i)
      window_[static_cast<size_t>(i)] = static_cast<float>((1.0 - std::cos(6.283185307179586 * i / size)) * 2.0 / size);
    frame_.resize(static_cast<size_t>(size));
    spectrum_.resize(static_cast<size_t>(size + 2));
  }
  const int64_t end = written_.load(std::memory_order_acquire);
  for (int32_t i = 0; i < size; ++i)
    frame_[static_cast<size_t>(i)] = window_[static_cast<size_t>(i)] * ring_[(end - size + i) & (kMaxSize - 1)].load(std::memory_order_relaxed);
  kiss_fftr(plan_, frame_.data(), reinterpret_cast<kiss_fft_cpx*>(spectrum_.data()));
  decibels.resize(static_cast<size_t>(size / 2 + 1));
  for (size_t k = 0; k < decibels.size(); ++k) {
    const double re = spectrum_[2 * k], im = spectrum_[2 * k + 1];
    const double power = re * re + im * im;
    decibels[k] = power > 0.0 ? std::max(10.0 * std::log10(power), kSilence) : kSilence;
  }
}
