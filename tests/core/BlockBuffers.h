#pragma once

#include <cstdint>
#include <vector>

// A host's buffers for one block: inputs with a different known signal per channel, and outputs
// holding kUntouched until something writes them.
class KBlockBuffers {
public:
  static constexpr float kUntouched = 1234.5f;
  static float Signal(int32_t channel, int32_t i) {
    return static_cast<float>(((i * (7 + 2 * channel) + 3 * channel) % 23) - 11) / 16.0f;
  }

  KBlockBuffers(int32_t inputChannels, int32_t outputChannels, int32_t length)
      : in_(static_cast<size_t>(inputChannels)),
        out_(static_cast<size_t>(outputChannels), std::vector<float>(static_cast<size_t>(length), kUntouched)) {
    for (int32_t c = 0; c < inputChannels; ++c)
      for (int32_t i = 0; i < length; ++i) in_[static_cast<size_t>(c)].push_back(Signal(c, i));
    for (const std::vector<float>& channel : in_) inPointers_.push_back(channel.data());
    for (std::vector<float>& channel : out_) outPointers_.push_back(channel.data());
  }

  const float* const* Inputs() const noexcept { return inPointers_.data(); }
  float* const* Outputs() noexcept { return outPointers_.data(); }
  const std::vector<float>& In(int32_t c) const { return in_[static_cast<size_t>(c)]; }
  const std::vector<float>& Out(int32_t c) const { return out_[static_cast<size_t>(c)]; }
  float* OutData(int32_t c) { return out_[static_cast<size_t>(c)].data(); }

private:
  std::vector<std::vector<float>> in_, out_;
  std::vector<const float*> inPointers_;
  std::vector<float*> outPointers_;
};
