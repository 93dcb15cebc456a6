#pragma once

#include <span>

#include "dsp/KGlide.h"
#include "plugins/KLFOPlugin.h"

// The base of the plug-ins that move a gain by an LFO (tremolo, auto-pan): one percentage
// control sets how far, gliding, and the sound goes through in pieces, each with the glide's
// values and the LFO's own to hand. Without memory of the sound: no tail.
class KLFOAmountPlugin : public KLFOPlugin {
public:
  static constexpr int32_t kPiece = 256;

  KLFOAmountPlugin(std::span<const KParameterInfo> parameters, const KLFOControls& controls, int32_t amountRow)
      : KLFOPlugin(parameters, controls), amountRow_(amountRow) {}
  uint32_t TailSamples() const noexcept override { return 0; }

protected:
  // Samples `from` to `from + n` of every channel, with the amount (0..1) of each sample.
  virtual void ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t from, int32_t n,
                            const double* amount) noexcept = 0;

  void UpdateEffect(bool jump) noexcept final;
  void ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept final;

  double sweep_[kPiece] = {};  // scratch for the LFO's values

private:
  const int32_t amountRow_;
  KGlide<1> amount_;
  double amountLane_[kPiece] = {};
};
