#pragma once

#include <cstdint>
#include <memory>

#include "kernel/KExport.h"

// The host's channel buffers as the plug-in's channels, one bus at a time, for hosts whose
// buffers do not match the plug-in's channels one for one (fewer channels, a bus left out).
//   inputs:  a plug-in channel past the host's last reads the host's last again (the index is
//            clamped, not wrapped); a bus without host buffers reads zeroed scratch
//   outputs: a plug-in channel without a host buffer writes into a discard buffer
// Prepare sizes both outside processing; mapping never allocates.
class TORVANE_API KHostChannelMap {
public:
  KHostChannelMap() noexcept;
  ~KHostChannelMap();

  // User-interface thread: room for blocks of up to `maxBlock` samples. Never shrinks.
  void Prepare(int32_t maxBlock);
  int32_t Capacity() const noexcept { return capacity_; }

  // The plug-in's `channels` input pointers of one bus from the host's `hostCount` buffers (null
  // or a null buffer: none). Past the prepared length a missing input is null, which the
  // processing cycle reads as silence too.
  void MapInputs(const float* const* host, int32_t hostCount, int32_t channels, int32_t samples, const float** to) const noexcept;
  // The plug-in's `channels` output pointers of one bus. False when an output has nowhere to
  // go (a block longer than prepared); the pointers are then incomplete.
  bool MapOutputs(float* const* host, int32_t hostCount, int32_t channels, int32_t samples, float** to) const noexcept;

private:
  std::unique_ptr<float[]> silence_;
  std::unique_ptr<float[]> discard_;
  int32_t capacity_ = 0;
};
