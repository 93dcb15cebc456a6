#include "plugins/tremolo/KTremoloPlugin.h"

#include <cmath>

#include "core/KParameter.h"
#include "kernel/KFactoryPreset.h"

namespace {
constexpr KFactoryPreset::Value kSurfAmp[] = {{"rate", 6.0}, {"depth", 60.0}};
constexpr KFactoryPreset::Value kHardChop[] = {{"sync", 14.0}, {"shape", KLFO::kSquare}, {"depth", 100.0}, {"smoothing", 0.001}};
constexpr KFactoryPreset::Value kStereoSwing[] = {{"rate", 2.0}, {"shape", KLFO::kTriangle}, {"depth", 80.0}, {"spread", 180.0}};
constexpr KFactoryPreset kPresets[] = {{"Surf amp", kSurfAmp}, {"Hard chop", kHardChop}, {"Stereo swing", kStereoSwing}};
}  // namespace

KAudioPlugin* KTremoloPlugin::Create(KModule*, const KPluginRecord*) { return new KTremoloPlugin; }

constinit const KPluginDescription kTremoloDescription{
    .key = "KTremoloPlugin",
    .factory = &KTremoloPlugin::Create,
    .moduleKey = "Tremolo",
    .category = "Modulation",
    .name = "Tremolo",
    .vst3SubCategories = "Fx|Modulation",
    .vst2Id = "TvTr",
    .identity = "KTremoloPlugin",
    .help = &KTremoloHelp,
    .editor = &KTremoloEditor,
    .presets = kPresets,
};

void KTremoloPlugin::ProcessPiece(const float* const* inputs, float* const* outputs, int32_t channels, int32_t from, int32_t n,
                                  const double* depth) noexcept {
  for (int32_t c = 0; c < channels; ++c) {
    lfos_.Fill(c, sweep_, n);
    const float* in = inputs[c] + from;
    float* out = outputs[c] + from;
    for (int32_t i = 0; i < n; ++i) {
      // Full level at the LFO's top, 1 − depth at its bottom.
      const double gain = 1.0 - depth[i] * (0.5 - 0.5 * sweep_[i]);
      out[i] = std::isfinite(in[i]) ? static_cast<float>(gain * in[i]) : 0.0f;
    }
  }
}
