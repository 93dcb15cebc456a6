#pragma once

#include <array>
#include <atomic>
#include <iterator>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KLoudnessMeter.h"
#include "kernel/KPluginDescription.h"

// A loudness meter: the sound passes unchanged while the meter reads its momentary, short-term
// and integrated loudness, and keeps the last 30 seconds of the chosen reading for the editor's
// graph, whose caption sets the readings beside the target loudness to mix towards.
class KLoudnessMeterPlugin final : public KAudioPlugin {
  static inline const KNumberKind kTargetKind{-36.0, -6.0, "LUFS", "{0.1}"};
  static constexpr const char* kReadingNames[] = {"Momentary", "Short-term"};
  static inline const KListKind kReadingKind{kReadingNames};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"target", "Target loudness", &kTargetKind, -23.0, kAutomatable},
      {"history", "Graph shows", &kReadingKind, 1.0, kAutomatable},
  };
  static constexpr int32_t kTarget = KParameterRow(kParameters, "target");
  static constexpr int32_t kHistory = KParameterRow(kParameters, "history");
  static constexpr int32_t kHistoryLength = 300;  // readings, one per 100 ms

  KLoudnessMeterPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // Any thread: the latest readings in LUFS (KLoudnessMeter::kSilence before any), and the
  // graph's reading `secondsAgo` seconds back (0 to 30).
  const KLoudnessMeter& Meter() const noexcept { return meter_; }
  double History(double secondsAgo) const noexcept;

  bool SetSampleRate(double sampleRate) override;
  // The output is the input of the same sample.
  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  KLoudnessMeter meter_;
  int32_t partsRecorded_ = 0;  // audio thread
  std::array<std::atomic<float>, kHistoryLength> history_{};
  std::atomic<int32_t> newest_{0};
};

extern const KPluginDescription kLoudnessMeterDescription;
const KPluginHelp& KLoudnessMeterHelp();
KEditorDescription KLoudnessMeterEditor();
