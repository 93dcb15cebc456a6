#include "plugins/spectrumanalyser/KSpectrumAnalyserPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
// How far a released peak falls over the release time.
constexpr double kReleaseDepthDb = 60.0;
}  // namespace

KSpectrumAnalyserPlugin::KSpectrumAnalyserPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KSpectrumAnalyserPlugin::Create(KModule*, const KPluginRecord*) { return new KSpectrumAnalyserPlugin; }

namespace {
constexpr KFactoryPreset::Value kMixing[] = {{"slope", 4.5}, {"release", 1.0}};
constexpr KFactoryPreset::Value kFineDetail[] = {{"resolution", 3.0}, {"release", 2.0}, {"floor", -120.0}};
constexpr KFactoryPreset::Value kDrums[] = {{"resolution", 0.0}, {"release", 0.1}};
constexpr KFactoryPreset kPresets[] = {{"Mixing", kMixing}, {"Fine detail", kFineDetail}, {"Drums", kDrums}};
}  // namespace

constinit const KPluginDescription kSpectrumAnalyserDescription{
    .key = "KSpectrumAnalyserPlugin",
    .factory = &KSpectrumAnalyserPlugin::Create,
    .moduleKey = "SpectrumAnalyser",
    .category = "Special",
    .name = "SpectrumAnalyser",
    .vst3SubCategories = "Fx|Analyzer",
    .vst2Id = "TvSa",
    .identity = "KSpectrumAnalyserPlugin",
    .help = &KSpectrumAnalyserHelp,
    .editor = &KSpectrumAnalyserEditor,
    .presets = kPresets,
};

void KSpectrumAnalyserPlugin::ResetState() { analyser_.Reset(); }

void KSpectrumAnalyserPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = ChannelsPerBus();
  for (int32_t c = 0; c < channels; ++c)
    if (outputs[c] != inputs[c]) std::copy_n(inputs[c], sampleCount, outputs[c]);
  analyser_.Push(inputs, channels, sampleCount);
}

void KSpectrumAnalyserPlugin::RefreshDisplay(double seconds) {
  const auto size = 1024 << static_cast<int32_t>(GetParameter(kResolution).Working());
  analyser_.Measure(size, measured_);
  if (shown_.size() != measured_.size()) shown_.assign(measured_.size(), KSpectrumAnalyser::kSilence);
  const double fall = kReleaseDepthDb * seconds / GetParameter(kRelease).Working();
  for (size_t k = 0; k < shown_.size(); ++k) shown_[k] = std::max(measured_[k], shown_[k] - fall);
}

double KSpectrumAnalyserPlugin::Display(double hz) const noexcept {
  const double floor = GetParameter(kFloor).Working();
  if (shown_.size() < 2) return floor;
  // The nearest bin at or below the frequency, and the peak of the bins up to the next pixel's
  // worth (a twentieth of an octave), so that narrow peaks survive at high frequencies.
  const double binHz = SampleRate() / (2.0 * static_cast<double>(shown_.size() - 1));
  const auto first = std::min(static_cast<size_t>(hz / binHz), shown_.size() - 1);
  const auto last = std::clamp(static_cast<size_t>(hz * 1.0353 / binHz), first, shown_.size() - 1);
  const double level = *std::max_element(shown_.begin() + static_cast<ptrdiff_t>(first), shown_.begin() + static_cast<ptrdiff_t>(last) + 1);
  const double tilted = level + GetParameter(kSlope).Working() * std::log2(std::max(hz, 1.0) / kPivotHz);
  return std::max(tilted, floor);
}
