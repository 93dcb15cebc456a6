#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

// The editable transfer graph of a custom shape: a polyline through points (input level, output
// level) in amplitude. Segment k holds the levels from the end of segment k − 1 (inclusive) up to
// its own end (exclusive); the first and the last segment carry their lines on past the outer
// points. The graph editor builds it; the audio thread only searches and evaluates it.
class KTransferShape {
public:
  struct Point {
    double level;
    double output;
  };

  struct Segment {
    double end;
    double slope;
    double offset;

    double At(double level) const noexcept { return offset + slope * level; }
  };

  // Where the last search ended: a level that moves slowly finds its segment in a step or two.
  struct Cursor {
    int32_t index = 0;
    double level = 0.0;
  };

  // Replaces the graph (allocates, so not on the audio thread). Points come in ascending level; a
  // point left of its predecessor is moved onto it. Fewer than two points leave the graph empty.
  void SetPoints(const Point* points, int32_t count);

  int32_t Count() const noexcept { return static_cast<int32_t>(segments_.size()); }
  const Segment& operator[](int32_t k) const noexcept { return segments_[static_cast<size_t>(k)]; }

  // The segment holding `level`, walking from the cursor and leaving it there. Needs Count() > 0.
  int32_t Walk(double level, Cursor& cursor) const noexcept;

private:
  std::vector<Segment> segments_;
};

// Maps the detector value d to a gain and, for the editor's graph, to an output level. The law
// is chosen once per Configure and held as a pair of function pointers, so that per-sample
// callers make one indirect call and no mode tests.
//
// Above the threshold the law is a straight line in the detector's own domain, where the
// threshold is squared: through (T, T) and (1, Y0) with T = threshold² and Y0 = T^(1 − 1/ratio).
// It meets the ratio law only at T and at full scale. That line is the intended law, not an
// approximation to correct: a line in decibels would change how every existing setting sounds.
class KTransferCurve {
public:
  enum KneeMode : int32_t { kHardKnee = 0, kLinearKnee = 1, kSoftKnee = 2 };
  enum Variant : int32_t { kIdle, kHard, kLinear, kSoft, kCustom };

  struct Settings {
    double threshold = 0.5;  // linear
    double ratio = 1.8;
    int32_t kneeMode = kHardKnee;
    double kneeSize = 0.25;
    bool maximize = false;  // make-up so that full scale maps to full scale
    bool customShape = false;
    const KTransferShape* shape = nullptr;  // with customShape; none or an empty one is the identity
    double inputGain = 1.0;                 // linear
    double outputGain = 1.0;                // linear
  };

  KTransferCurve() noexcept { Configure(Settings{}); }

  void Configure(const Settings& settings) noexcept;

  // The factor to multiply the input by at detector value d.
  double Gain(double d) noexcept { return gain_(*this, d); }
  // Gain of every detector value of a block, to the last bit as Gain gives it; two values per
  // instruction where the law allows. `gains` may be `levels`.
  void Gains(const double* levels, double* gains, int32_t n) noexcept { gains_(*this, levels, gains, n); }
  // The output level of the transfer graph at d: the gain law without input and output gain.
  double Curve(double d) const noexcept { return curve_(*this, d); }

  // Forgets where the custom shape's last search ended.
  void ResetCache() noexcept { cursor_ = {}; }

  Variant Chosen() const noexcept { return variant_; }
  double Threshold() const noexcept { return t_; }    // T = threshold²
  double FullScale() const noexcept { return full_; }  // Y0
  double Slope() const noexcept { return m_; }
  double Intercept() const noexcept { return b_; }
  double MakeUp() const noexcept { return makeUp_; }
  double TotalGain() const noexcept { return g_; }  // make-up · input gain · output gain
  double InverseGain() const noexcept { return inverseG_; }
  double KneeStart() const noexcept { return s0_; }  // of the linear and soft knees
  // The detector value at and below which the law gives the plain gain G: where a detector has
  // come to rest as far as the output can tell. Infinite when idle (any value will do).
  double Rest() const noexcept;
  double KneeEnd() const noexcept { return s1_; }

private:
  friend struct KTransferLaws;
  using GainLaw = double (*)(KTransferCurve&, double) noexcept;
  using CurveLaw = double (*)(const KTransferCurve&, double) noexcept;
  using GainBlock = void (*)(KTransferCurve&, const double* levels, double* gains, int32_t n) noexcept;

  void ShapeKnee(int32_t kneeMode, double kneeSize) noexcept;

  GainLaw gain_;
  CurveLaw curve_;
  GainBlock gains_;
  Variant variant_ = kHard;

  double t_ = 0.0, full_ = 0.0, m_ = 1.0, b_ = 0.0;
  double makeUp_ = 1.0, g_ = 1.0, inverseG_ = 1.0;
  double bG_ = 0.0, mG_ = 1.0;  // the line above the threshold, scaled for the gain
  double bM_ = 0.0, mM_ = 1.0;  // and for the graph
  // Knee: from s0 to s1, hard-curve levels y0 and y1 there, w = 1/(s1 − s0); the soft knee's
  // arc has centre (cx, cy) and squared radius r2.
  double s0_ = 0.0, s1_ = 0.0, y0_ = 0.0, y1_ = 0.0, w_ = 0.0;
  double cx_ = 0.0, cy_ = 0.0, r2_ = 0.0;

  const KTransferShape* shape_ = nullptr;
  KTransferShape::Cursor cursor_;
};
