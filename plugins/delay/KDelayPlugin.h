#pragma once

#include <atomic>
#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KDelayLine.h"
#include "dsp/KFilterSection.h"
#include "dsp/KGlide.h"
#include "dsp/KSectionState.h"
#include "kernel/KPluginDescription.h"
#include "plugins/KLFOControls.h"

// An echo: each channel's input through a delay line whose repeats feed back through a low cut
// and a high cut, so every repeat is darker and thinner than the one before; or, in ping-pong,
// the repeats bounce between the channels. The time is set in milliseconds or, synced, as a note
// value at the host's tempo. Time, feedback and mix glide, so turning the time bends the pitch
// of the repeats like tape instead of clicking.
//
// Non-finite input samples are taken as silence; the loop flushes values below −300 dB, so the
// repeats end in exact zeros.
class KDelayPlugin final : public KAudioPlugin {
  static inline const KTimeKind kTimeKind{0.001, 2.0};
  static inline const KNumberKind kFeedbackKind{0.0, 95.0, "%", "{0.0}"};
  static inline const KFrequencyKind kLowCutKind{20.0, 2000.0};
  static inline const KFrequencyKind kHighCutKind{1000.0, 20000.0};
  static inline const KSwitchKind kSwitchKind{};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"time", "Time", &kTimeKind, 0.375, kAutomatable},
      {"sync", "Sync", &KLFOControls::kSyncKind, 0.0, kAutomatable},
      {"feedback", "Feedback", &kFeedbackKind, 35.0, kAutomatable},
      {"lowcut", "Low cut", &kLowCutKind, 80.0, kAutomatable},
      {"highcut", "High cut", &kHighCutKind, 8000.0, kAutomatable},
      {"pingpong", "Ping-pong", &kSwitchKind, 0.0, kAutomatable},
      {"mix", "Dry/wet", &KLFOControls::kPercentKind, 30.0, kAutomatable},
  };
  static constexpr int32_t kTime = KParameterRow(kParameters, "time");
  static constexpr int32_t kSync = KParameterRow(kParameters, "sync");
  static constexpr int32_t kFeedback = KParameterRow(kParameters, "feedback");
  static constexpr int32_t kLowCut = KParameterRow(kParameters, "lowcut");
  static constexpr int32_t kHighCut = KParameterRow(kParameters, "highcut");
  static constexpr int32_t kPingPong = KParameterRow(kParameters, "pingpong");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr double kGlideSeconds = 0.05;
  static constexpr double kLongestSeconds = 4.0;  // a whole note at 60 BPM; longer notes are cut to it

  KDelayPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  bool SetSampleRate(double sampleRate) override;
  uint32_t TailSamples() const noexcept override;
  // The delay in seconds the settings ask for at a tempo (BPM).
  double DelaySeconds(double tempo) const noexcept;
  // The filters every repeat passes once more, at the present settings and rate.
  void DesignFilters(KFilterSection& lowCut, KFilterSection& highCut) const noexcept;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  static constexpr int32_t kChannels = 2;
  static constexpr int32_t kPiece = 256;
  enum GlideLane : int32_t { kDelayGlide, kFeedbackGlide, kWetGlide, kGlides };

  void Aim(bool jump) noexcept;

  KDelayLine lines_[kChannels];
  KFilterSection lowCut_, highCut_;
  KSectionState lowState_[kChannels], highState_[kChannels];
  KGlide<kGlides> glides_;
  bool jump_ = true;
  bool pingPong_ = false;
  // The tempo the delay follows; the tail is worked out from it on other threads.
  std::atomic<double> tempo_{KLFOControls::kTempoUnknown};
  double delay_[kPiece] = {}, feedback_[kPiece] = {}, wet_[kPiece] = {};
};

extern const KPluginDescription kDelayDescription;
const KPluginHelp& KDelayHelp();
KEditorDescription KDelayEditor();
