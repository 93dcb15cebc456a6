#pragma once

#include <iterator>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KSpectrumAnalyser.h"
#include "kernel/KPluginDescription.h"

// A spectrum analyser: the sound passes unchanged while the editor's graph shows its spectrum,
// tilted by a slope so that a balanced mix looks level, held and released at the chosen speed.
class KSpectrumAnalyserPlugin final : public KAudioPlugin {
  static constexpr const char* kResolutionNames[] = {"1024", "2048", "4096", "8192"};
  static inline const KListKind kResolutionKind{kResolutionNames};
  static inline const KNumberKind kSlopeKind{0.0, 6.0, "dB/oct", "{0.1}"};
  static inline const KTimeKind kReleaseKind{0.05, 5.0};
  static inline const KDecibelKind kFloorKind{-140.0, -40.0};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"resolution", "Resolution", &kResolutionKind, 2.0, kAutomatable},
      {"slope", "Slope", &kSlopeKind, 3.0, kAutomatable},
      {"release", "Release", &kReleaseKind, 0.5, kAutomatable},
      {"floor", "Floor", &kFloorKind, -100.0, kAutomatable},
  };
  static constexpr int32_t kResolution = KParameterRow(kParameters, "resolution");
  static constexpr int32_t kSlope = KParameterRow(kParameters, "slope");
  static constexpr int32_t kRelease = KParameterRow(kParameters, "release");
  static constexpr int32_t kFloor = KParameterRow(kParameters, "floor");
  static constexpr double kPivotHz = 1000.0;  // the slope turns about this frequency

  KSpectrumAnalyserPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The reader's side (the editor's timer, one reader at a time): measures the newest audio
  // and lets the display fall from its peaks at the release speed over `seconds` since the last
  // refresh. Display(hz) reads the picture: level in dB with the slope applied, down to the floor.
  void RefreshDisplay(double seconds);
  double Display(double hz) const noexcept;

  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  KSpectrumAnalyser analyser_;
  std::vector<double> measured_, shown_;  // reader's side
};

extern const KPluginDescription kSpectrumAnalyserDescription;
const KPluginHelp& KSpectrumAnalyserHelp();
KEditorDescription KSpectrumAnalyserEditor();
