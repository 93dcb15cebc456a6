#pragma once

#include <span>

#include "plugins/KLFOPlugin.h"
#include "plugins/KSweptDelay.h"

// What the chorus and the flanger have in common: a swept delay set from the plug-in's own
// parameter table through the rows named in its layout. They differ in their tables only.
class KSweptDelayPlugin : public KLFOPlugin {
public:
  struct Layout {
    KLFOControls lfo;
    int32_t delay;     // seconds
    int32_t depth;     // seconds
    int32_t voices;    // -1: one voice
    int32_t feedback;  // percent; -1: none
    int32_t mix;       // percent
    double longestSeconds;  // the longest delay plus depth the table allows
  };

  KSweptDelayPlugin(std::span<const KParameterInfo> parameters, const Layout& layout);

  bool SetSampleRate(double sampleRate) override;
  uint32_t TailSamples() const noexcept override;

protected:
  void UpdateEffect(bool jump) noexcept override { engine_.Update(Settings(), jump); }
  void ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept override {
    engine_.Process(lfos_, inputs, outputs, channels, n);
  }
  void ResetEffect() noexcept override { engine_.Clear(); }

private:
  KSweptDelay::Settings Settings() const noexcept;

  const Layout& layout_;
  KSweptDelay engine_;
};
