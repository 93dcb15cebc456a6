#include <cmath>
#include <memory>
#include <vector>

#include "core/KParameter.h"
#include "dsp/KFilterSection.h"
#include "kernel/KFormat.h"
#include "plugins/KPluginEditors.h"
#include "plugins/delay/KDelayPlugin.h"
#include "ui/controls/KTimeGraph.h"

namespace {
constexpr KEditorSection kSections[] = {
    {"Time", "time sync feedback", 3},
    {"Repeats", "lowcut highcut pingpong", 3},
    {"Output", "mix", 1},
};

// Where the repeats' level is read: the middle of the range a musician hears them in.
constexpr double kReadingHz = 1000.0;
// The picture covers at least this many repeats.
constexpr double kRepeatsShown = 5.0;

double ToDb(double gain) noexcept { return gain > 1e-9 ? 20.0 * std::log10(gain) : -180.0; }

// What one impulse becomes: the dry sound at once, then each repeat one delay later, quieter by
// the feedback and the filters' loss at kReadingHz; in ping-pong the repeats change sides.
struct EchoModel {
  double delay, dryDb, firstDb, stepDb;
  bool pingPong;

  explicit EchoModel(KDelayPlugin& plugin) {
    delay = plugin.DelaySeconds(KHostTempo(plugin));
    KFilterSection low, high;
    plugin.DesignFilters(low, high);
    const double loss = low.Decibels(kReadingHz) + high.Decibels(kReadingHz);
    const double wet = plugin.GetParameter(KDelayPlugin::kMix).Working() / 100.0;
    dryDb = ToDb(1.0 - wet);
    firstDb = ToDb(wet) + loss;
    stepDb = ToDb(plugin.GetParameter(KDelayPlugin::kFeedback).Working() / 100.0) + loss;
    pingPong = plugin.GetParameter(KDelayPlugin::kPingPong).Working() >= 0.5;
  }
  // The repeats' envelope: the level a repeat at `seconds` would have.
  double Envelope(double seconds) const noexcept {
    return seconds < delay ? -180.0 : firstDb + stepDb * (seconds / delay - 1.0);
  }
};

std::unique_ptr<KControl> EchoGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& delay = static_cast<KDelayPlugin&>(plugin);
  KTimeGraph::Callbacks callbacks;
  callbacks.span = [&delay] { return kRepeatsShown * EchoModel(delay).delay; };
  callbacks.level = [&delay](double seconds) { return EchoModel(delay).Envelope(seconds); };
  callbacks.taps = [&delay] {
    const EchoModel model(delay);
    const double span = KTimeGraph::RoundSpan(kRepeatsShown * model.delay);
    std::vector<KTimeGraph::Tap> taps{{0.0, model.dryDb, 0}};
    for (int32_t k = 1; k * model.delay <= span && model.Envelope(k * model.delay) > -KTimeGraph::kRangeDb; ++k)
      taps.push_back({k * model.delay, model.Envelope(k * model.delay), model.pingPong ? (k % 2 ? -1 : 1) : 0});
    return taps;
  };
  callbacks.caption = [&delay] {
    const double seconds = EchoModel(delay).delay;
    if (seconds < 1.0) return KFormat("Repeats every {0} ms").Arg(static_cast<int32_t>(std::lround(seconds * 1000.0))).Text();
    return KFormat("Repeats every {0.2} s").Arg(seconds).Text();
  };
  return std::make_unique<KTimeGraph>(bounds, std::move(callbacks), KString("time"));
}
}  // namespace

KEditorDescription KDelayEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &EchoGraph); }
