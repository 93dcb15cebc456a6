#include <cmath>

#include "core/KParameter.h"
#include "plugins/KLFOControls.h"
#include "plugins/KLFOPlugin.h"
#include "plugins/KPluginEditors.h"

// Two cycles of what the LFO moves, for the first channel and, when the channels run apart, the
// second; the marker follows the audio thread's LFO.
KEditorDescription::GraphFactory KLFOGraph(KCycleGraph::Axes axes, KLFOMeaning meaning, const char* helpKey) {
  return [axes = std::move(axes), meaning, helpKey](const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) -> std::unique_ptr<KControl> {
    auto& lfoPlugin = static_cast<KLFOPlugin&>(plugin);
    const KLFOControls& controls = lfoPlugin.LFOControls();
    KCycleGraph::Callbacks callbacks;
    callbacks.value = [&lfoPlugin, &controls, meaning](double cycles) {
      return meaning(lfoPlugin, KPluginLFOs::Picture(lfoPlugin, controls, cycles));
    };
    if (controls.stereoPhase >= 0)
      callbacks.second = [&lfoPlugin, &controls, meaning](double cycles) {
        const double behind = lfoPlugin.GetParameter(controls.stereoPhase).Working() / 360.0;
        return meaning(lfoPlugin, KPluginLFOs::Picture(lfoPlugin, controls, cycles - behind));
      };
    callbacks.phase = [&lfoPlugin] { return lfoPlugin.LFOPhase(); };
    return std::make_unique<KCycleGraph>(bounds, axes, std::move(callbacks), KString::Static(helpKey));
  };
}

KCycleGraph::Axes KFrequencyCycleAxes() {
  return {std::log2(20000.0), std::log2(20.0), {{std::log2(100.0), "100 Hz"}, {std::log2(1000.0), "1 kHz"}, {std::log2(10000.0), "10 kHz"}}};
}
