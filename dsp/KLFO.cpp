#include "dsp/KLFO.h"

#include <algorithm>
#include <cmath>

#include "dsp/KDecibels.h"
#include "dsp/KNoteValues.h"

namespace {

constexpr double kTwoPi = 6.283185307179586;
constexpr double kPi = 3.141592653589793;
constexpr uint32_t kSeed = 0x9E3779B9u;

// A cycle no shorter than two samples, no longer than about six hours at 48 kHz.
constexpr double kShortestCycle = 2.0;
constexpr double kLongestCycle = 1e9;
constexpr double kFollowSteps = 1024.0;  // steps per sample of a cycle taken from the song position

// For x in [0, 1): a quarter cycle ahead of a tent that peaks in the middle.
double Triangle(double x) noexcept {
  const double t = x + 0.25 - (x >= 0.75 ? 1.0 : 0.0);
  return 1.0 - 4.0 * std::abs(t - 0.5);
}
double Eased(double from, double to, double x) noexcept { return from + (to - from) * (0.5 - 0.5 * std::cos(kPi * x)); }

// One step of a 32-bit xorshift, mapped onto [-1, 1].
double NextRandom(uint32_t& r) noexcept {
  r ^= r << 13;
  r ^= r >> 17;
  r ^= r << 5;
  return r * (2.0 / 4294967295.0) - 1.0;
}

// A repeatable random value for cycle k of the pictures.
double PatternValue(double k) noexcept {
  uint32_t r = kSeed ^ static_cast<uint32_t>(static_cast<int64_t>(k) * 2654435761u);
  NextRandom(r);
  return NextRandom(r);
}

}  // namespace

const char* const KLFO::kShapeNames[kShapeCount] = {"Sine",   "Triangle",      "Saw up",         "Saw down",
                                                    "Square", "Random smooth", "Sample & hold"};

KLFO::KLFO() noexcept : run_(&Run<kSine>) { Reset(); }

double KLFO::Draw() noexcept { return NextRandom(random_); }

void KLFO::Update(const KLFOSettings& s) noexcept {
  quarters_ = s.note >= 0 && s.note < kNoteValueCount && s.tempo > 0.0 ? kNoteValues[s.note].quarters : 0.0;
  const double seconds = quarters_ > 0.0 ? quarters_ * 60.0 / s.tempo : (s.rate > 0.0 ? 1.0 / s.rate : kLongestCycle);
  const double length = std::clamp(seconds * s.sampleRate, kShortestCycle, kLongestCycle);
  if (length != length_) {
    position_ = std::min(position_ / length_ * length, std::nextafter(length, 0.0));
    length_ = length;
  }
  start_ = s.phase - std::floor(s.phase);
  keep_ = KSmoothingCoefficient(s.sampleRate, s.smoothing);
  shape_ = std::clamp(s.shape, 0, kShapeCount - 1);
  static constexpr void (*kRuns[kShapeCount])(KLFO&, double*, int32_t) noexcept = {
      &Run<kSine>, &Run<kTriangle>, &Run<kSawUp>, &Run<kSawDown>, &Run<kSquare>, &Run<kRandomSmooth>, &Run<kSampleAndHold>};
  run_ = kRuns[shape_];
}

void KLFO::Reset() noexcept {
  position_ = start_ * length_;
  random_ = kSeed;
  held_ = Draw();
  next_ = Draw();
  const double x = start_;
  switch (shape_) {
    case kRandomSmooth: smoothed_ = Eased(held_, next_, x); break;
    case kSampleAndHold: smoothed_ = held_; break;
    default: smoothed_ = Value(shape_, x);
  }
}

bool KLFO::Follow(double quarterNotes) noexcept {
  if (quarters_ <= 0.0 || !(quarterNotes >= 0.0)) return false;
  const double cycles = quarterNotes / quarters_ + start_;
  // To a 1024th of a sample: the host's position reaches here through sums that round
  // differently with the way the blocks are cut, and must land the cycle in the same place.
  const double wanted = std::round((cycles - std::floor(cycles)) * length_ * kFollowSteps) / kFollowSteps;
  const double off = std::abs(wanted - position_);
  if (std::min(off, length_ - off) <= 0.5) return false;
  position_ = wanted < length_ ? wanted : 0.0;
  return true;
}

void KLFO::SetPhase(double cycles) noexcept {
  position_ = std::min((cycles - std::floor(cycles)) * length_, std::nextafter(length_, 0.0));
}

double KLFO::Value(int32_t shape, double phase) noexcept {
  const double x = phase - std::floor(phase);
  switch (shape) {
    case kSine: return std::sin(kTwoPi * x);
    case kTriangle: return Triangle(x);
    case kSawUp: return 2.0 * x - 1.0;
    case kSawDown: return 1.0 - 2.0 * x;
    case kSquare: return x < 0.5 ? 1.0 : -1.0;
    case kRandomSmooth: return Eased(PatternValue(std::floor(phase)), PatternValue(std::floor(phase) + 1.0), x);
    default: return PatternValue(std::floor(phase));
  }
}

template <int S>
void KLFO::Run(KLFO& lfo, double* out, int32_t n) noexcept {
  const double length = lfo.length_, step = 1.0 / length, keep = lfo.keep_, take = 1.0 - keep;
  double p = lfo.position_, y = lfo.smoothed_;
  for (int32_t i = 0; i < n; ++i) {
    const double x = p * step;
    double v;
    if constexpr (S == kSine) v = std::sin(kTwoPi * x);
    if constexpr (S == kTriangle) v = Triangle(x);
    if constexpr (S == kSawUp) v = 2.0 * x - 1.0;
    if constexpr (S == kSawDown) v = 1.0 - 2.0 * x;
    if constexpr (S == kSquare) v = x < 0.5 ? 1.0 : -1.0;
    if constexpr (S == kRandomSmooth) v = Eased(lfo.held_, lfo.next_, x);
    if constexpr (S == kSampleAndHold) v = lfo.held_;
    y = keep * y + take * v;
    out[i] = y;
    p += 1.0;
    if (p >= length) {
      p -= length;
      if constexpr (S == kRandomSmooth) {
        lfo.held_ = lfo.next_;
        lfo.next_ = lfo.Draw();
      }
      if constexpr (S == kSampleAndHold) lfo.held_ = lfo.Draw();
    }
  }
  lfo.position_ = p;
  lfo.smoothed_ = y;
}

void KLFO::Fill(double* out, int32_t n) noexcept { run_(*this, out, n); }
