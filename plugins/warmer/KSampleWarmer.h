#pragma once

#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KFilterSection.h"
#include "dsp/KGlide.h"
#include "dsp/KHalfBandOversampler.h"
#include "dsp/KSectionRunner.h"
#include "kernel/KPluginDescription.h"

// A saturator: drive into one of three curves, run at 4 times the sample rate below 88.2 kHz and
// at twice it above, then a tone tilt, and a dry/wet mix with an output gain.
//
// The signal runs: drive → oversampled curve → tilt (and, behind the asymmetric tube curve, a
// DC blocker) → mix with the dry input → output gain. Every curve has a slope of exactly 1 at
// zero, so at 0 dB of drive quiet passages come out as they went in, only later. The dry path
// is delayed by the oversampler's latency, so that any mix of the two is free of comb
// filtering; the latency is reported to the host. Drive, output gain and mix glide over
// kGlideSeconds, so automation does not zipper.
//
// Non-finite input samples are taken as silence on both paths: no NaN or infinity ever
// reaches a filter's state, and silence decays to exact zero.
class KSampleWarmer final : public KAudioPlugin {
public:
  enum ShapeChoice : int32_t { kSoftClip, kTanh, kTube, kShapeCount };

private:
  static constexpr const char* kShapeNames[] = {"Soft clip", "Tanh", "Tube"};
  static_assert(std::size(kShapeNames) == kShapeCount);
  static inline const KDecibelKind kDriveKind{0.0, 36.0};
  static inline const KListKind kShapeKind{kShapeNames};
  static inline const KNumberKind kToneKind{-100.0, 100.0, "%", "{0.0}"};
  static inline const KDecibelKind kOutputKind{-24.0, 12.0};
  static inline const KNumberKind kMixKind{0.0, 100.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  // The parameter table; each index below is its key's row.
  static constexpr KParameterInfo kParameters[] = {
      {"drive", "Drive", &kDriveKind, 6.0, kAutomatable},
      {"shape", "Shape", &kShapeKind, kTube, kAutomatable},
      {"tone", "Tone", &kToneKind, 0.0, kAutomatable},
      {"outputgain", "Output gain", &kOutputKind, 0.0, kAutomatable},
      {"mix", "Dry/wet", &kMixKind, 100.0, kAutomatable},
  };
  static constexpr int32_t kDrive = KParameterRow(kParameters, "drive");
  static constexpr int32_t kShape = KParameterRow(kParameters, "shape");
  static constexpr int32_t kTone = KParameterRow(kParameters, "tone");
  static constexpr int32_t kOutputGain = KParameterRow(kParameters, "outputgain");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr double kGlideSeconds = 0.005;
  // The tilt pivots about kTiltHz; full tone lifts one end and lowers the other by kTiltDb.
  static constexpr double kTiltHz = 1000.0;
  static constexpr double kTiltDb = 6.0;
  static constexpr double kDCBlockerHz = 5.0;

  // A curve applied in place to a run of samples; chosen once per update.
  using Curve = void (*)(double* samples, int32_t count) noexcept;
  static Curve CurveOf(int32_t shape) noexcept;
  // 4 below 88.2 kHz, where harmonics have least room above the audio band; 2 from there on.
  static int32_t OversamplingFor(double sampleRate) noexcept;

  KSampleWarmer();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  bool SetSampleRate(double sampleRate) override;
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  static constexpr int32_t kChannels = 2;
  // Base-rate samples taken through the oversampler at once; its buffers are sized for this.
  static constexpr int32_t kPiece = 256;
  static constexpr int32_t kMaxFactor = 4;
  // The dry delay line: a power of two above the longest latency.
  static constexpr int32_t kDelaySize = 128;
  static_assert(kDelaySize > KHalfBandOversampler::LatencyFor(kMaxFactor));

  // Drive and output gain (linear) and the wet share, gliding together.
  enum GlideLane : int32_t { kDriveGlide, kOutputGlide, kMixGlide, kGlides };

  // Sets the oversampling factor and the latency for the current sample rate; clears state.
  void Configure() noexcept;
  // The tilt's shelves and the DC blocker as the parameters ask for them; answers how many run.
  int32_t DesignFilters(KFilterSection (&sections)[3]) const noexcept;
  void ClearDelay() noexcept;
  void ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t frames) noexcept;

  KHalfBandOversampler oversamplers_[kChannels];
  KFilterSection sections_[3];  // low shelf and high shelf of the tilt, then the DC blocker
  KSectionRunner filters_;
  Curve curve_ = nullptr;
  KGlide<kGlides> glides_;
  bool jump_ = true;  // the next update lands at once (first block, reset)
  int32_t latency_ = 0;  // base-rate samples
  int32_t delayAt_ = 0;
  float delay_[kChannels][kDelaySize] = {};

  // Scratch of one piece.
  double high_[kMaxFactor * kPiece] = {};
  double base_[kPiece] = {};
  double driveGain_[kPiece] = {};
  double outputGain_[kPiece] = {};
  double wetShare_[kPiece] = {};
  float dry_[kChannels][kPiece] = {};
  float wet_[kChannels][kPiece] = {};
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), its help
// and its editor (beside it in this folder).
extern const KPluginDescription kSampleWarmerDescription;
const KPluginHelp& KSampleWarmerHelp();
KEditorDescription KSampleWarmerEditor();
