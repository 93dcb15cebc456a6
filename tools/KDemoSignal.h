#pragma once

#include <vector>

#include "tools/KAudioSource.h"

// A few bars of synthesised drums, bass and chords (48 kHz stereo), so that the renderer
// works on a machine with no audio files. The same every time.
class KDemoSignal final : public KAudioSource {
public:
  static constexpr double kSampleRate = 48000.0;
  static constexpr double kSeconds = 8.0;

  KDemoSignal();
  int32_t Channels() const noexcept override { return 2; }
  double SampleRate() const noexcept override { return kSampleRate; }
  int64_t Frames() const noexcept override { return static_cast<int64_t>(samples_.size() / 2); }
  int64_t Read(float* interleaved, int64_t frames) override;

private:
  std::vector<float> samples_;  // interleaved
  int64_t position_ = 0;
};
