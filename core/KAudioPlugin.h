#pragma once

#include <atomic>
#include <cstdint>
#include <span>

#include "core/KAudioPluginBase.h"
#include "core/KLevelMeter.h"
#include "core/KMIDIProcessor.h"
#include "core/KMIDIQueue.h"
#include "core/KTransport.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

class Element;

// The base of every plug-in of the catalogue: parameters and ramps (KAudioPluginBase), MIDI
// input (KMIDIProcessor) and the processing cycle that turns each host block into calls of the
// plug-in's own Process, cut at ramp break points and, when asked, at MIDI events.
class TORVANE_API KAudioPlugin : public KAudioPluginBase, public KMIDIProcessor {
public:
  // Flag bits of the state routines, which serve both directions.
  static constexpr uint32_t kStore = 1u << 0;           // set: store into the element; clear: load from it
  static constexpr uint32_t kRemoveDefaults = 1u << 2;  // storing: drop attributes that went back to default

  // What a plug-in is, as hosts see it.
  struct Shape {
    int32_t inputBuses;   // 0 for an instrument; 2 when the second bus is a side-chain input
    int32_t outputBuses;
    bool acceptsMIDI;
    bool producesMIDI;
    bool splitsAtEvents;  // cut the audio at MIDI events so each lands on its exact sample
  };
  // Channels per bus the plug-in can run with, in order of preference.
  static constexpr int32_t kChannelCounts[] = {2, 1};
  static constexpr int32_t kMaxChannels = 32;
  // Longest stretch processed at once; longer host blocks are taken in pieces of at most this
  // size, invisibly to the plug-in (ramps and events keep the host block's time line).
  static constexpr int32_t kMaxChunk = 4096;
  // The four level meters: input left and right, output left and right.
  enum Meter : int32_t { kInputLeft, kInputRight, kOutputLeft, kOutputRight, kMeterCount };

  KAudioPlugin(std::span<const KParameterInfo> parameters, const Shape& shape);
  ~KAudioPlugin() override;

  // The name under which the instance was created, exactly as the caller gave it.
  const KString& Identifier() const noexcept { return identifier_; }
  void SetIdentifier(const KString& identifier) { identifier_ = identifier; }

  // ---- set-up (not while processing)
  const Shape& GetShape() const noexcept { return shape_; }
  // False for a count the plug-in cannot run with.
  bool SetChannelsPerBus(int32_t channels) noexcept;
  int32_t ChannelsPerBus() const noexcept { return channelsPerBus_; }
  int32_t InputChannelCount() const noexcept { return shape_.inputBuses * channelsPerBus_; }
  int32_t OutputChannelCount() const noexcept { return shape_.outputBuses * channelsPerBus_; }
  // False for a rate the plug-in refuses (not positive, or beyond what it supports).
  virtual bool SetSampleRate(double sampleRate);
  double SampleRate() const noexcept { return sampleRate_; }
  // Clears every filter, envelope and delay line; values jump to where ramps were heading.
  void Reset();

  // ---- settings any thread may change
  void SetChannelMode(int32_t mode) noexcept;
  int32_t ChannelMode() const noexcept { return channelMode_.load(std::memory_order_relaxed); }
  void SetMeterReset(bool reset) noexcept { meterReset_.store(reset, std::memory_order_relaxed); }
  const KLevelMeter& GetMeter(Meter meter) const noexcept { return meters_[meter]; }
  KLevelMeter& GetMeter(Meter meter) noexcept { return meters_[meter]; }
  // Milliseconds (platform clock) at the start of the latest block: tells the editor whether
  // the host is processing.
  uint64_t LastProcessingTime() const noexcept { return lastProcessingTime_.load(std::memory_order_relaxed); }
  // The sample rate of whichever instance processed most recently, for code without a plug-in
  // at hand.
  static double PublishedSampleRate() noexcept;

  // ---- latency
  // Samples the plug-in delays its output by (its own, at its processing rate).
  int32_t Latency() const noexcept { return latency_.load(std::memory_order_relaxed); }
  // The latency hosts see: the plug-in's own divided by its oversampling factor.
  int32_t TotalLatency() const noexcept { return Latency() / oversampling_.load(std::memory_order_relaxed); }
  // Tells the host, at its next idle, when the latency changed.
  void ReportLatency(int32_t samples) noexcept;

  // ---- audio thread
  // Queues one MIDI message of the current host block at `sampleOffset`.
  void ScheduleMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept;
  KTransport& Transport() noexcept { return transport_; }
  // One host block: `inputs` may be null (silence); `outputs` must hold OutputChannelCount()
  // channels. Host buffers are read only; inputs and outputs may be the same buffers. Without
  // output buffers or samples nothing is processed, but the block's MIDI messages still arrive.
  void ProcessHostBlock(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept;

protected:
  // Recomputes what depends on parameters; called on the audio thread before a sub-block when
  // something changed since the last call.
  virtual void ProcessUpdate() {}
  // The plug-in's own processing of one sub-block.
  virtual void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) = 0;
  // Clears the plug-in's own processing state.
  virtual void ResetState() {}
  // The plug-in's own settings beyond its parameters (a compressor's transfer graph, say), in
  // its section of the state document; both directions, as the flags say. Values equal to
  // their defaults are not stored, and loading from an element without them restores defaults.
  virtual void StorePluginSettings(Element& /*section*/, uint32_t /*flags*/) {}
  void SetOversampling(int32_t factor) noexcept { oversampling_.store(factor > 1 ? factor : 1, std::memory_order_relaxed); }

private:
  // Samples of the channel mode's input copies, which live on the stack of the processing call.
  static constexpr int32_t kScratchSamples = 2 * kMaxChunk;
  // The longest piece of a host block processed at once: kMaxChunk, shorter for plug-ins with
  // more than two inputs.
  int32_t ChunkLength() const noexcept;
  void ProcessChunk(const float* const* inputs, float* const* outputs, int32_t start, int32_t length) noexcept;
  void ProcessAudio(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept;
  void ProcessAudio_Prepare(const float* const* inputs, int32_t sampleCount) noexcept;
  void ProcessAudio_Finish(float* const* outputs, int32_t sampleCount) noexcept;

  Shape shape_;
  KString identifier_;
  KTransport transport_;
  KMIDIQueue midi_;
  KLevelMeter meters_[kMeterCount];
  int32_t channelsPerBus_ = kChannelCounts[0];
  double sampleRate_ = 44100.0;
  int32_t subBlockCap_ = kDefaultSubBlockCap;
  int32_t fineSubBlockCap_ = kDefaultFineSubBlockCap;
  // Set on the audio thread, read by the host interface's timer.
  std::atomic<int32_t> latency_{0};
  std::atomic<int32_t> oversampling_{1};
  std::atomic<int32_t> channelMode_{0};
  std::atomic<bool> meterReset_{false};
  std::atomic<uint64_t> lastProcessingTime_{0};
  // The channel mode of the current chunk, read once so that routing and restoring agree.
  int32_t chunkMode_ = 0;
};
