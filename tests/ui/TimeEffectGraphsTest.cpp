// The graphs of the time-based plug-ins follow their settings and, for the LFO-driven ones, the
// LFO as the audio thread leaves it: echoes where the delay puts them, a tail that falls as the
// reverb's decay says, modulation curves that move with their depth.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <stdexcept>

#include "core/KParameter.h"
#include "dsp/KNoteValues.h"
#include "plugins/KMeasurementGraph.h"
#include "plugins/KPluginEditors.h"
#include "plugins/autofilter/KAutoFilterPlugin.h"
#include "plugins/chorus/KChorusPlugin.h"
#include "plugins/delay/KDelayPlugin.h"
#include "plugins/phaser/KPhaserPlugin.h"
#include "plugins/reverb/KReverbPlugin.h"
#include "plugins/tremolo/KTremoloPlugin.h"
#include "tests/plugins/PluginRender.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KCycleGraph.h"
#include "ui/controls/KTimeGraph.h"

namespace {

template <class Graph>
Graph& FindGraph(KEditor& editor) {
  Graph* graph = KFindControl<Graph>(editor.Tree().Root(), [](Graph&) { return true; });
  if (!graph) throw std::runtime_error("the editor has no such graph");
  return *graph;
}

// A plug-in as a host gets it from the catalogue (which names it, so that its editor is its
// own), at 48 kHz, with its editor open and the editor's graph of type Graph.
template <class P, class Graph>
struct Opened {
  explicit Opened(const char* key) : plugin(static_cast<P*>(KMakeCataloguePlugin(key).release())) {
    EXPECT_TRUE(plugin->SetSampleRate(48000.0));
    editor = KMakePluginEditor(*plugin, nullptr);
    graph = &FindGraph<Graph>(*editor);
  }
  std::unique_ptr<P> plugin;
  std::unique_ptr<KEditor> editor;
  Graph* graph;
};

// The x of a value on a graph's linear axis from 0 to `right`, as the plot lays it out (with a
// little room before zero).
double XOf(const KControl& graph, double value, double right) {
  const KRect plot = KInset(graph.Bounds(), 1);
  const double left = -KGraph::kLead * right;
  return plot.left + (value - left) / (right - left) * (plot.right - plot.left);
}

// Ticks the editor (the graph must ask to be repainted) and paints it, so that the curve is new.
void Follow(KEditor& editor, KControl& graph, bool expectMoved = true) {
  editor.Tree().Tick();
  EXPECT_EQ(graph.IsDirty(), expectMoved);
  editor.Render();
}

double Lowest(const std::vector<double>& curve) { return *std::min_element(curve.begin(), curve.end()); }
double Highest(const std::vector<double>& curve) { return *std::max_element(curve.begin(), curve.end()); }

// Plays silence through the plug-in for `samples` at 48 kHz, so that its LFO moves on.
void Play(KAudioPlugin& plugin, size_t samples) { Render(plugin, Channels(2, std::vector<float>(samples)), {480}); }

}  // namespace

TEST(TimeEffectGraphs, DelayTapsStandAtTheDelayTimeAndFallByTheFeedback) {
  Opened<KDelayPlugin, KTimeGraph> opened_delay("KDelayPlugin");
  KDelayPlugin& delay = *opened_delay.plugin;
  KEditor& editor = *opened_delay.editor;
  KTimeGraph& graph = *opened_delay.graph;
  delay.GetParameter(KDelayPlugin::kTime).SetWorking(0.25);
  delay.GetParameter(KDelayPlugin::kFeedback).SetWorking(50.0);
  delay.GetParameter(KDelayPlugin::kMix).SetWorking(50.0);
  Follow(editor, graph);
  // Five repeats of 250 ms need 1.25 s: the axis rounds up to 2 s.
  ASSERT_DOUBLE_EQ(graph.Span(), 2.0);
  const std::vector<KTimeGraph::Tap>& taps = graph.Taps();
  ASSERT_GE(taps.size(), 6u);
  EXPECT_EQ(taps[0].seconds, 0.0);  // the dry sound, at half level
  EXPECT_NEAR(taps[0].decibels, -6.02, 0.01);
  EXPECT_NEAR(graph.TapTop(taps[1]).x, XOf(graph, 0.25, 2), 0.01);
  for (size_t k = 1; k < taps.size(); ++k) {
    EXPECT_NEAR(taps[k].seconds, 0.25 * double(k), 1e-6);
    EXPECT_EQ(taps[k].side, 0);
    // Each repeat is half the one before, less the repeat filters' small loss at 1 kHz.
    if (k > 1) {
      EXPECT_NEAR(taps[k].decibels - taps[k - 1].decibels, -6.02, 0.3);
    }
  }

  // Synced to a quarter note at the tempo a host without one is taken to play (120 BPM): 500 ms.
  delay.GetParameter(KDelayPlugin::kSync).SetWorking(kNoteValueQuarter + 1);
  delay.GetParameter(KDelayPlugin::kPingPong).SetWorking(1.0);
  Follow(editor, graph);
  ASSERT_DOUBLE_EQ(graph.Span(), 2.5);
  ASSERT_GE(graph.Taps().size(), 3u);
  EXPECT_NEAR(graph.TapTop(graph.Taps()[1]).x, XOf(graph, 0.5, 2.5), 0.01);
  EXPECT_EQ(graph.Taps()[1].side, -1);  // ping-pong starts on the left and bounces
  EXPECT_EQ(graph.Taps()[2].side, 1);

  // No feedback: one echo; all dry: none at all.
  delay.GetParameter(KDelayPlugin::kFeedback).SetWorking(0.0);
  Follow(editor, graph);
  EXPECT_EQ(graph.Taps().size(), 2u);
  delay.GetParameter(KDelayPlugin::kMix).SetWorking(0.0);
  Follow(editor, graph);
  ASSERT_EQ(graph.Taps().size(), 1u);
  EXPECT_NEAR(graph.Taps()[0].decibels, 0.0, 1e-9);
  Follow(editor, graph, false);  // nothing moved: nothing to repaint
}

TEST(TimeEffectGraphs, ReverbTailStartsAfterThePreDelayAndFallsSixtyDecibelsInTheDecay) {
  Opened<KReverbPlugin, KTimeGraph> opened_reverb("KReverbPlugin");
  KReverbPlugin& reverb = *opened_reverb.plugin;
  KEditor& editor = *opened_reverb.editor;
  KTimeGraph& graph = *opened_reverb.graph;
  reverb.GetParameter(KReverbPlugin::kPreDelay).SetWorking(0.1);
  reverb.GetParameter(KReverbPlugin::kDecay).SetWorking(2.0);
  reverb.GetParameter(KReverbPlugin::kDamping).SetWorking(0.0);
  Follow(editor, graph);
  ASSERT_DOUBLE_EQ(graph.Span(), 2.5);
  const std::vector<double>& curve = graph.Curve();
  const double decay = reverb.GetParameter(KReverbPlugin::kDecay).Working();
  for (size_t i = 0; i < curve.size(); ++i) {
    const double t = -KGraph::kLead * 2.5 + (1 + KGraph::kLead) * 2.5 * double(i) / double(curve.size() - 1);
    // Silence through the pre-delay, then the straight fall.
    const double expected = t < 0.1 ? -KTimeGraph::kRangeDb - 1 : std::max(-60.0 * (t - 0.1) / decay, -KTimeGraph::kRangeDb - 1);
    EXPECT_NEAR(curve[i], expected, 1e-6) << t;
  }
  // Without damping every frequency dies alike; with it the highs die sooner, the lows never.
  EXPECT_NEAR(reverb.DecaySeconds(4000.0), decay, 1e-9);
  reverb.GetParameter(KReverbPlugin::kDamping).SetWorking(60.0);
  EXPECT_NEAR(reverb.DecaySeconds(0.0), decay, 1e-9);
  EXPECT_LT(reverb.DecaySeconds(4000.0), 0.8 * decay);
  EXPECT_LT(reverb.DecaySeconds(8000.0), reverb.DecaySeconds(4000.0));
  EXPECT_GT(reverb.DecaySeconds(100.0), 0.95 * decay);
  Follow(editor, graph);  // the caption names the shorter decay of the highs
}

TEST(TimeEffectGraphs, ModulationCurvesMoveWithDepthAndTheMarkerFollowsTheLFO) {
  Opened<KTremoloPlugin, KCycleGraph> opened_tremolo("KTremoloPlugin");
  KTremoloPlugin& tremolo = *opened_tremolo.plugin;
  KEditor& editor = *opened_tremolo.editor;
  KCycleGraph& graph = *opened_tremolo.graph;
  tremolo.GetParameter(KTremoloPlugin::kDepth).SetWorking(50.0);
  tremolo.GetParameter(KTremoloPlugin::kLFO.rate).SetWorking(1.0);
  Follow(editor, graph);
  EXPECT_NEAR(Lowest(graph.Curve()), 50.0, 0.1);
  EXPECT_NEAR(Highest(graph.Curve()), 100.0, 0.1);
  tremolo.GetParameter(KTremoloPlugin::kDepth).SetWorking(100.0);
  Follow(editor, graph);
  EXPECT_NEAR(Lowest(graph.Curve()), 0.0, 0.1);

  // A quarter of a one-hertz cycle later the marker stands at a quarter of the first cycle, on
  // the sine's crest.
  const KPointF before = graph.Marker();
  EXPECT_NEAR(before.x, XOf(graph, 0.0, KCycleGraph::kCycles), 1e-6);
  Play(tremolo, 12000);
  EXPECT_NEAR(tremolo.LFOPhase(), 0.25, 1e-6);
  Follow(editor, graph);
  EXPECT_NEAR(graph.Marker().x, XOf(graph, 0.25, KCycleGraph::kCycles), 0.01);
  EXPECT_LT(graph.Marker().y, before.y);  // higher on the screen: full level

  // The chorus' first voice sweeps from its delay over its depth, in milliseconds.
  Opened<KChorusPlugin, KCycleGraph> opened_chorus("KChorusPlugin");
  KChorusPlugin& chorus = *opened_chorus.plugin;
  KEditor& chorusEditor = *opened_chorus.editor;
  KCycleGraph& sweep = *opened_chorus.graph;
  chorus.GetParameter(KChorusPlugin::kDelay).SetWorking(0.015);
  chorus.GetParameter(KChorusPlugin::kDepth).SetWorking(0.003);
  Follow(chorusEditor, sweep);
  EXPECT_NEAR(Lowest(sweep.Curve()), 15.0, 0.01);
  EXPECT_NEAR(Highest(sweep.Curve()), 18.0, 0.01);
  chorus.GetParameter(KChorusPlugin::kDepth).SetWorking(0.008);
  Follow(chorusEditor, sweep);
  EXPECT_NEAR(Highest(sweep.Curve()), 23.0, 0.01);

  // The phaser's corner sweeps evenly in octaves between its limits.
  Opened<KPhaserPlugin, KCycleGraph> opened_phaser("KPhaserPlugin");
  KPhaserPlugin& phaser = *opened_phaser.plugin;
  KEditor& phaserEditor = *opened_phaser.editor;
  KCycleGraph& corner = *opened_phaser.graph;
  phaser.GetParameter(KPhaserPlugin::kLow).SetWorking(200.0);
  phaser.GetParameter(KPhaserPlugin::kHigh).SetWorking(3200.0);
  Follow(phaserEditor, corner);
  EXPECT_NEAR(std::exp2(Lowest(corner.Curve())), 200.0, 0.5);
  EXPECT_NEAR(std::exp2(Highest(corner.Curve())), 3200.0, 5.0);
}

TEST(TimeEffectGraphs, AutoFilterResponseSweepsWithItsLFO) {
  Opened<KAutoFilterPlugin, KCycleGraph> opened_filter("KAutoFilterPlugin");
  KAutoFilterPlugin& filter = *opened_filter.plugin;
  KEditor& editor = *opened_filter.editor;
  KCycleGraph& cutoff = *opened_filter.graph;
  KMeasurementGraph& response = FindGraph<KMeasurementGraph>(editor);
  filter.GetParameter(KAutoFilterPlugin::kCutoff).SetWorking(800.0);
  filter.GetParameter(KAutoFilterPlugin::kDepth).SetWorking(2.0);
  filter.GetParameter(KAutoFilterPlugin::kLFO.rate).SetWorking(1.0);
  Follow(editor, cutoff);
  EXPECT_NEAR(std::exp2(Highest(cutoff.Curve())), 3200.0, 5.0);
  EXPECT_NEAR(std::exp2(Lowest(cutoff.Curve())), 200.0, 0.5);

  // The response's sample nearest 2 kHz, before and after the LFO reached its crest (two
  // octaves up): the low pass opens past it.
  const auto at2k = [&response] {
    const double t = std::log(2000.0 / 20.0) / std::log(1000.0);
    return response.Curve()[static_cast<size_t>(std::lround(t * (KGraph::kSamples - 1)))];
  };
  const double closed = at2k();
  EXPECT_LT(closed, -12.0);
  Play(filter, 12000);
  Follow(editor, response);
  EXPECT_GT(at2k(), closed + 12.0);
}
