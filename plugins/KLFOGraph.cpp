#include "plugins/KPluginEditors.h"
#include "plugins/KLFOControls.h"
#include "ui/controls/KGraphs.h"

// One cycle of the LFO's shape across the graph, following the shape control.
KEditorDescription::GraphFactory KLFOGraph(const KLFOControls& controls) {
  return [&controls](const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) -> std::unique_ptr<KControl> {
    const char* key = controls.shape < 0 ? "rate" : "shape";
    return std::make_unique<KShapeGraph>(
        bounds, [&plugin, &controls](double x) { return KPluginLFOs::Picture(plugin, controls, 0.5 * (x + 1.0)); },
        KString::Static(key));
  };
}
