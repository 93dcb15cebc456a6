#pragma once

#include "core/KAudioPlugin.h"
#include "kernel/KPluginDescription.h"

// A channel utility: gain, balance, stereo width, polarity, channel swap, mono and mute.
// Every setting becomes one 2x2 matrix from input to output; when it changes, each coefficient
// glides to its new value over a few milliseconds, so no setting ever clicks. The signal runs
// polarity (on the input channels), swap, width, then balance and gain.
class KUtilityPlugin final : public KAudioPlugin {
public:
  enum ParameterIndex : int32_t { kGain, kBalance, kWidth, kInvertLeft, kInvertRight, kSwap, kMono, kMute, kParameterCount };
  static constexpr double kGlideSeconds = 0.005;

  KUtilityPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // The matrix the present settings ask for.
  void TargetMatrix(double (&m)[4]) const;

  // Output = matrix x input: left = m[0]·L + m[1]·R, right = m[2]·L + m[3]·R.
  double current_[4] = {1.0, 0.0, 0.0, 1.0};
  double target_[4] = {1.0, 0.0, 0.0, 1.0};
  double step_[4] = {};
  int32_t glideLeft_ = 0;  // samples until current_ reaches target_
  bool jumpToTarget_ = true;
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), and its
// help (beside it in this folder).
extern const KPluginDescription kUtilityDescription;
const KPluginHelp& KUtilityHelp();
