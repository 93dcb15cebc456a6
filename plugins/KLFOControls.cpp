#include "plugins/KLFOControls.h"

#include <cmath>

#include "core/KParameter.h"

double KHostTempo(KAudioPlugin& plugin) noexcept {
  const double tempo = plugin.Transport().tempo;
  return tempo > 0.0 && std::isfinite(tempo) ? tempo : KLFOControls::kTempoUnknown;
}

void KPluginLFOs::Update(KAudioPlugin& plugin, const KLFOControls& controls) noexcept {
  const auto value = [&plugin](int32_t row, double otherwise) { return row < 0 ? otherwise : plugin.GetParameter(row).Working(); };
  settings_.shape = static_cast<int32_t>(std::lround(value(controls.shape, controls.fixedShape)));
  settings_.rate = value(controls.rate, 1.0);
  settings_.note = static_cast<int32_t>(std::lround(value(controls.sync, 0.0))) - 1;
  settings_.tempo = KHostTempo(plugin);
  settings_.smoothing = value(controls.smoothing, 0.0);
  settings_.sampleRate = plugin.SampleRate();
  const double offset = value(controls.stereoPhase, 0.0) / 360.0;
  Apply();
  if (offset != offset_) {
    offset_ = offset;
    lfos_[1].SetPhase(lfos_[0].Phase() - offset_);
  }
}

void KPluginLFOs::Apply() noexcept {
  for (KLFO& lfo : lfos_) lfo.Update(settings_);
}

void KPluginLFOs::FollowHost(KAudioPlugin& plugin) noexcept {
  const double tempo = KHostTempo(plugin);
  if (tempo != settings_.tempo) {
    settings_.tempo = tempo;
    if (settings_.note >= 0) Apply();
  }
  // The second channel keeps its distance behind the first.
  if (lfos_[0].Follow(plugin.SongPosition())) lfos_[1].SetPhase(lfos_[0].Phase() - offset_);
}

void KPluginLFOs::Reset() noexcept {
  for (KLFO& lfo : lfos_) lfo.Reset();
  lfos_[1].SetPhase(-offset_);
}

double KPluginLFOs::Picture(const KAudioPlugin& plugin, const KLFOControls& controls, double phase) noexcept {
  const int32_t shape = controls.shape < 0 ? controls.fixedShape : static_cast<int32_t>(std::lround(plugin.GetParameter(controls.shape).Working()));
  return KLFO::Value(shape, phase);
}
