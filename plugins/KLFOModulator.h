#pragma once

#include <memory>
#include <vector>

#include "core/Element.h"
#include "core/KAudioPlugin.h"
#include "core/KModulator.h"
#include "dsp/KLFO.h"

// The LFOs of a plug-in's state document, acting on its parameters:
//   <LFOs>
//     <LFO Shape="Triangle" Rate="0.5" Note="1/4" Phase="0.25" Smoothing="0.005">
//       <Target Parameter="gain" Depth="0.3"/>
//     </LFO>
//   </LFOs>
// Shape by name (KLFO::kShapeNames, Sine when absent); Rate in Hz for a free LFO; Note, a note
// value ("1/4", "1/8T"), syncs the cycle to the host's tempo (120 BPM while the host gives none);
// Phase in cycles, Smoothing in seconds. Each target moves its parameter's normalised value by
// Depth (negative turns the wave over) times the LFO's value, -1 to 1. What the section holds
// beyond this stays in it untouched (the core keeps it as found).
class KLFOModulator final : public KModulator {
public:
  // Null for a section without an LFO that moves a parameter of `plugin`.
  static std::unique_ptr<KModulator> Make(KAudioPlugin& plugin, const Element& lfos);

  void Modulate(KAudioPlugin& plugin, int32_t length) noexcept override;
  void Reset() noexcept override;

  // Ramp corners lie this many samples apart, counted from the start of the stream (the last
  // reset) rather than from the host's block, and the ramps move their parameters only on the
  // plug-in's fine grid: the same LFOs sound the same whatever block sizes the host uses.
  static constexpr int32_t kCornerSpacing = 128;
  // A piece of a host block (at most kMaxChunk) with the corners on either side fits one ramp.
  static_assert(KAudioPlugin::kMaxChunk / kCornerSpacing + 2 <= ParameterRamp::kMaxPoints);

private:
  struct Target {
    int32_t parameter;
    double depth;
  };
  struct Oscillator {
    KLFO lfo;
    KLFOSettings settings;
    std::vector<Target> targets;
    double corner = 0.0;  // the value at the latest corner passed
  };

  std::vector<Oscillator> oscillators_;
  int64_t clock_ = 0;  // samples since the last reset
  // A piece's values, then those up to the first corner at or after its end.
  std::vector<double> values_ = std::vector<double>(KAudioPlugin::kMaxChunk + kCornerSpacing + 1);
};
