#pragma once

#include <cstdint>

// Everything an LFO is set from. A synced LFO takes its cycle from the tempo and a note value,
// a free one from its rate.
struct KLFOSettings {
  int32_t shape = 0;          // KLFO::Shape
  double rate = 1.0;          // cycles per second, when free
  int32_t note = -1;          // index into kNoteValues: one cycle per note at the tempo; -1 runs free
  double tempo = 120.0;       // beats per minute
  double phase = 0.0;         // where a cycle starts after Reset, in cycles (0..1)
  double smoothing = 0.0;     // seconds of one-pole smoothing on the output; rounds off steps
  double sampleRate = 44100.0;
};

// A low-frequency oscillator with values in [-1, 1]. Its position is counted in samples into the
// cycle, so a cycle of a whole number of samples (a quarter note at 120 BPM and 48 kHz is 24000)
// repeats exactly, with no drift however long it runs. Update, Reset, Follow and Fill run on the
// audio thread without allocating; the shape is chosen once per Update.
class KLFO {
public:
  enum Shape : int32_t {
    kSine = 0,
    kTriangle = 1,      // rises from 0 at the cycle's start, like the sine
    kSawUp = 2,
    kSawDown = 3,
    kSquare = 4,        // +1 in the first half of the cycle
    kRandomSmooth = 5,  // glides along a raised cosine to a new random value each cycle
    kSampleAndHold = 6, // a new random value held for each cycle
    kShapeCount = 7
  };
  static const char* const kShapeNames[kShapeCount];

  KLFO() noexcept;

  // Takes the settings; a change of rate or tempo keeps the position within the cycle, so a
  // moving rate bends the wave without a jump.
  void Update(const KLFOSettings& settings) noexcept;
  // Back to the start phase, the random values to the start of their sequence and the
  // smoothing settled, so that equal LFOs reset together run alike.
  void Reset() noexcept;
  // For a synced LFO: puts the cycle where the host's song position (in quarter notes) says it
  // should be, when it is more than half a sample away; a host that plays on steadily never moves
  // it, so the output does not depend on how the host cuts its blocks. Answers whether it moved.
  bool Follow(double quarterNotes) noexcept;
  // Puts the cycle at a phase (in cycles, wrapped), without touching the random values or the
  // smoothing; for LFOs that must keep a set distance from another one.
  void SetPhase(double cycles) noexcept;
  // Writes the next n values.
  void Fill(double* out, int32_t n) noexcept;

  // The deterministic shapes' value at a phase in cycles; the random ones draw as a fixed
  // pattern. For the editors' pictures.
  static double Value(int32_t shape, double phase) noexcept;

  double Phase() const noexcept { return position_ / length_; }
  double CycleSamples() const noexcept { return length_; }
  bool IsSynced() const noexcept { return quarters_ > 0.0; }

private:
  template <int S> static void Run(KLFO& lfo, double* out, int32_t n) noexcept;
  double Draw() noexcept;  // the next random value in [-1, 1]

  void (*run_)(KLFO&, double*, int32_t) noexcept;
  int32_t shape_ = kSine;
  double position_ = 0.0;  // samples into the cycle, in [0, length_)
  double length_ = 1.0;    // samples per cycle
  double start_ = 0.0;     // start phase, cycles
  double quarters_ = 0.0;  // quarter notes per cycle when synced, else 0
  double keep_ = 0.0;      // smoothing: share of the previous output kept
  double smoothed_ = 0.0;
  double held_ = 0.0;      // random value of the current cycle
  double next_ = 0.0;      // the one the smooth random shape glides to
  uint32_t random_ = 0;
};
