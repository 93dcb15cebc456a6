#pragma once

#include <atomic>
#include <iterator>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KGlide.h"
#include "kernel/KPluginDescription.h"

// A lookahead peak limiter: no output sample exceeds the ceiling, and the gain moves smoothly.
//
// Per sample, the gain each input needs (ceiling over its peak, at most 1) enters a window as
// long as the lookahead; the window's minimum, released exponentially back towards 1, is
// averaged over the lookahead once more, and the audio, delayed by the lookahead, is multiplied
// by that average. Every value averaged for a sample comes from a window that held that sample's
// own need, so the average never exceeds it: the ceiling holds without a clipper, and a signal
// that never reaches the ceiling comes out unchanged, only later. The lookahead is the latency
// reported to the host.
class KLimiterPlugin final : public KAudioPlugin {
  static inline const KDecibelKind kInputGainKind{0.0, 24.0};
  static inline const KDecibelKind kCeilingKind{-24.0, 0.0};
  static inline const KTimeKind kReleaseKind{0.001, 2.0};
  static inline const KTimeKind kLookaheadKind{0.0005, 0.01};
  static inline const KSwitchKind kSwitch{};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;
  // The lookahead sets the latency: a set-up choice, not something to automate.
  static constexpr uint32_t kSetUp = 0;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"inputgain", "Input gain", &kInputGainKind, 0.0, kAutomatable},
      {"ceiling", "Ceiling", &kCeilingKind, -0.3, kAutomatable},
      {"release", "Release", &kReleaseKind, 0.1, kAutomatable},
      {"lookahead", "Lookahead", &kLookaheadKind, 0.005, kSetUp},
      {"linkchannels", "Link channels", &kSwitch, 1.0, kAutomatable},
  };
  static constexpr int32_t kInputGain = KParameterRow(kParameters, "inputgain");
  static constexpr int32_t kCeiling = KParameterRow(kParameters, "ceiling");
  static constexpr int32_t kRelease = KParameterRow(kParameters, "release");
  static constexpr int32_t kLookahead = KParameterRow(kParameters, "lookahead");
  static constexpr int32_t kLinkChannels = KParameterRow(kParameters, "linkchannels");
  static constexpr int32_t kParameterCount = static_cast<int32_t>(std::size(kParameters));
  static constexpr int32_t kChannels = 2;
  static constexpr double kGlideSeconds = 0.005;

  KLimiterPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  bool SetSampleRate(double sampleRate) override;
  // The lookahead, then the averaging window and the release back to unity gain.
  uint32_t TailSamples() const noexcept override;
  // Lookahead in samples at the current rate (the latency).
  int32_t LookaheadSamples() const noexcept;
  // Deepest gain reduction of the latest block in dB (0 or below); any thread.
  float GainReductionDecibels() const noexcept { return reduction_.load(std::memory_order_relaxed); }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // One detector: the window of needs as an ascending queue of (sample, need) whose front is
  // the minimum, the released gain, and the ring of released gains being averaged.
  struct Detector {
    std::vector<int64_t> when;
    std::vector<double> need;
    int32_t head = 0, count = 0;
    double held = 1.0;
    std::vector<double> ring;
    double sum = 0.0;
    int32_t below = 0;  // ring entries under 1: while none, the sum is exactly the length
  };
  using Render = void (KLimiterPlugin::*)(const float* const* inputs, float* const* outputs, int32_t channels,
                                          int32_t n) noexcept;

  void Size(int32_t lookahead);
  void Clear() noexcept;
  double Gain(Detector& d, double peak) noexcept;
  template <bool Linked>
  void Limit(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;

  int32_t lookahead_ = 1;  // samples; the length of the delay, the window and the average
  int32_t capacity_ = 0;   // the longest lookahead the buffers hold
  double ceiling_ = 1.0;
  double release_ = 0.0;  // coefficient
  KGlide<1> inputGain_;
  bool jump_ = true;
  Render render_ = &KLimiterPlugin::Limit<true>;
  int64_t now_ = 0;  // samples since the last reset
  Detector detectors_[kChannels];
  std::vector<double> delay_[kChannels];  // the driven input, as the detectors saw it
  int32_t delayAt_ = 0;
  double lowest_ = 1.0;
  std::atomic<float> reduction_{0.0f};
};

extern const KPluginDescription kLimiterDescription;
const KPluginHelp& KLimiterHelp();
KEditorDescription KLimiterEditor();
