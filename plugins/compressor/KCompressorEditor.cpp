#include <cmath>
#include <memory>
#include <vector>

#include "core/KParameter.h"
#include "dsp/KTransferCurve.h"
#include "plugins/KPluginEditors.h"
#include "plugins/compressor/KCompressorPlugin.h"
#include "ui/controls/KGraphs.h"

namespace {

constexpr KEditorSection kSections[] = {
    {"Threshold and ratio", "threshold ratio kneemode kneesize", 2},
    {"Timing", "attack release rmslength", 2},
    {"Gain", "gain outputgain maximize linkchannels customshape", 2},
    {"Side-chain", "SideChainMinFrequency SideChainMaxFrequency SideChainInput SideChainPlay", 2},
};

double ToDb(double amplitude) noexcept { return amplitude > 1e-9 ? 20 * std::log10(amplitude) : -180; }
double FromDb(double db) noexcept { return std::pow(10.0, db / 20); }

// The editor's own copy of the transfer law, configured from the parameters and the graph's
// points whenever they differ from what it was last built from (the engine's copy belongs to
// the audio thread).
class EditorLaw {
public:
  explicit EditorLaw(KCompressorPlugin& plugin) : plugin_(plugin) {}

  double OutputDb(double inputDb) {
    Refresh();
    return ToDb(curve_.Curve(FromDb(inputDb)));
  }

private:
  void Refresh() {
    std::vector<double> key;
    for (int32_t p : {KCompressorPlugin::kThreshold, KCompressorPlugin::kRatio, KCompressorPlugin::kKneeMode,
                      KCompressorPlugin::kKneeSize, KCompressorPlugin::kMaximize, KCompressorPlugin::kCustomShape})
      key.push_back(plugin_.GetParameter(p).Normalized());
    const std::vector<KCompressorPlugin::Point> points = plugin_.CustomShape();
    for (const auto& point : points) key.insert(key.end(), {point.level, point.output});
    if (key == key_) return;
    key_ = key;
    shape_.SetPoints(points.data(), static_cast<int32_t>(points.size()));
    const auto value = [this](int32_t p) { return plugin_.GetParameter(p).Working(); };
    KTransferCurve::Settings s;
    s.threshold = value(KCompressorPlugin::kThreshold);
    s.ratio = value(KCompressorPlugin::kRatio);
    s.kneeMode = static_cast<int32_t>(value(KCompressorPlugin::kKneeMode));
    s.kneeSize = value(KCompressorPlugin::kKneeSize);
    s.maximize = value(KCompressorPlugin::kMaximize) >= 0.5;
    s.customShape = value(KCompressorPlugin::kCustomShape) >= 0.5;
    s.shape = &shape_;
    curve_.Configure(s);
  }

  KCompressorPlugin& plugin_;
  std::vector<double> key_;
  KTransferShape shape_;
  KTransferCurve curve_;
};

std::unique_ptr<KControl> TransferGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& compressor = static_cast<KCompressorPlugin&>(plugin);
  auto law = std::make_shared<EditorLaw>(compressor);
  KTransferGraph::Callbacks callbacks;
  callbacks.law = [law](double db) { return law->OutputDb(db); };
  callbacks.customActive = [&compressor] { return compressor.GetParameter(KCompressorPlugin::kCustomShape).Working() >= 0.5; };
  callbacks.points = [&compressor] {
    std::vector<KPointF> points;
    for (const auto& p : compressor.CustomShape()) points.push_back({ToDb(p.level), ToDb(p.output)});
    return points;
  };
  callbacks.movePoint = [&compressor](int32_t index, KPointF point) {
    std::vector<KCompressorPlugin::Point> shape = compressor.CustomShape();
    if (index >= static_cast<int32_t>(shape.size())) return;
    shape[static_cast<size_t>(index)] = {FromDb(point.x), FromDb(point.y)};
    compressor.SetCustomShape(shape);
  };
  // The graph is part of the plug-in's settings: a drag is one settings step.
  callbacks.beforeChange = [&compressor] { compressor.UndoStoreSettings(); };
  return std::make_unique<KTransferGraph>(bounds, std::move(callbacks));
}

}  // namespace

KEditorDescription KCompressorEditor() {
  KEditorDescription description = KEditorDescription::Of(kSections, KEditorDescription::kGraphLeft, &TransferGraph);
  description.gainReduction = [](const KAudioPlugin& plugin) {
    return double(static_cast<const KCompressorPlugin&>(plugin).GainReductionDecibels());
  };
  return description;
}
