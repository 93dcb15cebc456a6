#include "core/KAudioPlugin.h"

#include <algorithm>
#include <memory>
#include <utility>

#include "core/KChannelMode.h"
#include "core/KDenormals.h"
#include "core/KParameter.h"
#include "core/KAudioPluginHost.h"
#include "kernel/KGuard.h"
#include "kernel/KPluginRegistry.h"
#include "kernel/platform/KPlatform.h"

namespace {
std::atomic<double> gPublishedSampleRate{44100.0};
// Read by plug-ins whose host gave no input buffers.
alignas(16) const float kSilence[KAudioPlugin::kMaxChunk] = {};
}  // namespace

KAudioPlugin::KAudioPlugin(std::span<const KParameterInfo> parameters, const Shape& shape)
    : KAudioPluginBase(parameters), KMIDIProcessor(transport_), shape_(shape) {
  KMIDIProcessor::SetSampleRate(sampleRate_);
  locked_.Reserve(ParameterCount());
  for (int32_t i = 0; i < ParameterCount(); ++i) locked_.Append(false);
}

KAudioPlugin::~KAudioPlugin() = default;

double KAudioPlugin::PublishedSampleRate() noexcept { return gPublishedSampleRate.load(std::memory_order_relaxed); }

bool KAudioPlugin::SetChannelsPerBus(int32_t channels) noexcept {
  const bool supported = std::find(std::begin(kChannelCounts), std::end(kChannelCounts), channels) != std::end(kChannelCounts);
  const int32_t buses = std::max(shape_.inputBuses, shape_.outputBuses);
  if (!supported || channels * buses > kMaxChannels) return false;
  channelsPerBus_ = channels;
  MarkUpdatePending();
  return true;
}

bool KAudioPlugin::SetSampleRate(double sampleRate) {
  if (!(sampleRate >= 1000.0 && sampleRate <= 1536000.0)) return false;
  sampleRate_ = sampleRate;
  KMIDIProcessor::SetSampleRate(sampleRate);
  MarkUpdatePending();
  return true;
}

void KAudioPlugin::Reset() {
  resetModulator_.store(true, std::memory_order_release);
  RequestJump();
  ResetState();
  MarkUpdatePending();
}

void KAudioPlugin::SetChannelMode(int32_t mode) noexcept {
  if (mode < 0 || mode >= KChannelMode::kCount) return;
  channelMode_.store(mode, std::memory_order_relaxed);
  MarkUpdatePending();
}

KAudioPlugin* KAdoptNewPlugin(KAudioPlugin* plugin, const KString& name, KModule* module) {
  std::unique_ptr<KAudioPlugin> owned(plugin);
  owned->SetIdentifier(name);
  owned->SetModule(module);
  return owned.release();
}

void KAudioPlugin::SetBypassFromUser(bool bypass) {
  SetBypass(bypass);
  if (KAudioPluginHost* host = Interface()) host->SendBypassAutomation(bypass);
}

void KAudioPlugin::ReportLatency(int32_t samples) noexcept {
  latency_.store(samples, std::memory_order_relaxed);
  if (KAudioPluginHost* host = Interface()) host->RequestLatencyReport(KAudioPluginHost::kLatencyIfChanged);
}

void KAudioPlugin::ScheduleMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept {
  if (shape_.acceptsMIDI) midi_.ScheduleMIDIEvent(sampleOffset, bytes);
}

void KAudioPlugin::ProcessHostBlock(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept {
  KDenormalScope denormals;
  gPublishedSampleRate.store(sampleRate_, std::memory_order_relaxed);
  lastProcessingTime_.store(KPlatform::MillisecondClock(), std::memory_order_relaxed);
  AcceptPostedRamps();
  const int32_t outputCount = OutputChannelCount();
  bool hasOutputs = outputs != nullptr;
  for (int32_t c = 0; hasOutputs && c < outputCount; ++c) hasOutputs = outputs[c] != nullptr;
  // A host that hands no buffer (or no samples) gets nothing written.
  if (hasOutputs && sampleCount > 0 && IsBypassed()) {
    PassThrough(inputs, outputs, sampleCount);
    resumeFromBypass_ = true;
  } else if (hasOutputs && sampleCount > 0) {
    // Ramps waited while the plug-in rested: their values land at once rather than late.
    if (std::exchange(resumeFromBypass_, false)) RequestJump();
    ResolveBlockEnd(sampleCount);
    const int32_t chunk = ChunkLength();
    for (int32_t start = 0; start < sampleCount; start += chunk)
      ProcessChunk(inputs, outputs, start, std::min(chunk, sampleCount - start));
  }
  // Every message of the block arrives within it, even when there was no audio to cut or it is
  // stamped past the block's end (a host's mistake): no note hangs, none is carried over.
  if (midi_.Count() > 0) {
    ProcessMIDIQueue(midi_, INT32_MAX);
    midi_.Clear();
  }
}

void KAudioPlugin::PassThrough(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept {
  // Only the main bus passes: a side-chain is no output, an instrument's output is silent.
  const int32_t passed = shape_.inputBuses > 0 ? channelsPerBus_ : 0;
  for (int32_t c = 0; c < OutputChannelCount(); ++c) {
    const float* in = inputs && c < passed ? inputs[c] : nullptr;
    if (!in) std::fill_n(outputs[c], sampleCount, 0.0f);
    else if (in != outputs[c]) std::copy_n(in, sampleCount, outputs[c]);
  }
}

void KAudioPlugin::ProcessMIDIController(const KMIDIEvent& event) {
  // Pitch bend runs from -1 to just below 1; a parameter takes its whole range.
  const double value = event.number == KMIDIEvent::kPitchBend ? (event.value + 1.0) * 0.5 : event.value;
  controllers_.ForEachListener(event.number, event.channel, [&](int32_t parameter) {
    if (parameter < ParameterCount()) GetParameter(parameter).SetNormalized(value);
  });
}

int32_t KAudioPlugin::ChunkLength() const noexcept {
  // The channel mode's copies of the inputs share one stack area of kScratchSamples; with more
  // than one channel pair the pieces get shorter so that every copy fits (rounded down to four
  // samples so that each copy stays 16-byte aligned).
  const int32_t inputCount = InputChannelCount();
  return inputCount <= 2 ? kMaxChunk : kScratchSamples / inputCount / 4 * 4;
}

void KAudioPlugin::ProcessChunk(const float* const* inputs, float* const* outputs, int32_t start, int32_t length) noexcept {
  const int32_t inputCount = InputChannelCount();
  const int32_t outputCount = OutputChannelCount();
  const float* in[kMaxChannels];
  float* out[kMaxChannels];
  for (int32_t c = 0; c < inputCount; ++c) in[c] = inputs && inputs[c] ? inputs[c] + start : kSilence;
  for (int32_t c = 0; c < outputCount; ++c) out[c] = outputs[c] + start;

  // The channel mode acts on every channel pair alike and works on copies: the host's buffers
  // are never written.
  const int32_t mode = chunkMode_ = channelsPerBus_ == 2 ? ChannelMode() : KChannelMode::kLeftRight;
  alignas(16) float scratch[kScratchSamples];
  const int32_t stride = ChunkLength();
  for (int32_t c = 0; c + 1 < inputCount && mode != KChannelMode::kLeftRight; c += 2)
    KChannelMode::RouteInputs(mode, in[c], in[c + 1], scratch + c * stride, scratch + (c + 1) * stride, length);
  if (KChannelMode::SwapsOutputs(mode))
    for (int32_t c = 0; c + 1 < outputCount; c += 2) std::swap(out[c], out[c + 1]);

  pieceStart_ = start;
  Modulate(length);
  int32_t cap = subBlockCap_;
  int32_t next = std::max(1, InterpolationPrepare(length, cap, fineSubBlockCap_));
  // Without event splitting every message of the chunk is handed over before its audio.
  const int32_t eventEnd = shape_.splitsAtEvents ? start + 1 : start + length;
  if (midi_.Count() > 0) ProcessMIDIQueue(midi_, eventEnd);
  int32_t stamp;
  if (shape_.splitsAtEvents && midi_.NextTimeStamp(stamp) && stamp - start < next) next = std::max(1, stamp - start);

  if (next >= length) {
    ProcessAudio(in, out, length);
    InterpolationProcess(length, 0);
  } else {
    for (int32_t done = 0; done < length;) {
      int32_t piece = std::max(1, std::min({next, cap, length - done}));
      if (shape_.splitsAtEvents) {
        ProcessMIDIQueue(midi_, start + done + 1);
        if (midi_.NextTimeStamp(stamp) && stamp - start - done < piece) piece = std::max(1, stamp - start - done);
      }
      pieceStart_ = start + done;
      ProcessAudio(in, out, piece);
      next = InterpolationProcess(piece, length - done - piece);
      done += piece;
      for (int32_t c = 0; c < inputCount; ++c) in[c] += piece;
      for (int32_t c = 0; c < outputCount; ++c) out[c] += piece;
    }
  }
  InterpolationFinish();
}

void KAudioPlugin::Modulate(int32_t length) noexcept {
  bool changed;
  KModulator* modulator = modulator_.Acquire(changed);
  // A new modulator starts from the set values: offsets of parameters it does not move go.
  if (changed)
    for (int32_t i = 0; i < ParameterCount(); ++i) GetParameter(i).Value().SetModulation(0.0);
  if (!modulator) return;
  if (resetModulator_.exchange(false, std::memory_order_acq_rel)) modulator->Reset();
  modulator->Modulate(*this, length);
}

void KAudioPlugin::ProcessAudio(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept {
  KGuard("KAudioPlugin::ProcessAudio", [&] {
    ProcessAudio_Prepare(inputs, sampleCount);
    if (TakeUpdatePending()) ProcessUpdate();
    Process(inputs, outputs, sampleCount);
    ProcessAudio_Finish(outputs, sampleCount);
  });
}

void KAudioPlugin::ProcessAudio_Prepare(const float* const* inputs, int32_t sampleCount) noexcept {
  KGuard("KAudioPlugin::ProcessAudio_Prepare", [&] {
    // The meters show the main bus only: a mono plug-in's side-chain is no right channel.
    if (shape_.inputBuses > 0 && channelsPerBus_ >= 2)
      KLevelMeter::AccumulatePair(meters_[kInputLeft], meters_[kInputRight], inputs[0], inputs[1], sampleCount);
    else if (shape_.inputBuses > 0)
      meters_[kInputLeft].Accumulate(inputs[0], sampleCount);
  });
}

void KAudioPlugin::ProcessAudio_Finish(float* const* outputs, int32_t sampleCount) noexcept {
  KGuard("KAudioPlugin::ProcessAudio_Finish", [&] {
    // `outputs` are the plug-in's pointers; where the mode exchanged a pair, the host's left
    // channel is the plug-in's second.
    const int32_t outputCount = OutputChannelCount();
    const int32_t swapped = KChannelMode::SwapsOutputs(chunkMode_) ? 1 : 0;
    for (int32_t c = 0; c + 1 < outputCount && chunkMode_ != KChannelMode::kLeftRight; c += 2)
      KChannelMode::RestoreOutputs(chunkMode_, outputs[c + swapped], outputs[c + 1 - swapped], sampleCount);
    if (shape_.outputBuses > 0 && channelsPerBus_ >= 2)
      KLevelMeter::AccumulatePair(meters_[kOutputLeft], meters_[kOutputRight], outputs[swapped], outputs[1 - swapped], sampleCount);
    else if (shape_.outputBuses > 0)
      meters_[kOutputLeft].Accumulate(outputs[0], sampleCount);
    if (meterReset_.load(std::memory_order_relaxed))
      for (KLevelMeter& meter : meters_) meter.Reset();
  });
}
