#include "dsp/KTransferCurve.h"

#include <immintrin.h>

#include <algorithm>
#include <cmath>
#include <limits>

namespace {

// Differences and detector values below this count as zero.
constexpr double kTiny = 1e-10;
// The knee reaches back from T by kneeSize/(4·√2) and forward by the same distance measured
// along the normal of the line above the threshold.
constexpr double kKneeReach = 0.1767766952966369;
constexpr double kSqrt2 = 1.4142135623730951;
// The centre of an arc whose two tangents are parallel: as far away as a double goes.
constexpr double kFarAway = 1.7e308;

}  // namespace

void KTransferShape::SetPoints(const Point* points, int32_t count) {
  segments_.clear();
  if (count < 2) return;
  segments_.reserve(static_cast<size_t>(count - 1));
  double x0 = points[0].level, y0 = points[0].output;
  for (int32_t k = 1; k < count; ++k) {
    const double x1 = std::max(points[k].level, x0), y1 = points[k].output;
    // A vertical step holds no levels of its own; beyond the last point it continues flat.
    const double slope = x1 - x0 < kTiny ? 0.0 : (y1 - y0) / (x1 - x0);
    segments_.push_back({x1, slope, y1 - slope * x1});
    x0 = x1;
    y0 = y1;
  }
}

int32_t KTransferShape::Walk(double level, Cursor& cursor) const noexcept {
  const int32_t last = Count() - 1;
  int32_t k = std::min(cursor.index, last);
  // Written so that a NaN left in the cursor walks down rather than strand the search.
  if (!(level >= cursor.level)) {
    while (k > 0 && level < segments_[static_cast<size_t>(k - 1)].end) --k;
  }
  while (k < last && level >= segments_[static_cast<size_t>(k)].end) ++k;
  cursor = {k, level};
  return k;
}

// The laws of every variant: d at or below the knee start gives the plain gain G, d at or above
// the knee end follows the line, and the knee lies between (the hard knee has none).
struct KTransferLaws {
  using K = KTransferCurve;

  static double LineGain(const K& k, double d) noexcept { return (k.bG_ + k.mG_ * d) / d; }
  static double LineCurve(const K& k, double d) noexcept { return k.bM_ + k.mM_ * d; }

  static double HardGain(K& k, double d) noexcept { return d <= k.t_ ? k.g_ : LineGain(k, d); }
  static double HardCurve(const K& k, double d) noexcept { return d <= k.t_ ? k.makeUp_ * d : LineCurve(k, d); }

  // Straight from (s0, y0) to (s1, y1). Both ends hold the make-up already and G holds it again,
  // so with "maximize" the gain inside the knee carries it twice. That is the knee users hear.
  static double Chord(const K& k, double d) noexcept { return k.y0_ + (d - k.s0_) * k.w_ * (k.y1_ - k.y0_); }
  static double LinearGain(K& k, double d) noexcept {
    return d <= k.s0_ ? k.g_ : (d >= k.s1_ ? LineGain(k, d) : Chord(k, d) * k.g_ / d);
  }
  static double LinearCurve(const K& k, double d) noexcept {
    return d <= k.s0_ ? k.makeUp_ * d : (d >= k.s1_ ? LineCurve(k, d) : Chord(k, d));
  }

  // The circle tangent to the identity at s0 and to the line at s1, without the make-up.
  static double Arc(const K& k, double d) noexcept {
    const double x = d - k.cx_;
    return std::sqrt(k.r2_ - x * x) + k.cy_;
  }
  static double SoftGain(K& k, double d) noexcept {
    return d <= k.s0_ ? k.g_ : (d >= k.s1_ ? LineGain(k, d) : Arc(k, d) * k.g_ / d);
  }
  static double SoftCurve(const K& k, double d) noexcept {
    return d <= k.s0_ ? k.makeUp_ * d : (d >= k.s1_ ? LineCurve(k, d) : k.makeUp_ * Arc(k, d));
  }

  // The shape is drawn over amplitude, the detector works on its square.
  static double ShapeAt(const KTransferShape& shape, double d, KTransferShape::Cursor& cursor) noexcept {
    const double a = std::sqrt(d);
    const double y = shape[shape.Walk(a, cursor)].At(a);
    return y * y;
  }
  static double CustomGain(K& k, double d) noexcept {
    return d <= kTiny ? k.g_ : k.g_ * ShapeAt(*k.shape_, d, k.cursor_) / d;
  }
  // The editor may draw while the audio runs: a search of its own leaves the audio's cache alone.
  static double CustomCurve(const K& k, double d) noexcept {
    KTransferShape::Cursor own;
    return d <= kTiny ? d : ShapeAt(*k.shape_, d, own);
  }

  // Idle, and a custom shape without a graph.
  static double FlatGain(K& k, double) noexcept { return k.g_; }
  static double FlatCurve(const K& k, double d) noexcept { return k.makeUp_ * d; }

  // ---- the laws over a block, two levels per SSE2 register in the same operations as above
  using V = __m128d;
  static V Select(V mask, V yes, V no) noexcept { return _mm_or_pd(_mm_and_pd(mask, yes), _mm_andnot_pd(mask, no)); }
  static V LineNumerator(const K& k, V d) noexcept { return _mm_add_pd(_mm_set1_pd(k.bG_), _mm_mul_pd(_mm_set1_pd(k.mG_), d)); }
  // The envelope moves slowly, so its levels come in long runs on one side of a bound: a register
  // whose levels all rest at G, or that holds none inside the knee, skips the work whose lanes the
  // selects would drop (a NaN rests nowhere and lies inside the knee, and takes every path).
  static V HardGain(const K& k, V d) noexcept {
    const V rest = _mm_cmple_pd(d, _mm_set1_pd(k.t_));
    if (_mm_movemask_pd(rest) == 3) return _mm_set1_pd(k.g_);
    return Select(rest, _mm_set1_pd(k.g_), _mm_div_pd(LineNumerator(k, d), d));
  }
  // Below the knee G; above it the line, inside it the knee's level times G, either over d: the
  // numerators are chosen first, so that one division serves both.
  template <V (*Knee)(const K&, V)>
  static V KneeGain(const K& k, V d) noexcept {
    const V rest = _mm_cmple_pd(d, _mm_set1_pd(k.s0_)), line = _mm_cmpge_pd(d, _mm_set1_pd(k.s1_));
    if (_mm_movemask_pd(rest) == 3) return _mm_set1_pd(k.g_);
    const V numerator = _mm_movemask_pd(_mm_or_pd(rest, line)) == 3
                            ? LineNumerator(k, d)
                            : Select(line, LineNumerator(k, d), _mm_mul_pd(Knee(k, d), _mm_set1_pd(k.g_)));
    return Select(rest, _mm_set1_pd(k.g_), _mm_div_pd(numerator, d));
  }
  static V Chord(const K& k, V d) noexcept {
    return _mm_add_pd(_mm_set1_pd(k.y0_),
                      _mm_mul_pd(_mm_mul_pd(_mm_sub_pd(d, _mm_set1_pd(k.s0_)), _mm_set1_pd(k.w_)), _mm_set1_pd(k.y1_ - k.y0_)));
  }
  static V Arc(const K& k, V d) noexcept {
    const V x = _mm_sub_pd(d, _mm_set1_pd(k.cx_));
    return _mm_add_pd(_mm_sqrt_pd(_mm_sub_pd(_mm_set1_pd(k.r2_), _mm_mul_pd(x, x))), _mm_set1_pd(k.cy_));
  }
  static V LinearGain(const K& k, V d) noexcept { return KneeGain<Chord>(k, d); }
  static V SoftGain(const K& k, V d) noexcept { return KneeGain<Arc>(k, d); }

  // Pairs through the register law, an odd last level through the scalar one.
  template <V (*Pair)(const K&, V), double (*One)(K&, double) noexcept>
  static void Block(K& k, const double* levels, double* gains, int32_t n) noexcept {
    int32_t i = 0;
    for (; i + 2 <= n; i += 2) _mm_storeu_pd(gains + i, Pair(k, _mm_loadu_pd(levels + i)));
    if (i < n) gains[i] = One(k, levels[i]);
  }

  // The same laws four levels at a time, for processors with AVX (chosen when configuring). The
  // operations are those above lane by lane, without fused multiply-adds, so the gains agree to
  // the last bit.
  using W = __m256d;
  [[gnu::target("avx")]] static W Select(W mask, W yes, W no) noexcept { return _mm256_blendv_pd(no, yes, mask); }
  [[gnu::target("avx")]] static W LineNumerator(const K& k, W d) noexcept {
    return _mm256_add_pd(_mm256_set1_pd(k.bG_), _mm256_mul_pd(_mm256_set1_pd(k.mG_), d));
  }
  [[gnu::target("avx")]] static W HardGain(const K& k, W d) noexcept {
    const W rest = _mm256_cmp_pd(d, _mm256_set1_pd(k.t_), _CMP_LE_OQ);
    if (_mm256_movemask_pd(rest) == 15) return _mm256_set1_pd(k.g_);
    return Select(rest, _mm256_set1_pd(k.g_), _mm256_div_pd(LineNumerator(k, d), d));
  }
  template <W (*Knee)(const K&, W)>
  [[gnu::target("avx")]] static W KneeGain(const K& k, W d) noexcept {
    const W rest = _mm256_cmp_pd(d, _mm256_set1_pd(k.s0_), _CMP_LE_OQ), line = _mm256_cmp_pd(d, _mm256_set1_pd(k.s1_), _CMP_GE_OQ);
    if (_mm256_movemask_pd(rest) == 15) return _mm256_set1_pd(k.g_);
    const W numerator = _mm256_movemask_pd(_mm256_or_pd(rest, line)) == 15
                            ? LineNumerator(k, d)
                            : Select(line, LineNumerator(k, d), _mm256_mul_pd(Knee(k, d), _mm256_set1_pd(k.g_)));
    return Select(rest, _mm256_set1_pd(k.g_), _mm256_div_pd(numerator, d));
  }
  [[gnu::target("avx")]] static W Chord(const K& k, W d) noexcept {
    return _mm256_add_pd(_mm256_set1_pd(k.y0_), _mm256_mul_pd(_mm256_mul_pd(_mm256_sub_pd(d, _mm256_set1_pd(k.s0_)), _mm256_set1_pd(k.w_)),
                                                              _mm256_set1_pd(k.y1_ - k.y0_)));
  }
  [[gnu::target("avx")]] static W Arc(const K& k, W d) noexcept {
    const W x = _mm256_sub_pd(d, _mm256_set1_pd(k.cx_));
    return _mm256_add_pd(_mm256_sqrt_pd(_mm256_sub_pd(_mm256_set1_pd(k.r2_), _mm256_mul_pd(x, x))), _mm256_set1_pd(k.cy_));
  }
  [[gnu::target("avx")]] static W LinearGain(const K& k, W d) noexcept { return KneeGain<Chord>(k, d); }
  [[gnu::target("avx")]] static W SoftGain(const K& k, W d) noexcept { return KneeGain<Arc>(k, d); }
  template <W (*Quad)(const K&, W), V (*Pair)(const K&, V), double (*One)(K&, double) noexcept>
  [[gnu::target("avx")]] static void WideBlock(K& k, const double* levels, double* gains, int32_t n) noexcept {
    int32_t i = 0;
    for (; i + 4 <= n; i += 4) _mm256_storeu_pd(gains + i, Quad(k, _mm256_loadu_pd(levels + i)));
    _mm256_zeroupper();  // code without AVX after this must not pay for the upper halves
    Block<Pair, One>(k, levels + i, gains + i, n - i);
  }
  // The block law of a variant for this processor.
  template <W (*Quad)(const K&, W), V (*Pair)(const K&, V), double (*One)(K&, double) noexcept>
  static K::GainBlock Widest() noexcept {
    static const bool avx = __builtin_cpu_supports("avx");
    return avx ? WideBlock<Quad, Pair, One> : Block<Pair, One>;
  }

  // Laws that keep state between levels (the custom shape's search) go one level at a time.
  template <double (*One)(K&, double) noexcept>
  static void Each(K& k, const double* levels, double* gains, int32_t n) noexcept {
    for (int32_t i = 0; i < n; ++i) gains[i] = One(k, levels[i]);
  }
  static void FlatBlock(K& k, const double*, double* gains, int32_t n) noexcept { std::fill_n(gains, n, k.g_); }
};

void KTransferCurve::Configure(const Settings& settings) noexcept {
  t_ = settings.threshold * settings.threshold;
  // T^(1 − 1/ratio) through decibels, multiplied out in exactly this order: every setting's
  // curve, and so every render, depends on its last bit.
  full_ = std::exp(0.11512925464970228 * (1.0 - 1.0 / settings.ratio) * 8.685889638065037 * std::log(t_));
  m_ = std::abs(t_ - 1.0) < kTiny ? 1.0 : (full_ - t_) / (1.0 - t_);
  b_ = t_ * (1.0 - m_);
  makeUp_ = settings.maximize && !settings.customShape ? 1.0 / full_ : 1.0;
  g_ = makeUp_ * settings.inputGain * settings.outputGain;
  inverseG_ = 1.0 / g_;
  bG_ = b_ * g_;
  mG_ = m_ * g_;
  bM_ = b_ * makeUp_;
  mM_ = m_ * makeUp_;
  s0_ = s1_ = t_;
  shape_ = settings.customShape ? settings.shape : nullptr;
  cursor_ = {};

  const bool knee = settings.kneeMode == kLinearKnee || settings.kneeMode == kSoftKnee;
  if (settings.customShape) {
    variant_ = kCustom;
    const bool drawn = shape_ && shape_->Count() > 0;
    gain_ = drawn ? KTransferLaws::CustomGain : KTransferLaws::FlatGain;
    curve_ = drawn ? KTransferLaws::CustomCurve : KTransferLaws::FlatCurve;
    gains_ = drawn ? KTransferLaws::Each<KTransferLaws::CustomGain> : KTransferLaws::FlatBlock;
  } else if (std::abs(settings.ratio - 1.0) < kTiny) {
    variant_ = kIdle;
    gain_ = KTransferLaws::FlatGain;
    curve_ = KTransferLaws::FlatCurve;
    gains_ = KTransferLaws::FlatBlock;
  } else if (!knee || !(settings.kneeSize > 0.0) || std::abs(m_ - 1.0) < kTiny) {
    variant_ = kHard;
    gain_ = KTransferLaws::HardGain;
    curve_ = KTransferLaws::HardCurve;
    gains_ = KTransferLaws::Widest<KTransferLaws::HardGain, KTransferLaws::HardGain, KTransferLaws::HardGain>();
  } else {
    ShapeKnee(settings.kneeMode, settings.kneeSize);
  }
}

double KTransferCurve::Rest() const noexcept {
  switch (variant_) {
    case kIdle: return std::numeric_limits<double>::infinity();
    case kHard: return t_;
    case kCustom: return kTiny;
    case kLinear:
    case kSoft: break;
  }
  return s0_;
}

void KTransferCurve::ShapeKnee(int32_t kneeMode, double kneeSize) noexcept {
  s0_ = std::max(t_ - kKneeReach * kneeSize, kTiny);
  s1_ = t_ + kSqrt2 * (t_ - s0_) / std::sqrt(m_ * m_ + 1.0);
  y0_ = KTransferLaws::HardCurve(*this, s0_);
  y1_ = KTransferLaws::HardCurve(*this, s1_);
  w_ = std::abs(s1_ - s0_) < kTiny ? 0.0 : 1.0 / (s1_ - s0_);
  if (kneeMode == kLinearKnee) {
    variant_ = kLinear;
    gain_ = KTransferLaws::LinearGain;
    curve_ = KTransferLaws::LinearCurve;
    gains_ = KTransferLaws::Widest<KTransferLaws::LinearGain, KTransferLaws::LinearGain, KTransferLaws::LinearGain>();
    return;
  }
  const double u0 = y0_ / makeUp_, u1 = y1_ / makeUp_;
  if (m_ - 1.0 == 0.0) {
    cx_ = cy_ = kFarAway;
  } else {
    const double q = ((u0 - u1) * m_ + (s0_ - s1_)) / (m_ - 1.0);
    cx_ = s0_ + q;
    cy_ = u0 - q;
  }
  r2_ = (cx_ - s0_) * (cx_ - s0_) + (cy_ - u0) * (cy_ - u0);
  variant_ = kSoft;
  gain_ = KTransferLaws::SoftGain;
  curve_ = KTransferLaws::SoftCurve;
  gains_ = KTransferLaws::Widest<KTransferLaws::SoftGain, KTransferLaws::SoftGain, KTransferLaws::SoftGain>();
}
