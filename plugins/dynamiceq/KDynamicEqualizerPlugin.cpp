#include "plugins/dynamiceq/KDynamicEqualizerPlugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
using P = KDynamicEqualizerPlugin;
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
constexpr int32_t kDesignerTypes[] = {KFilterSection::kPeak, KFilterSection::kLowShelf, KFilterSection::kHighShelf};
// Bands and detectors stay this far below the Nyquist frequency.
constexpr double kHighestShare = 0.45;
// Ringing counts until it is 100 dB down.
constexpr double kFall = 1e-5;

constexpr KFactoryPreset::Value kDeHarsh[] = {{"band3freq", 3500.0}, {"band3q", 2.5}, {"band3threshold", -32.0}, {"band3range", -8.0}};
constexpr KFactoryPreset::Value kTightBass[] = {{"band1type", P::kBell}, {"band1freq", 90.0}, {"band1q", 1.4},
                                                {"band1threshold", -24.0}, {"band1range", -6.0}, {"band3range", 0.0}};
constexpr KFactoryPreset::Value kAiryVocal[] = {{"band2freq", 350.0}, {"band2threshold", -28.0}, {"band2range", -4.0},
                                                {"band3freq", 6500.0}, {"band3range", -5.0}, {"band4gain", 2.0},
                                                {"band4threshold", -40.0}, {"band4range", 3.0}};
constexpr KFactoryPreset kPresets[] = {{"De-harsh", kDeHarsh}, {"Tight bass", kTightBass}, {"Airy vocal", kAiryVocal}};
}  // namespace

constinit const KPluginDescription kDynamicEqualizerDescription{
    .key = "KDynamicEqualizerPlugin",
    .factory = &KDynamicEqualizerPlugin::Create,
    .moduleKey = "DynamicEqualizer",
    .category = "EQs & Filters",
    .name = "DynamicEqualizer",
    .vst3SubCategories = "Fx|EQ",
    .vst2Id = "TvDE",
    .identity = "KDynamicEqualizerPlugin",
    .help = &KDynamicEqualizerHelp,
    .editor = &KDynamicEqualizerEditor,
    .presets = kPresets,
};

KDynamicEqualizerPlugin::KDynamicEqualizerPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KDynamicEqualizerPlugin::Create(KModule*, const KPluginRecord*) { return new KDynamicEqualizerPlugin; }

KFilterSection KDynamicEqualizerPlugin::BandDesign(int32_t band, double dynamicDb) const noexcept {
  auto value = [this, band](BandField field) { return GetParameter(Index(band, field)).Working(); };
  const double rate = SampleRate();
  KFilterSection section;
  section.Design(kDesignerTypes[static_cast<int32_t>(value(kType))], value(kGain) + dynamicDb,
                 std::min(value(kFrequency), kHighestShare * rate), rate, value(kQ));
  return section;
}

double KDynamicEqualizerPlugin::DynamicDecibels(int32_t band, double levelDb) const noexcept {
  const double over = std::max(levelDb - GetParameter(Index(band, kThreshold)).Working(), 0.0);
  const double range = GetParameter(Index(band, kRange)).Working();
  return range < 0.0 ? std::max(range, -over) : std::min(range, over);
}

uint32_t KDynamicEqualizerPlugin::TailSamples() const noexcept {
  KSectionRunner::Row quiet[kBandCount], loud[kBandCount];
  int32_t count = 0;
  for (int32_t b = 0; b < kBandCount; ++b) {
    if (GetParameter(Index(b, kEnable)).Working() < 0.5) continue;
    const KFilterSection at[2] = {BandDesign(b, 0.0), BandDesign(b, GetParameter(Index(b, kRange)).Working())};
    for (int32_t end = 0; end < 2; ++end) {
      const double row[5] = {at[end].b0, at[end].minusA1, at[end].b1, at[end].minusA2, at[end].b2};
      std::copy_n(row, 5, (end == 0 ? quiet : loud)[count]);
    }
    ++count;
  }
  const uint32_t ring = std::max(KSectionRunner::RingSamples(quiet, count, kFall), KSectionRunner::RingSamples(loud, count, kFall));
  const double release = KSmoothingCoefficient(SampleRate(), GetParameter(kRelease).Working());
  const double settle = release > 0.0 ? std::log(kFall) / std::log(release) : 0.0;
  return ring == UINT32_MAX ? ring : ring + static_cast<uint32_t>(std::ceil(settle)) + kControlPeriod;
}

void KDynamicEqualizerPlugin::ProcessUpdate() {
  const double rate = SampleRate();
  attack_ = KSmoothingCoefficient(rate, GetParameter(kAttack).Working());
  release_ = KSmoothingCoefficient(rate, GetParameter(kRelease).Working());
  for (int32_t b = 0; b < kBandCount; ++b) {
    Band& band = bands_[b];
    band.on = GetParameter(Index(b, kEnable)).Working() >= 0.5;
    band.listen.Design(KFilterSection::kBandPass, 0.0, std::min(GetParameter(Index(b, kFrequency)).Working(), kHighestShare * rate),
                       rate, GetParameter(Index(b, kQ)).Working());
  }
  if (std::exchange(jump_, false)) {
    Control(true);
    untilControl_ = kControlPeriod;
  }
}

void KDynamicEqualizerPlugin::ResetState() {
  for (Band& band : bands_) {
    std::fill(std::begin(band.s1), std::end(band.s1), 0.0);
    std::fill(std::begin(band.s2), std::end(band.s2), 0.0);
    band.envelope = band.dynamicDb = 0.0;
  }
  runner_.Reset();
  jump_ = true;
}

void KDynamicEqualizerPlugin::Control(bool jump) noexcept {
  KSectionRunner::Row rows[kBandCount];
  for (int32_t b = 0; b < kBandCount; ++b) {
    Band& band = bands_[b];
    band.dynamicDb = band.on ? DynamicDecibels(b, KLinearToDecibels(std::max(band.envelope, 1e-10))) : 0.0;
    const KFilterSection s = BandDesign(b, band.dynamicDb);
    const double row[5] = {s.b0, s.minusA1, s.b1, s.minusA2, s.b2};
    std::copy_n(band.on ? row : KSectionRunner::kPassThrough, 5, rows[b]);
  }
  runner_.Aim(rows, kBandCount, KDecibelsToLinear(GetParameter(kOutputGain).Working()), kControlPeriod, jump);
}

// Every band's band-pass over every channel, the loudest channel driving its envelope.
void KDynamicEqualizerPlugin::Detect(const float* const* inputs, int32_t channels, int32_t n) noexcept {
  for (Band& band : bands_) {
    if (!band.on) continue;
    const KFilterSection& k = band.listen;
    double envelope = band.envelope;
    for (int32_t i = 0; i < n; ++i) {
      double peak = 0.0;
      for (int32_t c = 0; c < channels; ++c) {
        const double x = inputs[c][i];
        const double y = k.b0 * x + band.s1[c];
        band.s1[c] = k.b1 * x + k.minusA1 * y + band.s2[c];
        band.s2[c] = k.b2 * x + k.minusA2 * y;
        peak = std::max(peak, std::abs(y));
      }
      envelope = peak + (peak > envelope ? attack_ : release_) * (envelope - peak);
    }
    band.envelope = envelope;
  }
}

void KDynamicEqualizerPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = std::min(ChannelsPerBus(), kChannels);
  for (int32_t c = 0; c < channels; ++c)  // a NaN or infinity passes as silence
    for (int32_t i = 0; i < sampleCount; ++i) clean_[c][i] = std::isfinite(inputs[c][i]) ? inputs[c][i] : 0.0f;
  for (int32_t done = 0; done < sampleCount;) {
    if (untilControl_ == 0) {
      Control(false);
      untilControl_ = kControlPeriod;
    }
    const int32_t piece = std::min(untilControl_, sampleCount - done);
    const float* in[kChannels];
    float* out[kChannels];
    for (int32_t c = 0; c < channels; ++c) in[c] = clean_[c] + done, out[c] = outputs[c] + done;
    Detect(in, channels, piece);
    runner_.Process(in, out, channels, piece);
    untilControl_ -= piece;
    done += piece;
  }
}
