#include "plugins/convolutionreverb/KConvolutionReverbPlugin.h"

#include <algorithm>
#include <cmath>
#include <cstdint>

#include "core/Element.h"
#include "core/KParameter.h"
#include "dsp/KDecibels.h"
#include "kernel/KException.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
const KString kFileAttribute("ImpulseResponse");

// How each built-in space is made: its decay, the gap before the reverberation, how bright it
// starts and how much darker it ends, and how many early reflections stand out.
struct SpaceRecipe {
  double decaySeconds;  // to −60 dB
  double predelaySeconds;
  double brightness;  // one-pole coefficient of the noise's low-pass at the start, 0..1
  double darkening;   // the coefficient's factor at the end
  int32_t reflections;
};
constexpr SpaceRecipe kRecipes[] = {
    {0.5, 0.004, 0.55, 0.5, 9},   // Small room
    {2.2, 0.018, 0.35, 0.3, 6},   // Hall
    {1.4, 0.001, 0.85, 0.7, 0},   // Plate
};

// A portable generator, so that a built-in space is the same on every system.
struct Noise {
  uint64_t state;
  double Next() noexcept {
    state = state * 6364136223846793005ull + 1442695040888963407ull;
    return static_cast<double>(state >> 11) * 0x1.0p-53 * 2.0 - 1.0;
  }
};

// Its address marks an offer that returns to the built-in spaces; never read.
alignas(16) constinit char kNoFileMark = 0;
}  // namespace

KConvolutionReverbPlugin::KConvolutionReverbPlugin()
    : KAudioPlugin(kParameters, kShape), wet_(2 * static_cast<size_t>(kMaxChunk)) {
  BuildSyntheticSpaces();
}

KConvolutionReverbPlugin::~KConvolutionReverbPlugin() {
  CollectRetired();
  Space* offered = offered_.exchange(nullptr);
  if (offered != NoFile()) delete offered;
  delete file_;
}

KAudioPlugin* KConvolutionReverbPlugin::Create(KModule*, const KPluginRecord*) { return new KConvolutionReverbPlugin; }

namespace {
constexpr KFactoryPreset::Value kVocalRoom[] = {{"impulse", 0.0}, {"mix", 20.0}, {"width", 80.0}};
constexpr KFactoryPreset::Value kBigHall[] = {{"impulse", 1.0}, {"mix", 35.0}, {"wetlevel", -2.0}};
constexpr KFactoryPreset::Value kBrightPlate[] = {{"impulse", 2.0}, {"mix", 25.0}, {"width", 130.0}};
constexpr KFactoryPreset::Value kSend[] = {{"mix", 100.0}};
constexpr KFactoryPreset kPresets[] = {
    {"Vocal room", kVocalRoom}, {"Big hall", kBigHall}, {"Bright plate", kBrightPlate}, {"Effect send", kSend}};
}  // namespace

constinit const KPluginDescription kConvolutionReverbDescription{
    .key = "KConvolutionReverbPlugin",
    .factory = &KConvolutionReverbPlugin::Create,
    .moduleKey = "ConvolutionReverb",
    .category = "Reverb & Delay",
    .name = "ConvolutionReverb",
    .vst3SubCategories = "Fx|Reverb",
    .vst2Id = "TvCr",
    .identity = "KConvolutionReverbPlugin",
    .help = &KConvolutionReverbHelp,
    .editor = &KConvolutionReverbEditor,
    .presets = kPresets,
};

KConvolutionReverbPlugin::Space* KConvolutionReverbPlugin::NoFile() noexcept {
  return reinterpret_cast<Space*>(&kNoFileMark);
}

int32_t KConvolutionReverbPlugin::Space::Settle() const noexcept {
  return std::max(sides[0].SettleSamples(), sides[1].SettleSamples());
}

KImpulseResponse KConvolutionReverbPlugin::SyntheticSpace(int32_t index, double sampleRate) {
  const SpaceRecipe& recipe = kRecipes[std::clamp(index, 0, kSpaceCount - 1)];
  const auto predelay = static_cast<size_t>(recipe.predelaySeconds * sampleRate);
  const auto decay = static_cast<size_t>(recipe.decaySeconds * sampleRate);
  KImpulseResponse response;
  response.sampleRate = sampleRate;
  for (uint64_t side = 0; side < 2; ++side) {
    std::vector<float> taps(predelay + decay, 0.0f);
    Noise noise{0x9E3779B97F4A7C15ull * (side + 1) + static_cast<uint64_t>(index)};
    double low = 0.0, energy = 0.0;
    std::vector<double> shaped(decay);
    for (size_t i = 0; i < decay; ++i) {
      const double t = static_cast<double>(i) / static_cast<double>(decay);
      // 60 dB down over the decay, darker as it fades, as air and walls absorb the highs first.
      const double g = recipe.brightness * (1.0 - t + t * recipe.darkening);
      low += g * (noise.Next() - low);
      shaped[i] = low * std::exp(-6.907755278982137 * t);
    }
    // Early reflections: single echoes in the first 40 ms, louder than the diffuse sound there.
    for (int32_t r = 0; r < recipe.reflections; ++r) {
      const auto at = static_cast<size_t>((0.5 + 0.5 * noise.Next()) * 0.04 * sampleRate);
      if (at < decay) shaped[at] += 0.6 * noise.Next() * std::exp(-0.15 * r);
    }
    for (double v : shaped) energy += v * v;
    // Unit energy: white noise comes out of the wet side as loud as it went in.
    const double scale = energy > 0.0 ? 1.0 / std::sqrt(energy) : 0.0;
    for (size_t i = 0; i < decay; ++i) taps[predelay + i] = static_cast<float>(scale * shaped[i]);
    response.channels.push_back(std::move(taps));
  }
  return response;
}

std::unique_ptr<KConvolutionReverbPlugin::Space> KConvolutionReverbPlugin::Prepare(const KImpulseResponse& response) {
  auto space = std::make_unique<Space>();
  for (size_t side = 0; side < 2; ++side) space->sides[side].Load(response.channels[std::min(side, response.channels.size() - 1)]);
  return space;
}

std::shared_ptr<const KConvolutionReverbPlugin::Envelope> KConvolutionReverbPlugin::EnvelopeOf(const KImpulseResponse& response) {
  auto envelope = std::make_shared<Envelope>();
  envelope->seconds = response.Length() / response.sampleRate;
  envelope->decibels = KImpulseEnvelope(response, kEnvelopeSlices);
  return envelope;
}

std::shared_ptr<const KConvolutionReverbPlugin::Envelope> KConvolutionReverbPlugin::PlayingEnvelope() const {
  std::lock_guard<std::mutex> lock(pathMutex_);
  if (fileEnvelope_) return fileEnvelope_;
  const auto index = static_cast<size_t>(GetParameter(kImpulse).Working());
  return spaceEnvelopes_.empty() ? nullptr : spaceEnvelopes_[std::min(index, spaceEnvelopes_.size() - 1)];
}

void KConvolutionReverbPlugin::BuildSyntheticSpaces() {
  synthetic_.clear();
  std::vector<std::shared_ptr<const Envelope>> envelopes;
  for (int32_t index = 0; index < kSpaceCount; ++index) {
    const KImpulseResponse response = SyntheticSpace(index, SampleRate());
    synthetic_.push_back(Prepare(response));
    envelopes.push_back(EnvelopeOf(response));
  }
  {
    std::lock_guard<std::mutex> lock(pathMutex_);
    spaceEnvelopes_ = std::move(envelopes);
  }
  playing_ = nullptr;
  MarkUpdatePending();
}

bool KConvolutionReverbPlugin::SetSampleRate(double sampleRate) {
  const double before = SampleRate();
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  if (sampleRate == before) return true;
  BuildSyntheticSpaces();
  // The file again, resampled to the new rate; a file that vanished meanwhile plays the built-in space.
  const KString path = ImpulseResponseFile();
  if (!path.IsEmpty()) {
    try {
      SetImpulseResponseFile(path);
    } catch (const KException&) {
      Publish(nullptr);
    }
  }
  return true;
}

void KConvolutionReverbPlugin::SetImpulseResponseFile(const KString& path) {
  std::unique_ptr<Space> space;
  std::shared_ptr<const Envelope> envelope;
  if (!path.IsEmpty()) {
    const KImpulseResponse response = KReadImpulseResponse(path, SampleRate());
    space = Prepare(response);
    envelope = EnvelopeOf(response);
  }
  {
    std::lock_guard<std::mutex> lock(pathMutex_);
    path_ = path;
  }
  Publish(std::move(space), std::move(envelope));
}

KString KConvolutionReverbPlugin::ImpulseResponseFile() const {
  std::lock_guard<std::mutex> lock(pathMutex_);
  return path_;
}

void KConvolutionReverbPlugin::Publish(std::unique_ptr<Space> file, std::shared_ptr<const Envelope> envelope) {
  {
    std::lock_guard<std::mutex> lock(pathMutex_);
    fileEnvelope_ = std::move(envelope);
  }
  CollectRetired();
  fileSettle_.store(file ? file->Settle() : -1, std::memory_order_relaxed);
  Space* const offer = file ? file.release() : NoFile();
  Space* const untaken = offered_.exchange(offer, std::memory_order_acq_rel);
  if (untaken != NoFile()) delete untaken;  // the audio thread never saw it
  MarkUpdatePending();
}

void KConvolutionReverbPlugin::CollectRetired() noexcept { delete retired_.exchange(nullptr, std::memory_order_acq_rel); }

// Takes an offered space once the one it replaces can be handed back.
void KConvolutionReverbPlugin::TakePublished() noexcept {
  if (offered_.load(std::memory_order_relaxed) == nullptr || retired_.load(std::memory_order_acquire) != nullptr) return;
  Space* const offer = offered_.exchange(nullptr, std::memory_order_acq_rel);
  if (offer == nullptr) return;
  retired_.store(file_, std::memory_order_release);
  file_ = offer == NoFile() ? nullptr : offer;
  playing_ = nullptr;
}

uint32_t KConvolutionReverbPlugin::TailSamples() const noexcept {
  const int32_t file = fileSettle_.load(std::memory_order_relaxed);
  if (file >= 0) return static_cast<uint32_t>(file);
  const auto index = static_cast<size_t>(GetParameter(kImpulse).Working());
  return static_cast<uint32_t>(synthetic_[std::min(index, synthetic_.size() - 1)]->Settle());
}

void KConvolutionReverbPlugin::ProcessUpdate() {
  TakePublished();
  const auto index = static_cast<size_t>(GetParameter(kImpulse).Working());
  Space* const wanted = file_ ? file_ : synthetic_[std::min(index, synthetic_.size() - 1)].get();
  if (wanted != playing_) {
    // A space starts from silence: what another space heard is not its echo.
    for (KConvolver& side : wanted->sides) side.Reset();
    playing_ = wanted;
  }
  const double mix = GetParameter(kMix).Working() / 100.0;
  const double wet = mix * KDecibelsToLinear(GetParameter(kWetLevel).Working());
  const double width = ChannelsPerBus() == 2 ? GetParameter(kWidth).Working() / 100.0 : 1.0;
  dry_ = 1.0 - mix;
  // Width scales the wet side signal: each output takes (1+w)/2 of its own side, (1−w)/2 of the other.
  wetSame_ = wet * 0.5 * (1.0 + width);
  wetOther_ = wet * 0.5 * (1.0 - width);
}

void KConvolutionReverbPlugin::ResetState() {
  if (playing_)
    for (KConvolver& side : playing_->sides) side.Reset();
}

void KConvolutionReverbPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  if (offered_.load(std::memory_order_relaxed) != nullptr) {
    TakePublished();
    if (playing_ == nullptr) ProcessUpdate();
  }
  const int32_t channels = ChannelsPerBus();
  float* wet[2] = {wet_.data(), wet_.data() + kMaxChunk};
  for (int32_t c = 0; c < channels; ++c) {
    // A NaN or infinity would ring through the whole response: the convolution hears silence instead.
    const float* in = inputs[c];
    for (int32_t i = 0; i < sampleCount; ++i) wet[c][i] = std::isfinite(in[i]) ? in[i] : 0.0f;
    playing_->sides[c].Process(wet[c], wet[c], sampleCount);
  }
  if (channels == 1) {
    const float* in = inputs[0];
    float* out = outputs[0];
    const double wetGain = wetSame_ + wetOther_;
    for (int32_t i = 0; i < sampleCount; ++i) out[i] = static_cast<float>(dry_ * in[i] + wetGain * wet[0][i]);
    return;
  }
  const float* inL = inputs[0];
  const float* inR = inputs[1];
  float* outL = outputs[0];
  float* outR = outputs[1];
  for (int32_t i = 0; i < sampleCount; ++i) {
    const double l = wet[0][i], r = wet[1][i];
    const double dryL = inL[i], dryR = inR[i];
    outL[i] = static_cast<float>(dry_ * dryL + wetSame_ * l + wetOther_ * r);
    outR[i] = static_cast<float>(dry_ * dryR + wetSame_ * r + wetOther_ * l);
  }
}

void KConvolutionReverbPlugin::StorePluginSettings(Element& section, uint32_t flags) {
  if ((flags & kStore) != 0) {
    const KString path = ImpulseResponseFile();
    if (!path.IsEmpty()) section.SetAttribute(kFileAttribute, path);
    else if ((flags & kRemoveDefaults) != 0) section.RemoveAttribute(kFileAttribute);
    return;
  }
  const KString* path = section.FindAttribute(kFileAttribute);
  const KString wanted = path ? *path : KString();
  if (wanted == ImpulseResponseFile()) return;
  try {
    SetImpulseResponseFile(wanted);
  } catch (const KException&) {
    // A project moved to another machine may miss its file: it keeps the path, so that saving
    // does not lose it, and plays the built-in space meanwhile.
    Publish(nullptr);
    std::lock_guard<std::mutex> lock(pathMutex_);
    path_ = wanted;
  }
}
