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

// The channel mode's copies of the inputs share one stack area of `scratch` samples; with more
// than one channel pair the pieces get shorter so that every copy fits (rounded down to four
// samples so that each copy stays 16-byte aligned).
int32_t ChunkLengthFor(int32_t inputCount, int32_t scratch) noexcept {
  return inputCount <= 2 ? KAudioPlugin::kMaxChunk : scratch / inputCount / 4 * 4;
}

// Whether a host's array of channel buffers is there and holds every buffer.
template <class Sample>
bool AllPresent(Sample* const* buffers, int32_t count) noexcept {
  if (!buffers) return false;
  for (int32_t c = 0; c < count; ++c)
    if (!buffers[c]) return false;
  return true;
}
}  // namespace

KAudioPlugin::KAudioPlugin(std::span<const KParameterInfo> parameters, const Shape& shape)
    : KAudioPluginBase(parameters), KMIDIProcessor(transport_), shape_(shape) {
  KMIDIProcessor::SetSampleRate(sampleRate_);
  chunkLength_ = ChunkLengthFor(InputChannelCount(), kScratchSamples);
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
  chunkLength_ = ChunkLengthFor(InputChannelCount(), kScratchSamples);
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

KAudioPlugin* KAdoptNewPlugin(KAudioPlugin* plugin, const KString& name, KModule* module, std::span<const KFactoryPreset> presets) {
  std::unique_ptr<KAudioPlugin> owned(plugin);
  owned->SetIdentifier(name);
  owned->SetModule(module);
  owned->SetFactoryPresets(presets);
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
  if (sinceStamp_ >= kStampSamples) {
    sinceStamp_ = 0;
    lastProcessingTime_.store(KPlatform::MillisecondClock(), std::memory_order_relaxed);
  }
  sinceStamp_ += std::clamp(sampleCount, 1, kStampSamples);
  AcceptPostedRamps();
  const bool hasOutputs = AllPresent(outputs, OutputChannelCount());
  // A host that hands no buffer (or no samples) gets nothing written.
  if (hasOutputs && sampleCount > 0 && IsBypassed()) {
    PassThrough(inputs, outputs, sampleCount);
    resumeFromBypass_ = true;
  } else if (hasOutputs && sampleCount > 0) {
    // Ramps waited while the plug-in rested: their values land at once rather than late.
    if (std::exchange(resumeFromBypass_, false)) RequestJump();
    ResolveBlockEnd(sampleCount);
    const bool allInputs = AllPresent(inputs, InputChannelCount());
    for (int32_t start = 0; start < sampleCount; start += chunkLength_)
      ProcessChunk(inputs, outputs, start, std::min(chunkLength_, sampleCount - start), allInputs);
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

void KAudioPlugin::ProcessChunk(const float* const* inputs, float* const* outputs, int32_t start, int32_t length,
                                bool allInputs) noexcept {
  const int32_t mode = chunkMode_ = channelsPerBus_ == 2 ? ChannelMode() : KChannelMode::kLeftRight;
  pieceStart_ = start;
  if (!modulator_.IsIdle()) Modulate(length);
  int32_t cap = subBlockCap_;
  int32_t next = std::max(1, InterpolationPrepare(length, cap, fineSubBlockCap_));
  // Without event splitting every message of the chunk is handed over before its audio.
  const int32_t eventEnd = shape_.splitsAtEvents ? start + 1 : start + length;
  if (midi_.Count() > 0) ProcessMIDIQueue(midi_, eventEnd);
  int32_t stamp;
  if (shape_.splitsAtEvents && midi_.NextTimeStamp(stamp) && stamp - start < next) next = std::max(1, stamp - start);

  // Most blocks are one piece that needs neither offsets, nor silence for a missing input, nor
  // the channel mode's copies: the host's own arrays serve.
  if (next >= length && start == 0 && allInputs && mode == KChannelMode::kLeftRight) {
    ProcessAudio(inputs, outputs, length);
    InterpolationProcess(length, 0);
  } else {
    ProcessPieces(inputs, outputs, start, length, next, cap);
  }
  InterpolationFinish();
}

void KAudioPlugin::ProcessPieces(const float* const* inputs, float* const* outputs, int32_t start, int32_t length,
                                 int32_t next, int32_t cap) noexcept {
  const int32_t inputCount = InputChannelCount();
  const int32_t outputCount = OutputChannelCount();
  const float* in[kMaxChannels];
  float* out[kMaxChannels];
  for (int32_t c = 0; c < inputCount; ++c) in[c] = inputs && inputs[c] ? inputs[c] + start : kSilence;
  for (int32_t c = 0; c < outputCount; ++c) out[c] = outputs[c] + start;

  // The channel mode acts on every channel pair alike and works on copies: the host's buffers
  // are never written.
  const int32_t mode = chunkMode_;
  alignas(16) float scratch[kScratchSamples];
  const int32_t stride = chunkLength_;
  for (int32_t c = 0; c + 1 < inputCount && mode != KChannelMode::kLeftRight; c += 2)
    KChannelMode::RouteInputs(mode, in[c], in[c + 1], scratch + c * stride, scratch + (c + 1) * stride, length);
  if (KChannelMode::SwapsOutputs(mode))
    for (int32_t c = 0; c + 1 < outputCount; c += 2) std::swap(out[c], out[c + 1]);

  if (next >= length) {
    ProcessAudio(in, out, length);
    InterpolationProcess(length, 0);
    return;
  }
  for (int32_t done = 0; done < length;) {
    int32_t piece = std::max(1, std::min({next, cap, length - done}));
    if (shape_.splitsAtEvents) {
      int32_t stamp;
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
    if (TakeUpdatePending()) ProcessUpdate();
    // The meters show the main bus only: a mono plug-in's side-chain is no right channel. The
    // input meters read what Process reads, before it may overwrite it in place.
    const PeakRow* measured = measuredPeaks_;
    const bool pair = channelsPerBus_ >= 2;
    if (shape_.inputBuses > 0 && !measured) MeterChannels(kInputLeft, inputs[0], pair ? inputs[1] : nullptr, sampleCount);
    Process(inputs, outputs, sampleCount);
    // `outputs` are the plug-in's pointers; where the mode exchanged a pair, the host's left
    // channel is the plug-in's second. Restored outputs are no longer what Process measured.
    const bool converted = chunkMode_ != KChannelMode::kLeftRight;
    if (measured) TakeMeasuredPeaks(measured, !converted, sampleCount);
    const int32_t swapped = KChannelMode::SwapsOutputs(chunkMode_) ? 1 : 0;
    if (converted)
      for (int32_t c = 0; c + 1 < OutputChannelCount(); c += 2)
        KChannelMode::RestoreOutputs(chunkMode_, outputs[c + swapped], outputs[c + 1 - swapped], sampleCount);
    if (shape_.outputBuses > 0 && (!measured || converted))
      MeterChannels(kOutputLeft, outputs[swapped], pair ? outputs[1 - swapped] : nullptr, sampleCount);
    if (meterReset_.load(std::memory_order_relaxed))
      for (KLevelMeter& meter : meters_) meter.Reset();
  });
}

void KAudioPlugin::TakeMeasuredPeaks(const PeakRow* rows, bool outputs, int32_t sampleCount) noexcept {
  const int32_t channels = std::min(channelsPerBus_, 2);
  const bool input = shape_.inputBuses > 0, output = outputs && shape_.outputBuses > 0;
  for (int32_t c = 0; c < channels; ++c) {
    if (input) meters_[kInputLeft + c].AccumulatePeak(rows[c][0], sampleCount);
    if (output) meters_[kOutputLeft + c].AccumulatePeak(rows[c][1], sampleCount);
  }
}

void KAudioPlugin::MeterChannels(Meter first, const float* left, const float* right, int32_t sampleCount) noexcept {
  if (right) KLevelMeter::AccumulatePair(meters_[first], meters_[first + 1], left, right, sampleCount);
  else meters_[first].Accumulate(left, sampleCount);
}
