#include "plugins/equalizer/KEqualizerPlugin.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <utility>

#include "core/KParameter.h"
#include "dsp/KDoubleLanes.h"

namespace {
using Bands = KEqualizerPlugin::Bands;
constexpr int32_t kBandCount = KEqualizerPlugin::kBandCount;
constexpr int32_t kFieldCount = KEqualizerPlugin::kFieldCount;
enum Coefficient { kB0, kMinusA1, kB1, kMinusA2, kB2 };

// ---- value kinds

// A positive range on a logarithmic scale (equal travel per doubling), for Q: the musically
// useful values near 1 get most of the travel.
class KLogarithmicKind final : public KLinearKind {
public:
  using KLinearKind::KLinearKind;
  double ToWorking(double normalized) const noexcept override {
    const double n = normalized > 0.0 ? (normalized < 1.0 ? normalized : 1.0) : 0.0;
    return minimum_ * std::pow(maximum_ / minimum_, n);
  }
  double ToNormalized(double working) const noexcept override {
    return std::log(Clamp(working) / minimum_) / std::log(maximum_ / minimum_);
  }
};

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
const KLogarithmicKind kQKind(0.1, 20.0, "", "{0.2}");
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
constexpr double kPassThrough[5] = {1.0, 0.0, 0.0, 0.0, 0.0};
// State below this is silence (−400 dB): cleared so that silence ends in exact zeros rather than
// lingering in denormals.
constexpr double kSilent = 1e-20;
// A flat band whose state has fallen below this leaves the cascade; the ringing it drops is
// 180 dB down, far under the last bit of any float sample one could hear.
constexpr double kResidue = 1e-9;

// Exactly unity at every frequency: the numerator equals the denominator (1, a1, a2). A peak or
// shelf at 0 dB is designed so, bit for bit, and a straight glide between two flat designs stays
// flat, because the steps of b1 and −a1 (and b2 and −a2) are exact negatives.
bool Flat(const double (&k)[5]) noexcept { return k[kB0] == 1.0 && k[kB1] == -k[kMinusA1] && k[kB2] == -k[kMinusA2]; }

// ---- the kernels

template <class Lanes>
double FirstLane(typename Lanes::Value v) noexcept {
  double lanes[2];
  Lanes::Store(lanes, v);
  return lanes[0];
}

// The engaged bands in series, then the output gain. With the band count known at compile time
// the cascade unrolls into registers and the sample loop carries no tests; gliding adds each
// coefficient's step before the sample that uses it, so the last step lands on the target.
template <class Lanes, int Count, bool Gliding>
void RunBands(Bands& k, const float* const* inputs, float* const* outputs, int32_t frames) noexcept {
  using V = typename Lanes::Value;
  constexpr int kSlots = Count > 0 ? Count : 1;
  V c[kSlots][5], d[kSlots][5], s1[kSlots], s2[kSlots];
  for (int j = 0; j < Count; ++j) {
    const auto band = static_cast<size_t>(k.engaged[j]);
    for (int m = 0; m < 5; ++m) {
      c[j][m] = Lanes::Splat(k.current[band][m]);
      if constexpr (Gliding) d[j][m] = Lanes::Splat(k.step[band][m]);
    }
    s1[j] = Lanes::Load(k.state[band][0]);
    s2[j] = Lanes::Load(k.state[band][1]);
  }
  V gain = Lanes::Splat(k.gain);
  const V gainStep = Lanes::Splat(k.gainStep);
  for (int32_t i = 0; i < frames; ++i) {
    V x = Lanes::Read(inputs, i);
    for (int j = 0; j < Count; ++j) {
      if constexpr (Gliding)
        for (int m = 0; m < 5; ++m) c[j][m] = c[j][m] + d[j][m];
      const V y = c[j][kB0] * x + s1[j];
      s1[j] = c[j][kB1] * x + s2[j] + c[j][kMinusA1] * y;
      s2[j] = c[j][kB2] * x + c[j][kMinusA2] * y;
      x = y;
    }
    if constexpr (Gliding) gain = gain + gainStep;
    Lanes::Write(outputs, i, gain * x);
  }
  for (int j = 0; j < Count; ++j) {
    const auto band = static_cast<size_t>(k.engaged[j]);
    Lanes::Store(k.state[band][0], s1[j]);
    Lanes::Store(k.state[band][1], s2[j]);
    if constexpr (Gliding)
      for (int m = 0; m < 5; ++m) k.current[band][m] = FirstLane<Lanes>(c[j][m]);
  }
  if constexpr (Gliding) k.gain = FirstLane<Lanes>(gain);
}

// Indexed [lone channel, channel pair][engaged band count].
using KernelTable = std::array<std::array<KEqualizerPlugin::Kernel, kBandCount + 1>, 2>;
template <bool Gliding, size_t... counts>
constexpr KernelTable Kernels(std::index_sequence<counts...>) {
  return {{{RunBands<KDoubleLanes<1>, static_cast<int>(counts), Gliding>...},
           {RunBands<KDoubleLanes<2>, static_cast<int>(counts), Gliding>...}}};
}
constexpr auto kCounts = std::make_index_sequence<kBandCount + 1>();
constexpr auto kSteadyKernels = Kernels<false>(kCounts);
constexpr auto kGlidingKernels = Kernels<true>(kCounts);
}  // namespace

KEqualizerPlugin::KEqualizerPlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KEqualizerPlugin::Create(KModule*, const KPluginRecord*) { return new KEqualizerPlugin; }

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
};

void KEqualizerPlugin::ProcessUpdate() {
  double targets[kBandCount][5];
  DesignTargets(targets);
  Glide(targets, std::exp(0.11512925464970228 * GetParameter(kOutputGain).Working()));
  Engage();
}

void KEqualizerPlugin::DesignTargets(double (&targets)[kBandCount][5]) noexcept {
  const double rate = SampleRate();
  // The designer takes any frequency; above 0.499 of the rate its sections stop making sense.
  const double top = 0.499 * rate;
  for (int32_t band = 0; band < kBandCount; ++band) {
    auto value = [&](BandField field) { return GetParameter(Index(band, field)).Working(); };
    const int32_t type = std::clamp(static_cast<int32_t>(value(kType)), 0, KFilterSection::kTypeCount - 1);
    KFilterSection& design = designs_[band];
    design.Design(type, value(kGain), std::min(value(kFrequency), top), rate, value(kQ));
    const double on[5] = {design.b0, design.minusA1, design.b1, design.minusA2, design.b2};
    std::copy_n(value(kEnable) >= 0.5 ? on : kPassThrough, 5, targets[band]);
  }
}

void KEqualizerPlugin::Glide(const double (&targets)[kBandCount][5], double gain) noexcept {
  Bands& k = bands_;
  if (jump_) {
    std::copy_n(&targets[0][0], kBandCount * 5, &k.target[0][0]);
    k.gainTarget = gain;
    Land();
    jump_ = false;
    return;
  }
  // An update that changes nothing (a sample-rate notice, a tidy-up) lets a glide go on as it was.
  if (std::equal(&targets[0][0], &targets[0][0] + kBandCount * 5, &k.target[0][0]) && gain == k.gainTarget) return;
  std::copy_n(&targets[0][0], kBandCount * 5, &k.target[0][0]);
  k.gainTarget = gain;
  glideLeft_ = std::max(1, static_cast<int32_t>(SampleRate() * kGlideSeconds));
  for (int32_t band = 0; band < kBandCount; ++band)
    for (int m = 0; m < 5; ++m) k.step[band][m] = (k.target[band][m] - k.current[band][m]) / glideLeft_;
  k.gainStep = (gain - k.gain) / glideLeft_;
}

void KEqualizerPlugin::Land() noexcept {
  Bands& k = bands_;
  std::copy_n(&k.target[0][0], kBandCount * 5, &k.current[0][0]);
  std::fill_n(&k.step[0][0], kBandCount * 5, 0.0);
  k.gain = k.gainTarget;
  k.gainStep = 0.0;
  glideLeft_ = 0;
}

// Chooses the cascade: every band that is not flat, on its way or at rest, and every flat band
// still ringing from before.
void KEqualizerPlugin::Engage() noexcept {
  Bands& k = bands_;
  k.engagedCount = 0;
  tidy_ = false;
  for (int32_t band = 0; band < kBandCount; ++band) {
    double ringing = 0.0;
    for (const auto& row : k.state[band])
      for (double s : row) ringing = std::max(ringing, std::abs(s));
    const bool flat = Flat(k.current[band]) && Flat(k.target[band]);
    if (!flat || ringing > kResidue) {
      k.engaged[k.engagedCount++] = band;
      tidy_ = tidy_ || Flat(k.target[band]);  // it will fall silent and leave: check back
    } else {
      std::fill_n(&k.state[band][0][0], 2 * Bands::kChannels, 0.0);
    }
  }
  const size_t lanes = ChannelsPerBus() == 2 ? 1 : 0;
  steady_ = kSteadyKernels[lanes][static_cast<size_t>(k.engagedCount)];
  gliding_ = kGlidingKernels[lanes][static_cast<size_t>(k.engagedCount)];
}

void KEqualizerPlugin::ResetState() {
  for (auto& band : bands_.state)
    for (auto& row : band) std::fill(std::begin(row), std::end(row), 0.0);
  jump_ = true;
}

void KEqualizerPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t gliding = std::min(glideLeft_, sampleCount);
  if (gliding > 0) {
    gliding_(bands_, inputs, outputs, gliding);
    glideLeft_ -= gliding;
    if (glideLeft_ == 0) Land();
  }
  if (gliding < sampleCount) {
    const float* in[Bands::kChannels] = {};
    float* out[Bands::kChannels] = {};
    for (int32_t c = 0; c < std::min(ChannelsPerBus(), Bands::kChannels); ++c) {
      in[c] = inputs[c] + gliding;
      out[c] = outputs[c] + gliding;
    }
    steady_(bands_, in, out, sampleCount - gliding);
  }
  Settle();
  if (tidy_) MarkUpdatePending();
}

// Once per block: state that a NaN or infinity reached starts again from silence instead of
// poisoning every later block, and state too small to hear becomes exact zero.
void KEqualizerPlugin::Settle() noexcept {
  Bands& k = bands_;
  for (int32_t j = 0; j < k.engagedCount; ++j) {
    for (auto& row : k.state[k.engaged[j]]) {
      for (double& s : row) {
        const double magnitude = std::abs(s);
        if (!(magnitude >= kSilent && magnitude <= std::numeric_limits<double>::max())) s = 0.0;
      }
    }
  }
}
