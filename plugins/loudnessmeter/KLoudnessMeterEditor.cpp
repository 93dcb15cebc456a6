#include <memory>

#include "kernel/KFormat.h"
#include "plugins/KMeasurementGraph.h"
#include "plugins/KPluginEditors.h"
#include "plugins/loudnessmeter/KLoudnessMeterPlugin.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Meter", "target history", 2},
};

KString Reading(double lufs) {
  return lufs <= KLoudnessMeter::kSilence ? KString("-inf") : KFormat("{0.1}").Arg(lufs).Text();
}

// The last 30 seconds of loudness, newest on the right, with the three readings above.
std::unique_ptr<KControl> HistoryGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& meter = static_cast<KLoudnessMeterPlugin&>(plugin);
  KMeasurementGraph::Axes axes{-30.0, 0.0, 0.0, -60.0, false, {-25, -20, -15, -10, -5}, {-48, -36, -24, -12}};
  KMeasurementGraph::Callbacks callbacks;
  callbacks.value = [&meter](double t) { return meter.History(-t); };
  callbacks.caption = [&meter] {
    const KLoudnessMeter& m = meter.Meter();
    return KFormatText(KString("M {0}  S {1}  I {2} LUFS, target {3}"), Reading(m.Momentary()), Reading(m.ShortTerm()),
                       Reading(m.Integrated()), Reading(meter.GetParameter(KLoudnessMeterPlugin::kTarget).Working()));
  };
  return std::make_unique<KMeasurementGraph>(bounds, std::move(axes), std::move(callbacks), KString("history"));
}
}  // namespace

KEditorDescription KLoudnessMeterEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &HistoryGraph); }
