#include "dsp/KTransferCurve.h"

#include <algorithm>
#include <cmath>

#include "dsp/KDecibels.h"

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
};

void KTransferCurve::Configure(const Settings& settings) noexcept {
  t_ = settings.threshold * settings.threshold;
  full_ = KDecibelsToLinear((1.0 - 1.0 / settings.ratio) * KLinearToDecibels(t_));
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
  } else if (std::abs(settings.ratio - 1.0) < kTiny) {
    variant_ = kIdle;
    gain_ = KTransferLaws::FlatGain;
    curve_ = KTransferLaws::FlatCurve;
  } else if (!knee || !(settings.kneeSize > 0.0) || std::abs(m_ - 1.0) < kTiny) {
    variant_ = kHard;
    gain_ = KTransferLaws::HardGain;
    curve_ = KTransferLaws::HardCurve;
  } else {
    ShapeKnee(settings.kneeMode, settings.kneeSize);
  }
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
}
