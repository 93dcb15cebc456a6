#pragma once

#include <cstdint>
#include <vector>

// The buffers a host hands over for one block: inputs and outputs in memory of their own, and
// the channel pointer arrays. Inputs carry a different deterministic signal in every channel.
class KBlockBuffers {
public:
  KBlockBuffers(int32_t inputChannels, int32_t outputChannels, int32_t length)
      : length_(length), in_(static_cast<size_t>(inputChannels)), out_(static_cast<size_t>(outputChannels)) {
    for (size_t c = 0; c < in_.size(); ++c) {
      in_[c].resize(static_cast<size_t>(length));
      for (int32_t i = 0; i < length; ++i) in_[c][static_cast<size_t>(i)] = Signal(static_cast<int32_t>(c), i);
      inPointers_.push_back(in_[c].data());
    }
    for (std::vector<float>& channel : out_) {
      channel.assign(static_cast<size_t>(length), kUntouched);
      outPointers_.push_back(channel.data());
    }
  }

  // Marks output samples that nothing wrote.
  static constexpr float kUntouched = 1234.5f;
  static float Signal(int32_t channel, int32_t i) {
    return static_cast<float>(((i * (7 + 2 * channel) + 3 * channel) % 23) - 11) / 16.0f;
  }

  int32_t Length() const noexcept { return length_; }
  const float* const* Inputs() const noexcept { return inPointers_.data(); }
  float* const* Outputs() noexcept { return outPointers_.data(); }
  const std::vector<float>& In(int32_t c) const { return in_[static_cast<size_t>(c)]; }
  const std::vector<float>& Out(int32_t c) const { return out_[static_cast<size_t>(c)]; }
  float* OutData(int32_t c) { return out_[static_cast<size_t>(c)].data(); }

private:
  int32_t length_;
  std::vector<std::vector<float>> in_;
  std::vector<std::vector<float>> out_;
  std::vector<const float*> inPointers_;
  std::vector<float*> outPointers_;
};
