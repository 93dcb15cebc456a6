#include "dsp/KDynamicsProcessor.h"

#include <immintrin.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <iterator>
#include <limits>

#include "dsp/KDecibels.h"

namespace {

// Guards every division by a product or difference that may be near zero.
constexpr double kTiny = 1e-10;
// An envelope below this (−400 dB) is silence: the detector restarts from exact zero instead of
// decaying on through the slow denormal range.
constexpr double kSilent = 1e-20;
constexpr double kLargest = std::numeric_limits<double>::max();

// The slow averages divide in the other order, so that their coefficients are exactly
// exp(−10/fs) and exp(−0.4/fs).
KDynamicsProcessor::Pole Average(double rate, double seconds) noexcept {
  const double coefficient = std::abs(rate * seconds) < kTiny ? 0.0 : std::exp(-(1.0 / seconds) / rate);
  return {coefficient, 1.0 - coefficient};
}

}  // namespace

void KDynamicsProcessor::Prepare(int32_t maxChannels, int32_t maxFrames) {
  // Unprepared until every buffer is in place, should an allocation fail.
  maxChannels_ = maxFrames_ = channels_ = 0;
  if (maxChannels < 1 || maxFrames < 1) return;
  const auto channels = static_cast<size_t>(maxChannels), frames = static_cast<size_t>(maxFrames);
  const size_t filtered = std::min(channels, static_cast<size_t>(KSectionRunner::kMaxChannels));
  p_.assign(channels, 0.0);
  e_.assign(channels, 0.0);
  envelope_.assign(channels * frames, 0.0f);
  gains_.assign(channels * frames, 0.0f);
  work_.assign(frames, 0.0);
  filtered_.assign(filtered * frames, 0.0f);
  filteredRows_.resize(filtered);
  for (size_t ch = 0; ch < filtered; ++ch) filteredRows_[ch] = filtered_.data() + ch * frames;
  pieceIn_.assign(channels, nullptr);
  pieceDetect_.assign(channels, nullptr);
  pieceOut_.assign(channels, nullptr);
  maxChannels_ = maxChannels;
  maxFrames_ = maxFrames;
  Reset();
}

void KDynamicsProcessor::Update(const KDynamicsSettings& settings) noexcept {
  const double fs = settings.sampleRate;
  gIn_ = KDecibelsToLinear(settings.gainDb);
  gOut_ = KDecibelsToLinear(settings.outputGainDb);
  attack_ = KSmoothingCoefficient(fs, settings.attack);
  release_ = KSmoothingCoefficient(fs, settings.release);
  meanSquare_.coefficient = KSmoothingCoefficient(fs, settings.rmsLength);
  meanSquare_.complement = 1.0 - meanSquare_.coefficient;
  shortAverage_ = Average(fs, 0.1);
  longAverage_ = Average(fs, 2.5);

  curve_.Configure({settings.threshold, settings.ratio, settings.kneeMode, settings.kneeSize, settings.maximize,
                    settings.customShape, settings.shape, gIn_, gOut_});
  idle_ = curve_.Chosen() == KTransferCurve::kIdle;
  linked_ = settings.linkChannels;
  detector_ = linked_ ? DetectLinked : DetectUnlinked;
  sideChain_ = settings.sideChain;
  DesignBandLimits(settings);
  if (idle_) Reset();
}

// Each limit at its end of the range, or beyond what the rate can carry, leaves its filter off.
// Frequency and rate reach the designer rounded to single precision: the detector's response
// must match that rounding to the last bit.
void KDynamicsProcessor::DesignBandLimits(const KDynamicsSettings& settings) noexcept {
  highPassOn_ = lowPassOn_ = false;
  if (settings.sideChainFilters) {
    const double top = 0.499 * settings.sampleRate;
    const double low = settings.sideChainMinFrequency, high = settings.sideChainMaxFrequency;
    const double rate = static_cast<float>(settings.sampleRate);
    highPassOn_ = low - 20.0 > kTiny && low <= top;
    lowPassOn_ = high < 19999.9999999999 && high <= top;
    if (highPassOn_) highPass_.Design(KFilterSection::kHighPass, 0.0, static_cast<float>(low), rate, 1.0);
    if (lowPassOn_) lowPass_.Design(KFilterSection::kLowPass, 0.0, static_cast<float>(high), rate, 1.0);
  }
  KFilterSection cascade[2];
  int32_t count = 0;
  if (highPassOn_) cascade[count++] = highPass_;
  if (lowPassOn_) cascade[count++] = lowPass_;
  bands_.SetSections(cascade, count);
}

void KDynamicsProcessor::Process(int32_t n, const float* const* in, float* const* out, const float* const* sideChain,
                                 int32_t channels) noexcept {
  if (n <= 0 || channels <= 0) return;
  lowestGain_ = static_cast<float>(curve_.TotalGain());
  if (measuring_) std::fill_n(&peaks_[0][0], std::size(peaks_) * 2, 0.0f);
  if (idle_) {
    Amplify(n, in, out, channels);
    return;
  }
  channels = std::min(channels, maxChannels_);
  if (channels == 0) return;
  channels_ = channels;
  const float* const* source = sideChain_ && sideChain ? sideChain : in;
  const int32_t filtered = bands_.SectionCount() > 0 ? std::min(channels, KSectionRunner::kMaxChannels) : 0;
  for (int32_t begin = 0; begin < n; begin += maxFrames_) {
    const int32_t frames = std::min(n - begin, maxFrames_);
    for (size_t ch = 0; ch < static_cast<size_t>(channels); ++ch) {
      pieceIn_[ch] = in[ch] + begin;
      pieceOut_[ch] = out[ch] + begin;
      pieceDetect_[ch] = source[ch] + begin;
    }
    if (filtered > 0) {
      bands_.Process(pieceDetect_.data(), filteredRows_.data(), filtered, frames);
      std::copy_n(filteredRows_.begin(), filtered, pieceDetect_.begin());
    }
    // Ahead of the detector, whose envelope runs sample after sample and leaves the processor
    // room for independent work beside it.
    if (measureInputs_) measureInputs_(pieceIn_.data(), std::min(channels, kMeasuredChannels), frames, peaks_);
    detector_(*this, channels, frames);
    Settle(linked_ ? 1 : channels);
  }
}

namespace {

// Two floats into the low half of a register.
__m128 LoadTwo(const float* at) noexcept { return _mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(at))); }

// The mean square's input of every sample: share · Σ over the channels of (gIn · x)², summed in
// channel order. Independent across samples, so it runs two samples per instruction.
void SquareSum(const float* const* x, int32_t channels, int32_t from, int32_t frames, double gIn, double share,
               double* sums) noexcept {
  const __m128d g = _mm_set1_pd(gIn), k = _mm_set1_pd(share);
  int32_t i = from;
  for (; i + 2 <= frames; i += 2) {
    __m128d s = _mm_setzero_pd();
    for (int32_t ch = 0; ch < channels; ++ch) {
      const __m128d v = _mm_mul_pd(g, _mm_cvtps_pd(LoadTwo(x[ch] + i)));
      s = _mm_add_pd(s, _mm_mul_pd(v, v));
    }
    _mm_storeu_pd(sums + i, _mm_mul_pd(k, s));
  }
  for (; i < frames; ++i) {
    double s = 0.0;
    for (int32_t ch = 0; ch < channels; ++ch) {
      const double v = gIn * x[ch][i];
      s += v * v;
    }
    sums[i] = share * s;
  }
}

// The detector proper, the one part that runs sample after sample: mean square, square root,
// attack/release envelope. Takes the sums of SquareSum and leaves the envelope in their place.
void Envelope(double* levels, float* envelope, int32_t frames, double c, double attack, double release, double& power,
              double& level) noexcept {
  double p = power, e = level;  // in registers: the rows might alias the state
  for (int32_t i = 0; i < frames; ++i) {
    p = c * p + levels[i];
    const double r = std::sqrt(p);
    // A branch rather than a select: it is taken in long runs, and keeps the compare off the
    // chain from one envelope value to the next, which bounds the whole detector.
    if (e < r) e = r + attack * (e - r);
    else e = r + release * (e - r);
    levels[i] = e;
    envelope[i] = static_cast<float>(e);
  }
  power = p;
  level = e;
}

// Stores the gains as float for the meters and answers the lowest (compared in single
// precision, as stored; a NaN never counts).
float StoreGains(const double* gains, float* stored, int32_t frames, float lowest) noexcept {
  __m128 low = _mm_set1_ps(lowest);
  int32_t i = 0;
  for (; i + 4 <= frames; i += 4) {
    const __m128 g = _mm_movelh_ps(_mm_cvtpd_ps(_mm_loadu_pd(gains + i)), _mm_cvtpd_ps(_mm_loadu_pd(gains + i + 2)));
    _mm_storeu_ps(stored + i, g);
    low = _mm_min_ps(g, low);
  }
  float lanes[4];
  _mm_storeu_ps(lanes, low);
  for (float lane : lanes) lowest = lane < lowest ? lane : lowest;
  for (; i < frames; ++i) {
    stored[i] = static_cast<float>(gains[i]);
    lowest = stored[i] < lowest ? stored[i] : lowest;
  }
  return lowest;
}

// The larger of a magnitude and a running peak; a NaN magnitude leaves the peak, as maxps does
// with the running peak as its second operand.
float Larger(float magnitude, float peak) noexcept { return magnitude > peak ? magnitude : peak; }

// out = gain · in, in double, two samples per instruction. kMeasure also keeps the largest
// magnitude of out in `peak`.
template <bool kMeasure>
void ApplyGains(const double* gains, const float* in, float* out, int32_t frames, float* peak) noexcept {
  const __m128 sign = _mm_set1_ps(-0.0f);
  __m128 top = _mm_set1_ps(*peak);
  int32_t i = 0;
  for (; i + 2 <= frames; i += 2) {
    // The upper lanes of y are zero, below every magnitude's maximum.
    const __m128 y = _mm_cvtpd_ps(_mm_mul_pd(_mm_loadu_pd(gains + i), _mm_cvtps_pd(LoadTwo(in + i))));
    _mm_storel_epi64(reinterpret_cast<__m128i*>(out + i), _mm_castps_si128(y));
    if constexpr (kMeasure) top = _mm_max_ps(_mm_andnot_ps(sign, y), top);
  }
  if constexpr (kMeasure) *peak = _mm_cvtss_f32(_mm_max_ss(top, _mm_shuffle_ps(top, top, 1)));
  for (; i < frames; ++i) {
    out[i] = static_cast<float>(gains[i] * in[i]);
    if constexpr (kMeasure) *peak = Larger(std::fabs(out[i]), *peak);
  }
}

// The largest magnitude of each measured input channel (the first kMeasuredChannels) into its
// row's first entry, two samples per instruction.
void MeasureInputs(const float* const* in, int32_t channels, int32_t frames, float (*peaks)[2]) noexcept {
  const __m128 sign = _mm_set1_ps(-0.0f);
  for (size_t ch = 0; ch < static_cast<size_t>(channels); ++ch) {
    const float* x = in[ch];
    __m128 top = _mm_set1_ps(peaks[ch][0]);
    int32_t i = 0;
    for (; i + 2 <= frames; i += 2) top = _mm_max_ps(_mm_andnot_ps(sign, LoadTwo(x + i)), top);
    float peak = _mm_cvtss_f32(_mm_max_ss(top, _mm_shuffle_ps(top, top, 1)));
    for (; i < frames; ++i) peak = Larger(std::fabs(x[i]), peak);
    peaks[ch][0] = peak;
  }
}

// The same three passes four samples at a time, for processors with AVX: the same operations
// lane by lane (no fused multiply-adds), so the results agree to the last bit. Each clears the
// upper register halves before the two-lane code finishes the odd end: code without AVX that
// runs after them (ours or the host's) would otherwise crawl on false dependencies.
[[gnu::target("avx")]] void SquareSumWide(const float* const* x, int32_t channels, int32_t from, int32_t frames, double gIn,
                                          double share, double* sums) noexcept {
  const __m256d g = _mm256_set1_pd(gIn), k = _mm256_set1_pd(share);
  int32_t i = from;
  for (; i + 4 <= frames; i += 4) {
    __m256d s = _mm256_setzero_pd();
    for (int32_t ch = 0; ch < channels; ++ch) {
      const __m256d v = _mm256_mul_pd(g, _mm256_cvtps_pd(_mm_loadu_ps(x[ch] + i)));
      s = _mm256_add_pd(s, _mm256_mul_pd(v, v));
    }
    _mm256_storeu_pd(sums + i, _mm256_mul_pd(k, s));
  }
  _mm256_zeroupper();
  if (i < frames) SquareSum(x, channels, i, frames, gIn, share, sums);
}

[[gnu::target("avx")]] float StoreGainsWide(const double* gains, float* stored, int32_t frames, float lowest) noexcept {
  __m128 low = _mm_set1_ps(lowest);
  int32_t i = 0;
  for (; i + 4 <= frames; i += 4) {
    const __m128 g = _mm256_cvtpd_ps(_mm256_loadu_pd(gains + i));
    _mm_storeu_ps(stored + i, g);
    low = _mm_min_ps(g, low);
  }
  _mm256_zeroupper();
  float lanes[4];
  _mm_storeu_ps(lanes, low);
  for (float lane : lanes) lowest = lane < lowest ? lane : lowest;
  return i < frames ? StoreGains(gains + i, stored + i, frames - i, lowest) : lowest;
}

// Four samples of ApplyGainsWide; answers the products before they are rounded to float.
[[gnu::target("avx"), gnu::always_inline]] inline __m256d ApplyFour(const double* gains, const float* in, float* out) noexcept {
  const __m256d y = _mm256_mul_pd(_mm256_loadu_pd(gains), _mm256_cvtps_pd(_mm_loadu_ps(in)));
  _mm_storeu_ps(out, _mm256_cvtpd_ps(y));
  return y;
}

// Eight samples a turn. Measuring, the outputs are compared before they are rounded: rounding
// keeps their order, so the largest product rounds to the largest output, and the comparisons
// stay off the unit that the conversions keep busy.
template <bool kMeasure>
[[gnu::target("avx")]] void ApplyGainsWide(const double* gains, const float* in, float* out, int32_t frames, float* peak) noexcept {
  const __m256d sign = _mm256_set1_pd(-0.0);
  __m256d written = _mm256_set1_pd(*peak), other = written;
  int32_t i = 0;
  for (; i + 8 <= frames; i += 8) {
    const __m256d a = ApplyFour(gains + i, in + i, out + i), b = ApplyFour(gains + i + 4, in + i + 4, out + i + 4);
    if constexpr (kMeasure) {
      written = _mm256_max_pd(_mm256_andnot_pd(sign, a), written);
      other = _mm256_max_pd(_mm256_andnot_pd(sign, b), other);
    }
  }
  if (i + 4 <= frames) {
    const __m256d a = ApplyFour(gains + i, in + i, out + i);
    if constexpr (kMeasure) written = _mm256_max_pd(_mm256_andnot_pd(sign, a), written);
    i += 4;
  }
  if constexpr (kMeasure) {
    written = _mm256_max_pd(written, other);
    __m128d y = _mm_max_pd(_mm256_castpd256_pd128(written), _mm256_extractf128_pd(written, 1));
    *peak = static_cast<float>(_mm_cvtsd_f64(_mm_max_sd(y, _mm_unpackhi_pd(y, y))));
  }
  _mm256_zeroupper();
  if (i < frames) ApplyGains<kMeasure>(gains + i, in + i, out + i, frames - i, peak);
}

// Eight samples of a channel, written with one store; answers them as written.
[[gnu::target("avx"), gnu::always_inline]] inline __m256 ApplyEight(const double* gains, const float* in,
                                                                     float* out) noexcept {
  const __m128 low = _mm256_cvtpd_ps(_mm256_mul_pd(_mm256_loadu_pd(gains), _mm256_cvtps_pd(_mm_loadu_ps(in))));
  const __m128 high = _mm256_cvtpd_ps(_mm256_mul_pd(_mm256_loadu_pd(gains + 4), _mm256_cvtps_pd(_mm_loadu_ps(in + 4))));
  const __m256 y = _mm256_set_m128(high, low);
  _mm256_storeu_ps(out, y);
  return y;
}

// The larger of each lane of the two halves.
[[gnu::target("avx"), gnu::always_inline]] inline __m128 FoldHalves(__m256 v) noexcept {
  return _mm_max_ps(_mm256_castps256_ps128(v), _mm256_extractf128_ps(v, 1));
}

// The largest lane of each of two running peaks, folded together: lane by lane [first, second,
// first, second], then the two halves of that.
[[gnu::target("avx"), gnu::always_inline]] inline void FoldPair(__m256 first, __m256 second, float& a, float& b) noexcept {
  const __m128 x = FoldHalves(first), y = FoldHalves(second);
  const __m128 both = _mm_max_ps(_mm_unpacklo_ps(x, y), _mm_unpackhi_ps(x, y));
  const __m128 peak = _mm_max_ps(both, _mm_movehl_ps(both, both));
  a = _mm_cvtss_f32(peak);
  b = _mm_cvtss_f32(_mm_shuffle_ps(peak, peak, 1));
}

// The inputs' peaks eight samples at a time, both channels in one loop (a single channel is read
// as both), reduced together: at short blocks the reductions cost as much as the loop.
[[gnu::target("avx")]] void MeasureInputsWide(const float* const* in, int32_t channels, int32_t frames,
                                              float (*peaks)[2]) noexcept {
  const __m256 signs = _mm256_set1_ps(-0.0f);
  const float *first = in[0], *second = in[channels - 1];
  __m256 a = _mm256_set1_ps(peaks[0][0]), b = _mm256_set1_ps(peaks[channels - 1][0]);
  int32_t i = 0;
  for (; i + 8 <= frames; i += 8) {
    a = _mm256_max_ps(_mm256_andnot_ps(signs, _mm256_loadu_ps(first + i)), a);
    b = _mm256_max_ps(_mm256_andnot_ps(signs, _mm256_loadu_ps(second + i)), b);
  }
  FoldPair(a, b, peaks[0][0], peaks[channels - 1][0]);
  _mm256_zeroupper();
  if (i < frames) {
    const float* rest[KDynamicsProcessor::kMeasuredChannels];
    for (size_t ch = 0; ch < static_cast<size_t>(channels); ++ch) rest[ch] = in[ch] + i;
    MeasureInputs(rest, channels, frames - i, peaks);
  }
}

// Two channels with the same gains (a linked stereo pair), eight samples a turn. Measuring, the
// outputs are compared as written, eight to a register, and both running peaks are reduced
// together at the end: with blocks of a few dozen samples the reduction is a good part of the
// measuring's cost.
template <bool kMeasure>
[[gnu::target("avx")]] void ApplyGainsPairWide(const double* gains, const float* const* in, float* const* out,
                                               int32_t frames, float (*peaks)[2]) noexcept {
  const __m256 signs = _mm256_set1_ps(-0.0f);
  const float *left = in[0], *right = in[1];
  float *leftOut = out[0], *rightOut = out[1];
  __m256 wroteLeft = _mm256_set1_ps(peaks[0][1]), wroteRight = _mm256_set1_ps(peaks[1][1]);
  int32_t i = 0;
  for (; i + 8 <= frames; i += 8) {
    // The right input is read before the left output is stored: an output may be its input.
    const __m256 y = ApplyEight(gains + i, left + i, leftOut + i);
    const __m256 w = ApplyEight(gains + i, right + i, rightOut + i);
    if constexpr (kMeasure) {
      wroteLeft = _mm256_max_ps(_mm256_andnot_ps(signs, y), wroteLeft);
      wroteRight = _mm256_max_ps(_mm256_andnot_ps(signs, w), wroteRight);
    }
  }
  if constexpr (kMeasure) FoldPair(wroteLeft, wroteRight, peaks[0][1], peaks[1][1]);
  _mm256_zeroupper();
  if (i < frames)
    for (size_t ch = 0; ch < 2; ++ch) ApplyGainsWide<kMeasure>(gains + i, in[ch] + i, out[ch] + i, frames - i, &peaks[ch][1]);
}

// Without AVX a pair is each channel in turn.
template <bool kMeasure>
void ApplyGainsPair(const double* gains, const float* const* in, float* const* out, int32_t frames,
                    float (*peaks)[2]) noexcept {
  for (size_t ch = 0; ch < 2; ++ch) ApplyGains<kMeasure>(gains, in[ch], out[ch], frames, &peaks[ch][1]);
}

bool HasAVX() noexcept {
  static const bool avx = __builtin_cpu_supports("avx");
  return avx;
}

}  // namespace

KDynamicsProcessor::KDynamicsProcessor() noexcept {
  squareSum_ = HasAVX() ? SquareSumWide : SquareSum;
  storeGains_ = HasAVX() ? StoreGainsWide : StoreGains;
  MeasurePeaks(false);
  Update(KDynamicsSettings{});
}

void KDynamicsProcessor::MeasurePeaks(bool on) noexcept {
  measuring_ = on;
  if (HasAVX()) {
    measureInputs_ = on ? MeasureInputsWide : nullptr;
    applyGains_ = on ? ApplyGainsWide<true> : ApplyGainsWide<false>;
    applyPair_ = on ? ApplyGainsPairWide<true> : ApplyGainsPairWide<false>;
  } else {
    measureInputs_ = on ? MeasureInputs : nullptr;
    applyGains_ = on ? ApplyGains<true> : ApplyGains<false>;
    applyPair_ = on ? ApplyGainsPair<true> : ApplyGainsPair<false>;
  }
}

// One detector fed by the mean square of all channels; every channel gets its gain. The work
// goes in passes over the piece so that all but the envelope itself run two samples at a time.
void KDynamicsProcessor::DetectLinked(KDynamicsProcessor& self, int32_t channels, int32_t frames) noexcept {
  double* work = self.work_.data();
  // The mean over the channels rides on the smoothing's complement, in single precision.
  const double share = self.meanSquare_.complement * (1.0f / static_cast<float>(channels));
  self.squareSum_(self.pieceDetect_.data(), channels, 0, frames, self.gIn_, share, work);
  Envelope(work, self.envelope_.data(), frames, self.meanSquare_.coefficient, self.attack_, self.release_, self.p_[0],
           self.e_[0]);
  self.curve_.Gains(work, work, frames);
  self.lowestGain_ = self.storeGains_(work, self.gains_.data(), frames, self.lowestGain_);
  if (channels == 2) {
    self.applyPair_(work, self.pieceIn_.data(), self.pieceOut_.data(), frames, self.peaks_);
    return;
  }
  for (size_t ch = 0; ch < static_cast<size_t>(channels); ++ch)
    self.applyGains_(work, self.pieceIn_[ch], self.pieceOut_[ch], frames, &self.PeaksOf(ch)[1]);
}

// A detector, an envelope row and a gain row per channel.
void KDynamicsProcessor::DetectUnlinked(KDynamicsProcessor& self, int32_t channels, int32_t frames) noexcept {
  double* work = self.work_.data();
  for (size_t ch = 0; ch < static_cast<size_t>(channels); ++ch) {
    const size_t row = ch * static_cast<size_t>(self.maxFrames_);
    self.squareSum_(self.pieceDetect_.data() + ch, 1, 0, frames, self.gIn_, self.meanSquare_.complement, work);
    Envelope(work, self.envelope_.data() + row, frames, self.meanSquare_.coefficient, self.attack_, self.release_,
             self.p_[ch], self.e_[ch]);
    self.curve_.Gains(work, work, frames);
    self.lowestGain_ = self.storeGains_(work, self.gains_.data() + row, frames, self.lowestGain_);
    self.applyGains_(work, self.pieceIn_[ch], self.pieceOut_[ch], frames, &self.PeaksOf(ch)[1]);
  }
}

// Ratio 1:1 without a custom shape: a plain gain, in place or copying.
void KDynamicsProcessor::Amplify(int32_t n, const float* const* in, float* const* out, int32_t channels) noexcept {
  const auto factor = static_cast<float>(gIn_ * gOut_);
  for (int32_t ch = 0; ch < channels; ++ch) {
    const float* x = in[ch];
    float* y = out[ch];
    if (!measuring_) {
      for (int32_t i = 0; i < n; ++i) y[i] = factor * x[i];
      continue;
    }
    float* peaks = PeaksOf(static_cast<size_t>(ch));
    for (int32_t i = 0; i < n; ++i) {
      const float v = x[i];
      y[i] = factor * v;
      peaks[0] = Larger(std::fabs(v), peaks[0]);
      peaks[1] = Larger(std::fabs(y[i]), peaks[1]);
    }
  }
}

void KDynamicsProcessor::Decay(int32_t n) noexcept {
  if (idle_) return;
  const int32_t states = std::min(linked_ ? 1 : channels_, maxChannels_);
  const double c = meanSquare_.coefficient;
  for (size_t j = 0; j < static_cast<size_t>(states); ++j) {
    // Without input every channel is silent alike: one that has died away restarts them all.
    if (e_[j] < kSilent) {
      Reset();
      continue;
    }
    double p = p_[j], e = e_[j];
    for (int32_t i = 0; i < n; ++i) {
      p = c * p;
      const double r = std::sqrt(p);
      e = r + (e < r ? attack_ : release_) * (e - r);
    }
    p_[j] = p;
    e_[j] = e;
  }
  Settle(states);
}

// Once per block: a detector that a NaN or infinity reached restarts instead of poisoning every
// later block, and a mean square or envelope fallen silent becomes exact zero before it can reach
// the denormal range. The mean square falls far faster than a slow release, so each goes alone.
void KDynamicsProcessor::Settle(int32_t states) noexcept {
  for (size_t j = 0; j < static_cast<size_t>(states); ++j) {
    if (!(p_[j] <= kLargest && e_[j] <= kLargest)) {
      p_[j] = e_[j] = 0.0;
      curve_.ResetCache();
    }
    if (p_[j] < kSilent * kSilent) p_[j] = 0.0;
    if (e_[j] < kSilent) e_[j] = 0.0;
  }
}

// The square root of the mean square falls by √c a sample and the envelope follows it at the
// release: counting first until the root is under half the rest and then until the envelope has
// come within the other half is a bound for both together. A coefficient of 0 takes no time.
uint32_t KDynamicsProcessor::ReleaseSamples() const noexcept {
  const double from = gIn_, rest = curve_.Rest();
  if (idle_ || !(from > rest)) return 0;
  const double fall = std::log(rest / (2.0 * from));
  const double samples = fall / std::log(std::sqrt(meanSquare_.coefficient)) + fall / std::log(release_);
  return samples < 4e9 ? static_cast<uint32_t>(std::ceil(samples)) : UINT32_MAX;
}

void KDynamicsProcessor::Reset() noexcept {
  std::fill(p_.begin(), p_.end(), 0.0);
  std::fill(e_.begin(), e_.end(), 0.0);
  curve_.ResetCache();
  bands_.Reset();
}
