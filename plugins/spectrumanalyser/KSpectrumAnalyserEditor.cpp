#include <chrono>
#include <memory>

#include "plugins/KMeasurementGraph.h"
#include "plugins/KPluginEditors.h"
#include "plugins/spectrumanalyser/KSpectrumAnalyserPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Display", "resolution slope release floor", 4},
};

std::unique_ptr<KControl> SpectrumGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& analyser = static_cast<KSpectrumAnalyserPlugin&>(plugin);
  KMeasurementGraph::Axes axes{20.0, 20000.0, 0.0, -120.0, true, {50, 100, 200, 500, 1000, 2000, 5000, 10000}, {-96, -72, -48, -24}};
  KMeasurementGraph::Callbacks callbacks;
  callbacks.value = [&analyser](double hz) { return analyser.Display(hz); };
  // The release runs on the editor's own clock, so that it falls at the same speed however
  // often the timer comes.
  callbacks.refresh = [&analyser, last = std::chrono::steady_clock::now()]() mutable {
    const auto now = std::chrono::steady_clock::now();
    analyser.RefreshDisplay(std::chrono::duration<double>(now - last).count());
    last = now;
  };
  return std::make_unique<KMeasurementGraph>(bounds, std::move(axes), std::move(callbacks), KString("resolution"));
}
}  // namespace

KEditorDescription KSpectrumAnalyserEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &SpectrumGraph); }
