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

  // Ramp corners are this far apart at least; a piece of a host block takes at most a ramp's
  // worth of them.
  static constexpr int32_t kCornerSpacing = 32;

private:
  struct Target {
    int32_t parameter;
    double depth;
  };
  struct Oscillator {
    KLFO lfo;
    KLFOSettings settings;
    std::vector<Target> targets;
  };

  std::vector<Oscillator> oscillators_;
  std::vector<double> values_ = std::vector<double>(KAudioPlugin::kMaxChunk);
};
