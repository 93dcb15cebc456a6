#pragma once

#include <cstdint>

// Where the renderer's audio comes from: a file or the built-in demo. Frames are interleaved.
class KAudioSource {
public:
  virtual ~KAudioSource() = default;
  virtual int32_t Channels() const noexcept = 0;
  virtual double SampleRate() const noexcept = 0;
  virtual int64_t Frames() const noexcept = 0;
  // Reads up to `frames` frames; answers how many it read (fewer only at the end).
  virtual int64_t Read(float* interleaved, int64_t frames) = 0;
};
