#include "plugins/compressor/KCompressorPlugin.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <string>
#include <string_view>

#include "core/Element.h"
#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
// A main bus and a side-chain bus in, one bus out.
constexpr KAudioPlugin::Shape kShape{2, 1, false, false, false};
constexpr int32_t kMaxChannelsPerBus =
    *std::max_element(std::begin(KAudioPlugin::kChannelCounts), std::end(KAudioPlugin::kChannelCounts));

// Unity below −6 dB, then half the rise in level up to full scale: a gentle starting point that
// shows at once what the graph does.
constexpr KTransferShape::Point kDefaultShape[] = {{0.0, 0.0}, {0.5, 0.5}, {1.0, 0.75}};

const KString kShapeAttribute("CustomShape");

bool IsDefaultShape(std::span<const KTransferShape::Point> points) {
  return std::equal(points.begin(), points.end(), std::begin(kDefaultShape), std::end(kDefaultShape),
                    [](const auto& a, const auto& b) { return a.level == b.level && a.output == b.output; });
}

// Shortest text that reads back to the same doubles, so that a stored graph comes back exactly.
std::string ShapeText(std::span<const KTransferShape::Point> points) {
  std::string text;
  char number[32];
  auto append = [&](double value) { text.append(number, std::to_chars(number, number + sizeof number, value).ptr); };
  for (const KTransferShape::Point& p : points) {
    if (!text.empty()) text += ' ';
    append(p.level);
    text += ',';
    append(p.output);
  }
  return text;
}

// False for anything but at least two finite "level,output" pairs separated by spaces.
bool ParseShape(std::string_view text, std::vector<KTransferShape::Point>& points) {
  points.clear();
  const char* at = text.data();
  const char* const end = at + text.size();
  while (at != end) {
    if (*at == ' ') {
      ++at;
      continue;
    }
    KTransferShape::Point p{};
    auto read = std::from_chars(at, end, p.level);
    if (read.ec != std::errc() || read.ptr == end || *read.ptr != ',') return false;
    read = std::from_chars(read.ptr + 1, end, p.output);
    if (read.ec != std::errc() || (read.ptr != end && *read.ptr != ' ')) return false;
    if (!std::isfinite(p.level) || !std::isfinite(p.output)) return false;
    points.push_back(p);
    at = read.ptr;
  }
  return points.size() >= 2;
}
}  // namespace

KCompressorPlugin::KCompressorPlugin()
    : KAudioPlugin(kParameters, kShape), scratch_(static_cast<size_t>(kMaxChannelsPerBus * kMaxChunk)) {
  engine_.Prepare(kMaxChannelsPerBus, kMaxChunk);
  SetCustomShape({});
}

KAudioPlugin* KCompressorPlugin::Create(KModule*, const KPluginRecord*) { return new KCompressorPlugin; }

namespace {
constexpr KFactoryPreset::Value kGentleBus[] = {{"threshold", 0.5}, {"ratio", 1.5}, {"attack", 0.03}, {"release", 0.3}, {"kneemode", 2.0}, {"kneesize", 0.5}};
constexpr KFactoryPreset::Value kVocalLeveler[] = {{"threshold", 0.25}, {"ratio", 4.0}, {"attack", 0.005}, {"release", 0.12}, {"rmslength", 0.01}, {"outputgain", 4.0}};
constexpr KFactoryPreset::Value kDrumPunch[] = {{"threshold", 0.3}, {"ratio", 6.0}, {"attack", 0.02}, {"release", 0.06}, {"kneemode", 1.0}};
constexpr KFactoryPreset kPresets[] = {{"Gentle bus", kGentleBus}, {"Vocal leveler", kVocalLeveler}, {"Drum punch", kDrumPunch}};
}  // namespace

constinit const KPluginDescription kCompressorDescription{
    .key = "KCompressorPlugin",
    .factory = &KCompressorPlugin::Create,
    .moduleKey = "Compressor",
    .category = "Dynamics",
    .name = "Compressor",
    .vst3SubCategories = "Fx|Dynamics",
    .vst2Id = "TvCo",
    .identity = "KCompressorPlugin",
    .help = &KCompressorHelp,
    .editor = &KCompressorEditor,
    .presets = kPresets,
};

std::span<const KCompressorPlugin::Point> KCompressorPlugin::DefaultCustomShape() noexcept { return kDefaultShape; }

void KCompressorPlugin::SetCustomShape(std::span<const Point> points) {
  if (points.size() < 2) points = kDefaultShape;
  std::lock_guard<std::mutex> lock(shapeMutex_);
  points_.assign(points.begin(), points.end());
  shapes_[writing_].SetPoints(points_.data(), static_cast<int32_t>(points_.size()));
  // Hand the finished slot over and take whichever the audio thread is not holding.
  writing_ = spare_.exchange(writing_ | kFresh, std::memory_order_acq_rel) & ~kFresh;
  MarkUpdatePending();
}

std::vector<KCompressorPlugin::Point> KCompressorPlugin::CustomShape() const {
  std::lock_guard<std::mutex> lock(shapeMutex_);
  return points_;
}

void KCompressorPlugin::StorePluginSettings(Element& section, uint32_t flags) {
  if ((flags & kStore) != 0) {
    const std::vector<Point> points = CustomShape();
    if (!IsDefaultShape(points)) section.SetAttribute(kShapeAttribute, KString::FromUtf8(ShapeText(points)));
    else if ((flags & kRemoveDefaults) != 0) section.RemoveAttribute(kShapeAttribute);
    return;
  }
  // A missing or unreadable graph loads as the default.
  std::vector<Point> points;
  const KString* text = section.FindAttribute(kShapeAttribute);
  if (!text || !ParseShape(text->ToUtf8(), points)) points.clear();
  SetCustomShape(points);
}

void KCompressorPlugin::TakePublishedShape() noexcept {
  if ((spare_.load(std::memory_order_acquire) & kFresh) != 0)
    reading_ = spare_.exchange(reading_, std::memory_order_acq_rel) & ~kFresh;
}

KDynamicsSettings KCompressorPlugin::Settings() const noexcept {
  auto value = [this](int32_t p) { return GetParameter(p).Working(); };
  auto on = [&](int32_t p) { return value(p) >= 0.5; };
  KDynamicsSettings s;
  s.gainDb = value(kGain);
  s.outputGainDb = value(kOutputGain);
  s.attack = value(kAttack);
  s.release = value(kRelease);
  s.rmsLength = value(kRmsLength);
  s.threshold = value(kThreshold);
  s.ratio = value(kRatio);
  s.kneeMode = static_cast<int32_t>(value(kKneeMode));
  s.kneeSize = value(kKneeSize);
  s.linkChannels = on(kLinkChannels);
  s.maximize = on(kMaximize);
  s.customShape = on(kCustomShape);
  s.sideChain = on(kSideChainInput);
  s.sideChainFilters = true;
  s.sideChainMinFrequency = value(kSideChainMinFrequency);
  s.sideChainMaxFrequency = value(kSideChainMaxFrequency);
  s.sampleRate = SampleRate();
  return s;
}

// The output follows the input at once (gain times input), but the detector needs its release
// to come to rest: a host that stopped sooner would start the next sound compressed.
uint32_t KCompressorPlugin::TailSamples() const noexcept {
  KDynamicsProcessor engine;
  engine.Update(Settings());
  return engine.ReleaseSamples();
}

void KCompressorPlugin::ProcessUpdate() {
  TakePublishedShape();
  KDynamicsSettings s = Settings();
  s.shape = &shapes_[reading_];
  sideChain_ = s.sideChain;
  engine_.Update(s);

  KFilterSection limits[2];
  int32_t count = 0;
  if (engine_.HighPassActive()) limits[count++] = engine_.HighPass();
  if (engine_.LowPassActive()) limits[count++] = engine_.LowPass();
  audition_.SetSections(limits, count);
  const bool audition = GetParameter(kSideChainPlay).Working() >= 0.5;
  render_ = audition ? &KCompressorPlugin::Audition : &KCompressorPlugin::Compress;
  // Compressing, the engine's last pass writes each output from its input: it meters both on
  // the way, and the cycle need not read them again.
  engine_.MeasurePeaks(!audition);
  SetMeasuredPeaks(audition ? nullptr : engine_.Peaks());
}

void KCompressorPlugin::ResetState() {
  engine_.Reset();
  audition_.Reset();
  gainReduction_.store(1.0, std::memory_order_relaxed);
}

// The first ChannelsPerBus() inputs are the main bus, the next as many the side-chain.
void KCompressorPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  (this->*render_)(inputs, outputs, sampleCount);
  MeterGainReduction();
}

void KCompressorPlugin::Compress(const float* const* inputs, float* const* outputs, int32_t n) noexcept {
  const int32_t channels = ChannelsPerBus();
  engine_.Process(n, inputs, outputs, inputs + channels, channels);
}

// The output carries what the detector hears (its source after the band limits and the input
// gain); the engine still runs, into scratch, so that its meters and envelope stay live and the
// compression resumes without a jump when the audition ends.
void KCompressorPlugin::Audition(const float* const* inputs, float* const* outputs, int32_t n) noexcept {
  const int32_t channels = ChannelsPerBus();
  float* held[kMaxChannelsPerBus] = {};
  for (int32_t c = 0; c < channels; ++c) held[c] = scratch_.data() + static_cast<size_t>(c) * kMaxChunk;
  engine_.Process(n, inputs, held, inputs + channels, channels);
  audition_.Process(sideChain_ ? inputs + channels : inputs, outputs, channels, n);
  const double gain = engine_.InputGain();
  for (int32_t c = 0; c < channels; ++c) {
    float* out = outputs[c];
    for (int32_t i = 0; i < n; ++i) out[i] = static_cast<float>(gain * out[i]);
  }
}

float KCompressorPlugin::GainReductionDecibels() const noexcept {
  const double ratio = gainReduction_.load(std::memory_order_relaxed);
  return ratio < 1.0 ? static_cast<float>(std::max(KLinearToDecibels(ratio), -200.0)) : 0.0f;
}

void KCompressorPlugin::MeterGainReduction() noexcept {
  // Compared in single precision, as the engine stored the gains, so that no reduction reads 0.
  // The audio thread keeps the ratio; the reader turns it into decibels.
  const auto total = static_cast<float>(engine_.Transfer().TotalGain());
  const float lowest = engine_.LowestGain();
  gainReduction_.store(lowest < total ? static_cast<double>(lowest) / total : 1.0, std::memory_order_relaxed);
}
