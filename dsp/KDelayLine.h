#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

// One channel's delay line in double precision, read at fractional and moving delays.
//
// Reads between samples use the four-point cubic Hermite (Catmull-Rom) interpolator. It keeps no
// state, so a delay that moves every sample (chorus, flanger, tape-like time changes) reads
// smoothly, where an allpass interpolator's memory rings at each change; and its error is far
// below linear interpolation's, whose dulling of the highs varies with the fraction and turns a
// modulated delay into noise. A whole-sample delay reads the stored sample exactly.
//
// Each sample is read before it is written, so that a line can feed back into itself: Read(d)
// at the time of writing x[n] returns x[n − d]. Prepare allocates; everything else runs on the
// audio thread.
class KDelayLine {
public:
  static constexpr double kShortest = 2.0;  // the interpolator's newest point must be written

  // Room for delays up to `longest` samples; clears the line. Not for the audio thread.
  void Prepare(int32_t longest);
  void Clear() noexcept;

  // The longest delay that Read honours.
  double Longest() const noexcept { return longest_; }

  void Write(double x) noexcept {
    buffer_[static_cast<size_t>(write_)] = x;
    write_ = (write_ + 1) & mask_;
  }

  // The input `delay` samples before the one about to be written, clamped to
  // [kShortest, Longest()].
  double Read(double delay) const noexcept {
    const double d = delay < kShortest ? kShortest : (delay > longest_ ? longest_ : delay);
    const int32_t whole = static_cast<int32_t>(d);
    const double t = whole - d + 1.0;  // from the older neighbour towards the newer, in (0, 1]
    const int32_t at = write_ - whole - 1;
    const double y0 = At(at - 1), y1 = At(at), y2 = At(at + 1), y3 = At(at + 2);
    const double c1 = 0.5 * (y2 - y0);
    const double c2 = y0 - 2.5 * y1 + 2.0 * y2 - 0.5 * y3;
    const double c3 = 0.5 * (y3 - y0) + 1.5 * (y1 - y2);
    return t == 1.0 ? y2 : ((c3 * t + c2) * t + c1) * t + y1;
  }

  // A whole-sample delay of at least 1 and at most Longest(), without interpolation.
  double ReadWhole(int32_t delay) const noexcept { return At(write_ - delay); }

  // out[i] = Read(delays[i]) while in[i] is written; `out` may be `in`.
  void Run(const double* in, const double* delays, double* out, int32_t n) noexcept;

private:
  double At(int32_t index) const noexcept { return buffer_[static_cast<size_t>(index & mask_)]; }

  std::vector<double> buffer_ = std::vector<double>(4, 0.0);
  int32_t mask_ = 3;
  int32_t write_ = 0;
  double longest_ = kShortest;
};
