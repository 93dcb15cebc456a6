#pragma once

#include <cstdint>

#include "dsp/KDelayLine.h"
#include "dsp/KGlide.h"
#include "plugins/KLFOControls.h"

// The heart of the chorus and the flanger: each channel's input through a delay line read by
// one to four taps whose delays swing with the channel's LFO. Tap v sits (1 + 0.3·v) times the
// base delay back and swings over the depth above it; odd taps swing against the even ones, so
// that several voices never move in step. The taps' mean is the wet signal; the first tap may
// feed back into the line (the flanger's resonance), with values below −300 dB flushed.
// Delays, depth, feedback and mix glide.
class KSweptDelay {
public:
  static constexpr int32_t kChannels = KPluginLFOs::kChannels;
  static constexpr int32_t kMaxVoices = 4;
  static constexpr double kVoiceSpread = 0.3;
  struct Settings {
    double delay = 0.015;   // seconds, where the sweep starts
    double depth = 0.003;   // seconds the sweep spans
    int32_t voices = 1;
    double feedback = 0.0;  // share of the first tap fed back, -1..1
    double mix = 0.5;       // wet share
  };

  // Room for the longest tap at a rate. Not for the audio thread.
  void Prepare(double sampleRate, double longestSeconds);
  void Clear() noexcept;
  void Update(const Settings& settings, bool jump) noexcept;
  // Inputs may be the outputs; non-finite input samples are taken as silence.
  void Process(KPluginLFOs& lfos, const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept;
  // Samples until an impulse through the settings has fallen below −100 dB.
  static uint32_t TailSamples(const Settings& settings, double sampleRate) noexcept;

private:
  static constexpr int32_t kPiece = 256;
  enum GlideLane : int32_t { kDelayGlide, kDepthGlide, kFeedbackGlide, kWetGlide, kGlides };

  KDelayLine lines_[kChannels];
  KGlide<kGlides> glides_;
  double rate_ = 44100.0;
  int32_t voices_ = 1;
  double voiceScale_ = 1.0;
  double lanes_[kGlides][kPiece] = {};
  double sweep_[kPiece] = {};
};
