#pragma once

#include <span>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "plugins/KLFOControls.h"

// The base of the plug-ins moved by an LFO: it keeps one LFO per channel set from the rows
// named in the controls, restarts them with the plug-in's state, follows the host's tempo and
// then hands each update and sub-block to the plug-in's own effect.
class KLFOPlugin : public KAudioPlugin {
public:
  static constexpr KAudioPlugin::Shape kEffectShape{1, 1, false, false, false};

  KLFOPlugin(std::span<const KParameterInfo> parameters, const KLFOControls& controls)
      : KAudioPlugin(parameters, kEffectShape), controls_(controls) {}

  const KLFOControls& LFOControls() const noexcept { return controls_; }
  // Where the LFO's cycle stands (in cycles, 0..1) as the audio thread last left it.
  double LFOPhase() const noexcept { return lfos_.ShownPhase(); }

protected:
  // The effect's own work: its settings (`jump`: land at once, no glide), its audio, its state.
  virtual void UpdateEffect(bool jump) noexcept = 0;
  virtual void ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept = 0;
  virtual void ResetEffect() noexcept {}

  void ProcessUpdate() final;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) final;
  void ResetState() final;

  KPluginLFOs lfos_;

private:
  const KLFOControls& controls_;
  bool restart_ = true;
};
