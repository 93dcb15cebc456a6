#include <algorithm>
#include <cmath>
#include <memory>

#include "core/KParameter.h"
#include "dsp/KFilterSection.h"
#include "kernel/KFormat.h"
#include "plugins/KMeasurementGraph.h"
#include "plugins/KPluginEditors.h"
#include "plugins/autofilter/KAutoFilterPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Filter", "type cutoff resonance depth", 2},
    {"Modulation", "rate sync shape spread", 2},
};

// The cutoff the LFO moves, as log2 of hertz, within what the filter is designed for.
double Cutoff(const KAudioPlugin& plugin, double lfo) {
  const double cutoff = plugin.GetParameter(KAutoFilterPlugin::kCutoff).Working() *
                        std::exp2(plugin.GetParameter(KAutoFilterPlugin::kDepth).Working() * lfo);
  return std::log2(std::clamp(cutoff, 10.0, 0.45 * plugin.SampleRate()));
}

// The filter's response where the LFO is now: the curve sweeps with the sound.
std::unique_ptr<KControl> Response(const KRect& bounds, KAutoFilterPlugin& plugin) {
  auto section = std::make_shared<KFilterSection>();
  KMeasurementGraph::Callbacks callbacks;
  callbacks.refresh = [&plugin, section] {
    plugin.Design(*section, KPluginLFOs::Picture(plugin, plugin.LFOControls(), plugin.LFOPhase()));
  };
  callbacks.value = [section](double hz) { return section->Decibels(hz); };
  callbacks.caption = [&plugin] {
    const double now = std::exp2(Cutoff(plugin, KPluginLFOs::Picture(plugin, plugin.LFOControls(), plugin.LFOPhase())));
    return KFormat("Cutoff now {0} Hz").Arg(static_cast<int32_t>(std::lround(now))).Text();
  };
  callbacks.refresh();
  return std::make_unique<KMeasurementGraph>(
      bounds,
      KMeasurementGraph::Axes{20, 20000, 24, -24, true, {50, 100, 200, 500, 1000, 2000, 5000, 10000}, {-12, 0, 12}},
      std::move(callbacks), KString("resonance"));
}

// The sweep over two cycles beside the response it makes now.
std::unique_ptr<KControl> Graphs(const KRect& bounds, KAudioPlugin& plugin, KEditorHost* host) {
  auto pair = std::make_unique<KControl>(bounds);
  const int32_t middle = (bounds.left + bounds.right) / 2;
  pair->Add(KLFOGraph(KFrequencyCycleAxes(), &Cutoff, "depth")(KRect{bounds.left, bounds.top, middle - 5, bounds.bottom}, plugin, host));
  pair->Add(Response(KRect{middle + 5, bounds.top, bounds.right, bounds.bottom}, static_cast<KAutoFilterPlugin&>(plugin)));
  return pair;
}
}  // namespace

KEditorDescription KAutoFilterEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &Graphs); }
