#include "plugins/midside/KMidSidePlugin.h"

#include <utility>

#include "core/KParameter.h"
#include "dsp/KDecibels.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};

// a x b, both 2×2 in the order left-left, left-right, right-left, right-right.
void Multiply(const double (&a)[4], const double (&b)[4], double (&out)[4]) {
  out[0] = a[0] * b[0] + a[1] * b[2];
  out[1] = a[0] * b[1] + a[1] * b[3];
  out[2] = a[2] * b[0] + a[3] * b[2];
  out[3] = a[2] * b[1] + a[3] * b[3];
}
}  // namespace

KMidSidePlugin::KMidSidePlugin() : KAudioPlugin(kParameters, kShape) {}

KAudioPlugin* KMidSidePlugin::Create(KModule*, const KPluginRecord*) { return new KMidSidePlugin; }

namespace {
constexpr KFactoryPreset::Value kWider[] = {{"sidegain", 3.0}, {"midgain", -1.0}};
constexpr KFactoryPreset::Value kSideOnly[] = {{"listen", 2.0}};
constexpr KFactoryPreset::Value kEncodeValues[] = {{"mode", 1.0}};
constexpr KFactoryPreset::Value kDecodeValues[] = {{"mode", 2.0}};
constexpr KFactoryPreset kPresets[] = {{"Wider", kWider}, {"Side alone", kSideOnly}, {"Encode", kEncodeValues}, {"Decode", kDecodeValues}};
}  // namespace

constinit const KPluginDescription kMidSideDescription{
    .key = "KMidSidePlugin",
    .factory = &KMidSidePlugin::Create,
    .moduleKey = "MidSide",
    .category = "Stereo",
    .name = "MidSide",
    .vst3SubCategories = "Fx|Spatial",
    .vst2Id = "TvMs",
    .identity = "KMidSidePlugin",
    .help = &KMidSideHelp,
    .editor = &KMidSideEditor,
    .presets = kPresets,
};

// In: left and right to mid = (L+R)/2 and side = (L−R)/2, unless the input is coded already.
// Then the gains and the listening choice, and out: back to left and right, unless the output
// stays coded (mid on the left channel, side on the right).
void KMidSidePlugin::ProcessUpdate() {
  const auto mode = static_cast<int32_t>(GetParameter(kMode).Working());
  const auto listen = static_cast<int32_t>(GetParameter(kListen).Working());
  const double mid = listen == kSideOnly ? 0.0 : KDecibelsToLinear(GetParameter(kMidGain).Working());
  const double side = listen == kMidOnly ? 0.0 : KDecibelsToLinear(GetParameter(kSideGain).Working());
  constexpr double kToMidSide[4] = {0.5, 0.5, 0.5, -0.5}, kToLeftRight[4] = {1.0, 1.0, 1.0, -1.0}, kAsIs[4] = {1.0, 0.0, 0.0, 1.0};
  // Side alone is heard in the middle (on both speakers) rather than in opposite polarity.
  const double kSideToBoth[4] = {0.0, 1.0, 0.0, 1.0};
  const double gains[4] = {mid, 0.0, 0.0, side};
  const double(&in)[4] = mode == kDecode ? kAsIs : kToMidSide;
  const double(&out)[4] = mode == kEncode ? kAsIs : (listen == kSideOnly ? kSideToBoth : kToLeftRight);
  double coded[4], target[4];
  Multiply(gains, in, coded);
  Multiply(out, coded, target);
  if (ChannelsPerBus() == 1) target[0] = mid;  // one channel is all mid
  matrix_.Aim(target, static_cast<int32_t>(SampleRate() * kGlideSeconds), std::exchange(jumpToTarget_, false));
}

void KMidSidePlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  matrix_.Process(inputs, outputs, ChannelsPerBus(), sampleCount);
}
