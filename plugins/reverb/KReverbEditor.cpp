#include <memory>

#include "core/KParameter.h"
#include "kernel/KFormat.h"
#include "plugins/KPluginEditors.h"
#include "plugins/reverb/KReverbPlugin.h"
#include "ui/controls/KTimeGraph.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Room", "predelay decay size damping", 4},
    {"Output", "width mix", 2},
};

// The frequency whose decay the second curve shows: where damping is plainly heard.
constexpr double kHighHz = 4000.0;

// The tail's level after a sound: silence through the pre-delay, then a fall by 60 dB in the
// decay time at `hz`.
double TailDb(const KReverbPlugin& reverb, double hz, double seconds) {
  const double start = reverb.GetParameter(KReverbPlugin::kPreDelay).Working();
  return seconds < start ? -180.0 : -60.0 * (seconds - start) / reverb.DecaySeconds(hz);
}

std::unique_ptr<KControl> DecayGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& reverb = static_cast<KReverbPlugin&>(plugin);
  KTimeGraph::Callbacks callbacks;
  callbacks.span = [&reverb] {
    return reverb.GetParameter(KReverbPlugin::kPreDelay).Working() + reverb.GetParameter(KReverbPlugin::kDecay).Working();
  };
  callbacks.level = [&reverb](double seconds) { return TailDb(reverb, 0.0, seconds); };
  callbacks.second = [&reverb](double seconds) { return TailDb(reverb, kHighHz, seconds); };
  callbacks.caption = [&reverb] {
    return KFormat("Decay {0.2} s, {1.2} s at 4 kHz").Arg(reverb.DecaySeconds(0.0)).Arg(reverb.DecaySeconds(kHighHz)).Text();
  };
  return std::make_unique<KTimeGraph>(bounds, std::move(callbacks), KString("decay"));
}
}  // namespace

KEditorDescription KReverbEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &DecayGraph); }
