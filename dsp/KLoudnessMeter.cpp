#include "dsp/KLoudnessMeter.h"

#include <algorithm>
#include <cmath>

#include "dsp/KSectionStage.h"

namespace {
constexpr double kPi = 3.141592653589793;
constexpr double kAbsoluteGate = -70.0;
constexpr double kRelativeGate = -10.0;

double Loudness(double meanSquare) noexcept { return meanSquare > 0.0 ? -0.691 + 10.0 * std::log10(meanSquare) : KLoudnessMeter::kSilence; }
}  // namespace

// The analog prototypes behind the weighting (a shelf of about +4 dB above 1.7 kHz and a
// second-order high-pass at 38 Hz), mapped to the rate by the bilinear transform so that every
// rate measures alike.
KFilterSection KLoudnessMeter::Shelf(double sampleRate) noexcept {
  constexpr double f0 = 1681.974450955533, gainDb = 3.999843853973347, q = 0.7071752369554196;
  const double k = std::tan(kPi * f0 / sampleRate);
  const double vh = std::pow(10.0, gainDb / 20.0), vb = std::pow(vh, 0.4996667741545416);
  const double a0 = 1.0 + k / q + k * k;
  KFilterSection s;
  s.b0 = (vh + vb * k / q + k * k) / a0;
  s.b1 = 2.0 * (k * k - vh) / a0;
  s.b2 = (vh - vb * k / q + k * k) / a0;
  s.minusA1 = -2.0 * (k * k - 1.0) / a0;
  s.minusA2 = -(1.0 - k / q + k * k) / a0;
  s.sampleRate = sampleRate;
  return s;
}

KFilterSection KLoudnessMeter::HighPass(double sampleRate) noexcept {
  constexpr double f0 = 38.13547087602444, q = 0.5003270373238773;
  const double k = std::tan(kPi * f0 / sampleRate);
  const double a0 = 1.0 + k / q + k * k;
  KFilterSection s;
  s.b0 = 1.0;
  s.b1 = -2.0;
  s.b2 = 1.0;
  s.minusA1 = -2.0 * (k * k - 1.0) / a0;
  s.minusA2 = -(1.0 - k / q + k * k) / a0;
  s.sampleRate = sampleRate;
  return s;
}

void KLoudnessMeter::Prepare(double sampleRate) noexcept {
  shelf_ = Shelf(sampleRate);
  highPass_ = HighPass(sampleRate);
  partLength_ = std::max(1, static_cast<int32_t>(std::lround(0.1 * sampleRate)));
  Reset();
}

void KLoudnessMeter::Reset() noexcept {
  for (auto& channel : state_) std::fill(std::begin(channel), std::end(channel), 0.0);
  partFill_ = 0;
  partEnergy_ = 0.0;
  parts_.fill(0.0);
  newest_ = 0;
  partsSeen_ = 0;
  blockCount_.fill(0);
  blockPower_.fill(0.0);
  momentary_.store(kSilence, std::memory_order_relaxed);
  shortTerm_.store(kSilence, std::memory_order_relaxed);
  integrated_.store(kSilence, std::memory_order_relaxed);
}

void KLoudnessMeter::Process(const float* const* channels, int32_t channelCount, int32_t n) noexcept {
  channelCount = std::min(channelCount, kMaxChannels);
  for (int32_t at = 0; at < n;) {
    const int32_t m = std::min(n - at, partLength_ - partFill_);
    double energy = 0.0;
    for (int32_t c = 0; c < channelCount; ++c) {
      const float* x = channels[c] + at;
      double* z = state_[c];
      for (int32_t i = 0; i < m; ++i) {
        const double y = KSectionStage(highPass_, KSectionStage(shelf_, x[i], z), z + 2);
        energy += y * y;
      }
      // A NaN or infinity would stay in the filters for good: they start again from rest.
      if (!std::isfinite(z[0] + z[1] + z[2] + z[3])) std::fill(z, z + 4, 0.0), energy = 0.0;
    }
    partEnergy_ += energy;
    partFill_ += m;
    at += m;
    if (partFill_ == partLength_) CompletePart();
  }
}

void KLoudnessMeter::CompletePart() noexcept {
  newest_ = newest_ + 1 == kShortTermParts ? 0 : newest_ + 1;
  parts_[static_cast<size_t>(newest_)] = partEnergy_ / partLength_;
  partEnergy_ = 0.0;
  partFill_ = 0;
  ++partsSeen_;
  auto meanOfLatest = [this](int32_t count) {
    double sum = 0.0;
    for (int32_t k = 0, slot = newest_; k < count; ++k, slot = slot == 0 ? kShortTermParts - 1 : slot - 1)
      sum += parts_[static_cast<size_t>(slot)];
    return sum / count;
  };
  if (partsSeen_ < kMomentaryParts) return;
  const double block = meanOfLatest(kMomentaryParts);
  const double momentary = Loudness(block);
  momentary_.store(momentary, std::memory_order_relaxed);
  if (partsSeen_ >= kShortTermParts) shortTerm_.store(Loudness(meanOfLatest(kShortTermParts)), std::memory_order_relaxed);
  if (momentary <= kAbsoluteGate) return;

  const auto bin = std::min(kBins - 1, static_cast<int32_t>((momentary - kLowestBin) / kBinWidth));
  ++blockCount_[static_cast<size_t>(bin)];
  blockPower_[static_cast<size_t>(bin)] += block;
  // The relative gate stands 10 LU under the mean of every block over the absolute gate.
  double power = 0.0, count = 0.0;
  for (int32_t b = 0; b < kBins; ++b) power += blockPower_[static_cast<size_t>(b)], count += blockCount_[static_cast<size_t>(b)];
  const double gate = Loudness(power / count) + kRelativeGate;
  const auto first = std::clamp(static_cast<int32_t>(std::ceil((gate - kLowestBin) / kBinWidth)), 0, kBins);
  power = 0.0, count = 0.0;
  for (int32_t b = first; b < kBins; ++b) power += blockPower_[static_cast<size_t>(b)], count += blockCount_[static_cast<size_t>(b)];
  integrated_.store(count > 0.0 ? Loudness(power / count) : kSilence, std::memory_order_relaxed);
}
