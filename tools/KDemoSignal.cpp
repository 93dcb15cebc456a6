#include "tools/KDemoSignal.h"

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace {

constexpr double kTwoPi = 6.283185307179586;
constexpr double kBeat = 0.5;  // seconds at 120 beats per minute

// A small deterministic noise source (xorshift), uniform in -1..1.
class Noise {
public:
  double Next() {
    state_ ^= state_ << 13;
    state_ ^= state_ >> 7;
    state_ ^= state_ << 17;
    return static_cast<double>(state_ >> 11) / 4503599627370496.0 - 1.0;
  }

private:
  uint64_t state_ = 0x9E3779B97F4A7C15ull;
};

struct Stereo {
  double left = 0.0, right = 0.0;
  void Add(double value, double pan) {  // pan -1 (left) .. 1 (right), constant power
    const double angle = (pan + 1.0) * 0.25 * 3.141592653589793;
    left += value * std::cos(angle);
    right += value * std::sin(angle);
  }
};

// The chord of each bar as three frequencies, and its bass root: Am, F, C, G.
constexpr double kChords[4][3] = {{220.00, 261.63, 329.63}, {174.61, 220.00, 261.63}, {196.00, 261.63, 329.63}, {196.00, 246.94, 293.66}};
constexpr double kRoots[4] = {55.00, 43.65, 65.41, 49.00};

double Saw(double phase) { return 2.0 * (phase - std::floor(phase)) - 1.0; }

}  // namespace

KDemoSignal::KDemoSignal() {
  const int64_t frames = static_cast<int64_t>(kSeconds * kSampleRate);
  samples_.resize(static_cast<size_t>(frames) * 2);
  Noise noise;
  double kickPhase = 0.0, previousNoise = 0.0, bassState = 0.0, chordState[3] = {}, chordPhase[3] = {}, bassPhase = 0.0;
  double peak = 0.0;
  for (int64_t i = 0; i < frames; ++i) {
    const double t = static_cast<double>(i) / kSampleRate;
    const int bar = static_cast<int>(t / (4 * kBeat)) % 4;
    const double inBeat = std::fmod(t, kBeat);
    const double inEighth = std::fmod(t, kBeat / 2);
    const int beat = static_cast<int>(t / kBeat) % 4;
    Stereo mix;

    // Kick on beats 1 and 3: a falling sine.
    const double kickTime = std::fmod(t, 2 * kBeat);
    kickPhase += (50.0 + 110.0 * std::exp(-kickTime / 0.03)) / kSampleRate;
    mix.Add(0.9 * std::sin(kTwoPi * kickPhase) * std::exp(-kickTime / 0.25), 0.0);
    // Snare on beats 2 and 4: a noise burst over a short tone.
    const double white = noise.Next();
    if (beat % 2 == 1) mix.Add((0.35 * white + 0.25 * std::sin(kTwoPi * 185.0 * inBeat)) * std::exp(-inBeat / 0.09), -0.15);
    // Hats on every eighth: differenced (bright) noise, short.
    mix.Add(0.22 * (white - previousNoise) * std::exp(-inEighth / 0.018), 0.45);
    previousNoise = white;
    // Bass: the bar's root in eighths, a low-passed saw.
    bassPhase += kRoots[bar] / kSampleRate;
    bassState += 0.05 * (Saw(bassPhase) - bassState);
    mix.Add(0.7 * bassState * std::exp(-inEighth / 0.2), 0.0);
    // Chords: three soft saws spread across the stereo field.
    for (int v = 0; v < 3; ++v) {
      chordPhase[v] += kChords[bar][v] * (1.0 + 0.002 * (v - 1)) / kSampleRate;
      chordState[v] += 0.12 * (Saw(chordPhase[v]) - chordState[v]);
      mix.Add(0.12 * chordState[v] * (1.0 - std::exp(-std::fmod(t, 4 * kBeat) / 0.05)), -0.6 + 0.6 * v);
    }
    samples_[2 * i] = static_cast<float>(mix.left);
    samples_[2 * i + 1] = static_cast<float>(mix.right);
    peak = std::max({peak, std::fabs(mix.left), std::fabs(mix.right)});
  }
  const float scale = static_cast<float>(0.7 / peak);  // about -3 dBFS at the loudest
  for (float& sample : samples_) sample *= scale;
}

int64_t KDemoSignal::Read(float* interleaved, int64_t frames) {
  const int64_t count = std::min(frames, Frames() - position_);
  std::copy_n(samples_.begin() + position_ * 2, count * 2, interleaved);
  position_ += count;
  return count;
}
