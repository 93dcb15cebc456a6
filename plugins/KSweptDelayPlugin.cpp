#include "plugins/KSweptDelayPlugin.h"

#include <cmath>

#include "core/KParameter.h"

KSweptDelayPlugin::KSweptDelayPlugin(std::span<const KParameterInfo> parameters, const Layout& layout)
    : KLFOPlugin(parameters, layout.lfo), layout_(layout) {
  engine_.Prepare(SampleRate(), layout_.longestSeconds);
}

bool KSweptDelayPlugin::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  engine_.Prepare(sampleRate, layout_.longestSeconds);
  ResetState();
  return true;
}

KSweptDelay::Settings KSweptDelayPlugin::Settings() const noexcept {
  KSweptDelay::Settings s;
  s.delay = GetParameter(layout_.delay).Working();
  s.depth = GetParameter(layout_.depth).Working();
  s.voices = layout_.voices < 0 ? 1 : static_cast<int32_t>(std::lround(GetParameter(layout_.voices).Working()));
  s.feedback = layout_.feedback < 0 ? 0.0 : GetParameter(layout_.feedback).Working() / 100.0;
  s.mix = GetParameter(layout_.mix).Working() / 100.0;
  return s;
}

uint32_t KSweptDelayPlugin::TailSamples() const noexcept { return KSweptDelay::TailSamples(Settings(), SampleRate()); }
