#include "plugins/equalizer/KEqualizerPlugin.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr int32_t kBandCount = KEqualizerPlugin::kBandCount;
constexpr int32_t kFieldCount = KEqualizerPlugin::kFieldCount;

// ---- value kinds

// In the designer's type-code order: the list index is the code.
constexpr const char* kTypeNames[] = {
    "Peak",      "Matched peak", "Low shelf",   "High shelf",           "Low-pass",           "High-pass",
    "One-pole low-pass",         "One-pole high-pass",                  "Band-pass",          "Notch",
    "All-pass",  "First-order all-pass",        "Low-pass with zero",   "High-pass with zero",
    "First-order low-pass",      "First-order high-pass"};
static_assert(std::size(kTypeNames) == KFilterSection::kTypeCount);

const KSwitchKind kSwitch;
const KListKind kTypeKind(kTypeNames);
const KFrequencyKind kFrequencyKind(20.0, 20000.0);
const KDecibelKind kGainKind(-24.0, 24.0);
// Q on the logarithmic curve: the musically useful values near 1 get most of the travel.
const KNumberKind kQKind(0.1, 20.0, "", "{0.2}", KValueCurve::kLogarithmic);
constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

// ---- the parameter table, built from one band's template

struct KBandField {
  const char* key;
  const char* name;
  const KValueKind* kind;
  double defaultValue;
};
// Every band starts switched on as a flat peak, so the equalizer is transparent until a gain
// moves, and the bands lie spread over the range where one would reach for them first.
constexpr KBandField kBandFields[kFieldCount] = {
    {"enable", "enable", &kSwitch, 1.0},
    {"type", "type", &kTypeKind, KFilterSection::kPeak},
    {"freq", "frequency", &kFrequencyKind, 0.0},  // from kDefaultFrequencies
    {"gain", "gain", &kGainKind, 0.0},
    {"q", "Q", &kQKind, 0.71},
};
constexpr double kDefaultFrequencies[kBandCount] = {60.0, 150.0, 350.0, 800.0, 1800.0, 3500.0, 7000.0, 12000.0};

// "band3freq" and "Band 3 frequency", generated once at compile time.
struct KBandText {
  char key[16];
  char name[24];
};
constexpr void Append(char* to, int& at, const char* text) {
  while (*text != '\0') to[at++] = *text++;
}
constexpr std::array<KBandText, kBandCount * kFieldCount> BandTexts() {
  std::array<KBandText, kBandCount * kFieldCount> texts{};
  for (int band = 0; band < kBandCount; ++band) {
    for (int field = 0; field < kFieldCount; ++field) {
      KBandText& t = texts[static_cast<size_t>(band * kFieldCount + field)];
      int k = 0, n = 0;
      Append(t.key, k, "band");
      t.key[k++] = static_cast<char>('1' + band);
      Append(t.key, k, kBandFields[field].key);
      Append(t.name, n, "Band ");
      t.name[n++] = static_cast<char>('1' + band);
      t.name[n++] = ' ';
      Append(t.name, n, kBandFields[field].name);
    }
  }
  return texts;
}
constexpr auto kBandTexts = BandTexts();

constexpr std::array<KParameterInfo, KEqualizerPlugin::kParameterCount> Table() {
  std::array<KParameterInfo, KEqualizerPlugin::kParameterCount> rows{};
  for (int band = 0; band < kBandCount; ++band) {
    for (int field = 0; field < kFieldCount; ++field) {
      const auto index = static_cast<size_t>(band * kFieldCount + field);
      const KBandField& f = kBandFields[field];
      const double value = field == KEqualizerPlugin::kFrequency ? kDefaultFrequencies[band] : f.defaultValue;
      rows[index] = {kBandTexts[index].key, kBandTexts[index].name, f.kind, value, kAutomatable};
    }
  }
  rows[KEqualizerPlugin::kOutputGain] = {"outputgain", "Output gain", &kGainKind, 0.0, kAutomatable};
  return rows;
}
constexpr auto kParameters = Table();

constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
static_assert(kBandCount <= KSectionRunner::kMaxSections);
}  // namespace

KEqualizerPlugin::KEqualizerPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KEqualizerPlugin::Create(KModule*, const KPluginRecord*) { return new KEqualizerPlugin; }

namespace {
constexpr KFactoryPreset::Value kLowCut[] = {{"band1type", KFilterSection::kHighPass}, {"band1freq", 80.0}};
constexpr KFactoryPreset::Value kVocalPresence[] = {{"band1type", KFilterSection::kHighPass}, {"band1freq", 100.0}, {"band3gain", -2.0}, {"band3freq", 300.0},
                                                    {"band6gain", 3.0}, {"band6freq", 4000.0}, {"band6q", 1.2}};
constexpr KFactoryPreset::Value kSmile[] = {{"band1type", KFilterSection::kLowShelf}, {"band1freq", 100.0}, {"band1gain", 4.0},
                                            {"band8type", KFilterSection::kHighShelf}, {"band8freq", 8000.0}, {"band8gain", 4.0}};
constexpr KFactoryPreset kPresets[] = {{"Low cut", kLowCut}, {"Vocal presence", kVocalPresence}, {"Smile", kSmile}};
}  // namespace

constinit const KPluginDescription kEqualizerDescription{
    .key = "KEqualizerPlugin",
    .factory = &KEqualizerPlugin::Create,
    .moduleKey = "Equalizer",
    .category = "EQs & Filters",
    .name = "Equalizer",
    .vst3SubCategories = "Fx|EQ",
    .vst2Id = "TvEq",
    .identity = "KEqualizerPlugin",
    .help = &KEqualizerHelp,
    .editor = &KEqualizerEditor,
    .presets = kPresets,
};

void KEqualizerPlugin::Design(KSectionRunner::Row (&targets)[kBandCount], KFilterSection (&designs)[kBandCount]) const noexcept {
  const double rate = SampleRate();
  // The designer takes any frequency; above 0.499 of the rate its sections stop making sense.
  const double top = 0.499 * rate;
  for (int32_t band = 0; band < kBandCount; ++band) {
    auto value = [&](BandField field) { return GetParameter(Index(band, field)).Working(); };
    const int32_t type = std::clamp(static_cast<int32_t>(value(kType)), 0, KFilterSection::kTypeCount - 1);
    KFilterSection& design = designs[band];
    design.Design(type, value(kGain), std::min(value(kFrequency), top), rate, value(kQ));
    const double on[5] = {design.b0, design.minusA1, design.b1, design.minusA2, design.b2};
    std::copy_n(value(kEnable) >= 0.5 ? on : KSectionRunner::kPassThrough, 5, targets[band]);
  }
}

void KEqualizerPlugin::ProcessUpdate() {
  KSectionRunner::Row targets[kBandCount];
  Design(targets, designs_);
  const double gain = KDecibelsToLinear(GetParameter(kOutputGain).Working());
  bands_.Aim(targets, kBandCount, gain, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jump_, false));
}

// The bands' ring-out down to −140 dB, whatever the gains ahead of it.
uint32_t KEqualizerPlugin::TailSamples() const noexcept {
  KSectionRunner::Row targets[kBandCount];
  KFilterSection designs[kBandCount];
  Design(targets, designs);
  return KSectionRunner::RingSamples(targets, kBandCount, 1e-7);
}

void KEqualizerPlugin::ResetState() {
  bands_.Reset();
  jump_ = true;
}

void KEqualizerPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  bands_.Process(inputs, outputs, ChannelsPerBus(), sampleCount);
}
