#include "plugins/autofilter/KAutoFilterPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"
#include "dsp/KSectionRunner.h"
#include "kernel/KFactoryPreset.h"

namespace {
constexpr KFactoryPreset::Value kWahWah[] = {{"type", 2.0}, {"cutoff", 900.0}, {"resonance", 5.0}, {"depth", 1.5}, {"rate", 2.0}};
constexpr KFactoryPreset::Value kSlowOpen[] = {{"cutoff", 500.0}, {"depth", 3.0}, {"sync", 3.0}, {"shape", KLFO::kTriangle}};
constexpr KFactoryPreset::Value kStepped[] = {{"cutoff", 1500.0}, {"resonance", 6.0}, {"sync", 14.0}, {"shape", KLFO::kSampleAndHold}};
constexpr KFactoryPreset kPresets[] = {{"Wah-wah", kWahWah}, {"Slow opening", kSlowOpen}, {"Stepped resonance", kStepped}};
}  // namespace

KAudioPlugin* KAutoFilterPlugin::Create(KModule*, const KPluginRecord*) { return new KAutoFilterPlugin; }

constinit const KPluginDescription kAutoFilterDescription{
    .key = "KAutoFilterPlugin",
    .factory = &KAutoFilterPlugin::Create,
    .moduleKey = "AutoFilter",
    .category = "EQs & Filters",
    .name = "AutoFilter",
    .vst3SubCategories = "Fx|Filter",
    .vst2Id = "TvAF",
    .identity = "KAutoFilterPlugin",
    .help = &KAutoFilterHelp,
    .editor = &KAutoFilterEditor,
    .presets = kPresets,
};

void KAutoFilterPlugin::Design(KFilterSection& section, double sweep) const noexcept {
  const double rate = SampleRate();
  const int32_t type = kSectionTypes[std::clamp(static_cast<int32_t>(std::lround(GetParameter(kType).Working())), 0, 3)];
  const double cutoff = GetParameter(kCutoff).Working() * std::exp2(GetParameter(kDepth).Working() * sweep);
  section.Design(type, 0.0, std::clamp(cutoff, 10.0, 0.45 * rate), rate, GetParameter(kResonance).Working());
}

void KAutoFilterPlugin::ResetEffect() noexcept {
  for (KSectionState& state : states_) state.Clear();
  intoStep_ = 0;
  jump_ = true;
}

// Designs follow the LFO in ProcessEffect; a new setting is met at the next step.
void KAutoFilterPlugin::UpdateEffect(bool jump) noexcept { jump_ = jump_ || jump; }

// The section rings longest at the bottom of the sweep; a design glides for one step.
uint32_t KAutoFilterPlugin::TailSamples() const noexcept {
  KFilterSection section;
  Design(section, -1.0);
  KSectionRunner::Row row;
  std::copy_n(&section.b0, 5, row);
  const uint32_t ring = KSectionRunner::RingSamples(&row, 1, 1e-7);
  return ring == UINT32_MAX ? ring : ring + kStep;
}

void KAutoFilterPlugin::ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  for (int32_t done = 0; done < n; done += kPiece) {
    const int32_t m = std::min(kPiece, n - done);
    const int32_t first = intoStep_;
    for (int32_t c = 0; c < channels; ++c) {
      lfos_.Fill(c, sweep_, m);
      const float* in = inputs[c] + done;
      float* out = outputs[c] + done;
      KSectionState& state = states_[c];
      KGlide<5>& glide = coefficients_[c];
      bool jump = jump_;  // only the first design after a reset lands at once
      for (int32_t i = 0, at = first; i < m;) {
        if (at == 0) {
          KFilterSection section;
          Design(section, sweep_[i]);
          glide.Aim(&section.b0, kStep, jump);
          jump = false;
        }
        const int32_t length = std::min(kStep - at, m - i);
        for (int32_t k = 0; k < 5; ++k) glide.Fill(k, row_[k], length);
        glide.Passed(length);
        for (int32_t j = 0; j < length; ++j) {
          const double x = std::isfinite(in[i + j]) ? in[i + j] : 0.0;
          const double c5[5] = {row_[0][j], row_[1][j], row_[2][j], row_[3][j], row_[4][j]};
          out[i + j] = static_cast<float>(KFlushTiny(state.Step(c5, x)));
        }
        i += length;
        at = (at + length) % kStep;
      }
    }
    if (first == 0 || first + m > kStep) jump_ = false;  // a design has landed
    intoStep_ = (first + m) % kStep;
  }
}
