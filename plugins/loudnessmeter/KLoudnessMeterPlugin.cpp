#include "plugins/loudnessmeter/KLoudnessMeterPlugin.h"

#include <algorithm>
#include <cmath>

#include "core/KParameter.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
}  // namespace

KLoudnessMeterPlugin::KLoudnessMeterPlugin() : KAudioPlugin(kParameters, kShape) {
  meter_.Prepare(SampleRate());
  ResetState();
}

KAudioPlugin* KLoudnessMeterPlugin::Create(KModule*, const KPluginRecord*) { return new KLoudnessMeterPlugin; }

namespace {
constexpr KFactoryPreset::Value kBroadcast[] = {{"target", -23.0}};
constexpr KFactoryPreset::Value kStreaming[] = {{"target", -14.0}};
constexpr KFactoryPreset::Value kPodcast[] = {{"target", -16.0}, {"history", 0.0}};
constexpr KFactoryPreset kPresets[] = {{"Broadcast", kBroadcast}, {"Streaming", kStreaming}, {"Podcast", kPodcast}};
}  // namespace

constinit const KPluginDescription kLoudnessMeterDescription{
    .key = "KLoudnessMeterPlugin",
    .factory = &KLoudnessMeterPlugin::Create,
    .moduleKey = "LoudnessMeter",
    .category = "Special",
    .name = "LoudnessMeter",
    .vst3SubCategories = "Fx|Analyzer",
    .vst2Id = "TvLm",
    .identity = "KLoudnessMeterPlugin",
    .help = &KLoudnessMeterHelp,
    .editor = &KLoudnessMeterEditor,
    .presets = kPresets,
};

bool KLoudnessMeterPlugin::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  meter_.Prepare(sampleRate);
  partsRecorded_ = 0;
  return true;
}

void KLoudnessMeterPlugin::ResetState() {
  meter_.Reset();
  partsRecorded_ = 0;
  for (auto& reading : history_) reading.store(static_cast<float>(KLoudnessMeter::kSilence), std::memory_order_relaxed);
}

double KLoudnessMeterPlugin::History(double secondsAgo) const noexcept {
  const int32_t back = std::clamp(static_cast<int32_t>(std::lround(secondsAgo * 10.0)), 0, kHistoryLength - 1);
  const int32_t slot = (newest_.load(std::memory_order_acquire) - back + kHistoryLength) % kHistoryLength;
  return history_[static_cast<size_t>(slot)].load(std::memory_order_relaxed);
}

void KLoudnessMeterPlugin::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  const int32_t channels = ChannelsPerBus();
  for (int32_t c = 0; c < channels; ++c)
    if (outputs[c] != inputs[c]) std::copy_n(inputs[c], sampleCount, outputs[c]);
  meter_.Process(inputs, channels, sampleCount);
  // One history entry per completed part, so the graph scrolls at the meter's pace.
  const bool shortTerm = GetParameter(kHistory).Working() >= 0.5;
  for (; partsRecorded_ < meter_.PartsSeen(); ++partsRecorded_) {
    const int32_t slot = (newest_.load(std::memory_order_relaxed) + 1) % kHistoryLength;
    history_[static_cast<size_t>(slot)].store(static_cast<float>(shortTerm ? meter_.ShortTerm() : meter_.Momentary()),
                                              std::memory_order_relaxed);
    newest_.store(slot, std::memory_order_release);
  }
}
