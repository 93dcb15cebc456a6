#include "plugins/KLFOModulator.h"

#include <algorithm>
#include <cmath>
#include <string>

#include "core/KParameter.h"
#include "core/KStateSection.h"
#include "dsp/KNoteValues.h"
#include "plugins/KLFOControls.h"

namespace {
double NumberOf(const Element& element, const char* name, double fallback) {
  return KStateSection::ReadNumber(element, KString::Static(name), fallback);
}

// The index of `text` among `names`, or `fallback`.
template <class Names>
int32_t IndexOf(const Element& element, const char* name, const Names& names, int32_t fallback) {
  const std::string text = element.GetAttribute(KString::Static(name)).ToUtf8();
  for (int32_t i = 0; i < static_cast<int32_t>(std::size(names)); ++i)
    if (text == names[i]) return i;
  return fallback;
}

// The plug-in library moves the core's modulators.
[[maybe_unused]] const bool gRegistered = (KSetModulatorMaker(&KLFOModulator::Make), true);
}  // namespace

std::unique_ptr<KModulator> KLFOModulator::Make(KAudioPlugin& plugin, const Element& lfos) {
  auto modulator = std::make_unique<KLFOModulator>();
  const KString kLFO = KString::Static("LFO"), kTarget = KString::Static("Target");
  const char* noteNames[kNoteValueCount];
  for (int32_t i = 0; i < kNoteValueCount; ++i) noteNames[i] = kNoteValues[i].name;
  for (int32_t i = 0; i < lfos.ChildCount(); ++i) {
    const Element& entry = lfos.GetChild(i);
    if (entry.GetName() != kLFO) continue;
    Oscillator oscillator;
    for (int32_t t = 0; t < entry.ChildCount(); ++t) {
      const Element& target = entry.GetChild(t);
      const KAudioPluginBase::Parameter* parameter = plugin.FindParameter(target.GetAttribute(KString::Static("Parameter")));
      if (target.GetName() == kTarget && parameter)
        oscillator.targets.push_back({parameter->Index(), std::clamp(NumberOf(target, "Depth", 0.25), -1.0, 1.0)});
    }
    if (oscillator.targets.empty()) continue;
    KLFOSettings& s = oscillator.settings;
    s.shape = IndexOf(entry, "Shape", KLFO::kShapeNames, KLFO::kSine);
    s.rate = std::max(NumberOf(entry, "Rate", 1.0), 0.0);
    s.note = IndexOf(entry, "Note", noteNames, -1);
    s.tempo = KLFOControls::kTempoUnknown;
    s.phase = NumberOf(entry, "Phase", 0.0);
    s.smoothing = std::max(NumberOf(entry, "Smoothing", 0.0), 0.0);
    s.sampleRate = plugin.SampleRate();
    oscillator.lfo.Update(s);
    oscillator.lfo.Reset();
    modulator->oscillators_.push_back(std::move(oscillator));
  }
  return modulator->oscillators_.empty() ? nullptr : std::move(modulator);
}

void KLFOModulator::Reset() noexcept {
  clock_ = 0;
  for (Oscillator& oscillator : oscillators_) oscillator.lfo.Reset();
}

void KLFOModulator::Modulate(KAudioPlugin& plugin, int32_t length) noexcept {
  length = std::clamp(length, 1, KAudioPlugin::kMaxChunk);
  const double tempo = KHostTempo(plugin), song = plugin.SongPosition();
  // Corners on the stream's grid: the one before the piece (when it starts between two), those
  // within it, and the first after its end, which the ramp heads for; so a ramp never ends
  // inside a piece and the value on a corner is the corner's own.
  const auto into = static_cast<int32_t>(clock_ % kCornerSpacing);
  const int32_t first = into == 0 ? 0 : kCornerSpacing - into;
  const int32_t last = length < first ? first : first + ((length - first) / kCornerSpacing + 1) * kCornerSpacing;
  const auto intoNext = static_cast<int32_t>((clock_ + length) % kCornerSpacing);
  KAudioPluginBase::RampPoint points[ParameterRamp::kMaxPoints];
  for (Oscillator& oscillator : oscillators_) {
    KLFOSettings& s = oscillator.settings;
    if (s.tempo != tempo || s.sampleRate != plugin.SampleRate()) {
      s.tempo = tempo;
      s.sampleRate = plugin.SampleRate();
      oscillator.lfo.Update(s);
    }
    oscillator.lfo.Follow(song);
    oscillator.lfo.Fill(values_.data(), length);
    // The values past the piece come from a copy: the oscillator itself stays at the piece's end,
    // where the next piece may move it to a new song position.
    KLFO ahead = oscillator.lfo;
    ahead.Fill(values_.data() + length, last - length + 1);
    for (const Target& target : oscillator.targets) {
      int32_t count = 0;
      if (into != 0) points[count++] = {-into, target.depth * oscillator.corner};
      for (int32_t t = first; t <= last; t += kCornerSpacing) points[count++] = {t, target.depth * values_[t]};
      plugin.AddRamp(target.parameter, std::span(points, static_cast<size_t>(count)), true, true);
    }
    if (intoNext != 0 && length >= intoNext) oscillator.corner = values_[length - intoNext];
  }
  clock_ += length;
}
