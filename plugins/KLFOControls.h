#pragma once

#include <array>
#include <cstdint>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KLFO.h"
#include "dsp/KNoteValues.h"

// The controls of the plug-ins moved by an LFO (chorus, flanger, phaser, tremolo, auto-pan,
// filter): the value kinds their parameter tables share, and a pair of LFOs, one per channel,
// set from those parameters and the host's tempo.
struct KLFOControls {
  // "Free", then the note values: a synced LFO runs one cycle per note at the host's tempo.
  static constexpr auto kSyncNames = [] {
    std::array<const char*, kNoteValueCount + 1> names{"Free"};
    for (int32_t i = 0; i < kNoteValueCount; ++i) names[static_cast<size_t>(i) + 1] = kNoteValues[i].name;
    return names;
  }();
  static inline const KListKind kShapeKind{KLFO::kShapeNames};
  static inline const KFrequencyKind kRateKind{0.02, 20.0};
  static inline const KListKind kSyncKind{kSyncNames};
  static inline const KNumberKind kStereoPhaseKind{0.0, 180.0, "\xB0", "{0}"};  // degrees; units are Latin-1 literals
  static inline const KNumberKind kPercentKind{0.0, 100.0, "%", "{0.0}"};
  static constexpr double kTempoUnknown = 120.0;  // what a synced LFO follows when the host tells no tempo

  // Rows of the plug-in's table; -1 for a control it does not offer (the shape then stays at
  // `fixedShape`, the channels in step, the output unsmoothed).
  int32_t shape = -1;
  int32_t rate = -1;
  int32_t sync = -1;
  int32_t stereoPhase = -1;
  int32_t smoothing = -1;  // seconds
  int32_t fixedShape = KLFO::kSine;
};

// The host's tempo in beats per minute, or KLFOControls::kTempoUnknown when it tells none.
double KHostTempo(KAudioPlugin& plugin) noexcept;

// One LFO per channel, the second `stereo phase` behind the first.
class KPluginLFOs {
public:
  static constexpr int32_t kChannels = 2;

  // Takes the controls' values (from ProcessUpdate); the LFOs go on from where they are.
  void Update(KAudioPlugin& plugin, const KLFOControls& controls) noexcept;
  // Picks up a change of the host's tempo and, for a synced LFO while the transport plays, takes
  // the cycle from the song position (from Process, before Fill).
  void FollowHost(KAudioPlugin& plugin) noexcept;
  // Back to the start of the cycle, the channels their set distance apart.
  void Reset() noexcept;
  // The next n values of channel c's LFO, in [-1, 1].
  void Fill(int32_t c, double* values, int32_t n) noexcept { lfos_[c].Fill(values, n); }
  // One cycle of the shape in use, for the editors' pictures.
  static double Picture(const KAudioPlugin& plugin, const KLFOControls& controls, double phase) noexcept;

private:
  void Apply() noexcept;

  KLFO lfos_[kChannels];
  KLFOSettings settings_;
  double offset_ = 0.0;  // cycles the second channel runs behind
};
