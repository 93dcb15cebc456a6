#pragma once

#include <atomic>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "core/Element.h"
#include "core/KAudioPluginBase.h"
#include "core/KChannelMode.h"
#include "core/KControllerMap.h"
#include "core/KGlobalSettings.h"
#include "core/KHandOver.h"
#include "core/KLevelMeter.h"
#include "core/KMIDIProcessor.h"
#include "core/KMIDIQueue.h"
#include "core/KModulator.h"
#include "core/KMultiParameters.h"
#include "core/KTransport.h"
#include "core/KUndoHistory.h"
#include "kernel/KExport.h"
#include "kernel/KFactoryPreset.h"
#include "kernel/KString.h"
#include "kernel/KStringList.h"

class KModule;
class KPresetStore;

// The mixer channel a plug-in sits on, as far as its host tells it (not every host does).
struct KChannelContext {
  KString name;
  uint32_t color = 0;  // 0xAARRGGBB as the host gives it; meaningful only with hasColor
  bool hasColor = false;
  KString location;  // where on the channel the plug-in sits, in the host's words
};

// The base of every plug-in of the catalogue: parameters and ramps (KAudioPluginBase), MIDI
// input (KMIDIProcessor) and the processing cycle that turns each host block into calls of the
// plug-in's own Process, cut at ramp break points and, when asked, at MIDI events; and the
// plug-in's state: the document hosts save with a project, presets and the undo history.
class TORVANE_API KAudioPlugin : public KAudioPluginBase, public KMIDIProcessor, public KUndoTarget {
public:
  // Flag bits of the state routines, which serve both directions.
  static constexpr uint32_t kStore = 1u << 0;           // set: store into the element; clear: load from it
  static constexpr uint32_t kRemoveDefaults = 1u << 2;  // storing: drop attributes that went back to default
  // The root element of a state document.
  static constexpr const char* kStateRoot = "TorvaneState";

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
  // The module whose user data folder holds the presets: the one the registry handed over at
  // creation, else the module of the identifier. KException for an instance that has neither.
  void SetModule(KModule* module) noexcept { module_ = module; }
  KModule& Module() const;

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
  // Bypassed, the main input goes out unchanged and undelayed (silence for an instrument) and
  // the plug-in's processing rests; parameter changes meanwhile land at once on return.
  void SetBypass(bool bypass) noexcept { bypass_.store(bypass, std::memory_order_relaxed); }
  bool IsBypassed() const noexcept { return bypass_.load(std::memory_order_relaxed); }
  // The bypass switched by the user in the editor (user-interface thread): sets it and, when a
  // host is attached, tells the host so that its bypass follows.
  void SetBypassFromUser(bool bypass);
  void SetMeterReset(bool reset) noexcept { meterReset_.store(reset, std::memory_order_relaxed); }
  const KLevelMeter& GetMeter(Meter meter) const noexcept { return meters_[meter]; }
  KLevelMeter& GetMeter(Meter meter) noexcept { return meters_[meter]; }
  // Milliseconds (platform clock) at the start of a recent block, taken again once at least
  // kStampSamples were processed since: tells the editor whether the host is processing.
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

  // ---- tail (any thread; derived from the parameters, not from the audio thread's state)
  // Samples at the current rate for which the plug-in may go on producing output, or need
  // processing to come to rest, once its input has fallen silent: how long a host must keep
  // calling before it may stop. 0 for a plug-in without memory.
  static constexpr uint32_t kInfiniteTail = 0xFFFFFFFFu;  // it may never end
  // Unless a plug-in says otherwise it may ring forever: no host ever cuts it short.
  virtual uint32_t TailSamples() const noexcept { return kInfiniteTail; }

  // ---- audio thread
  // Queues one MIDI message of the current host block at `sampleOffset`.
  void ScheduleMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) noexcept;
  KTransport& Transport() noexcept { return transport_; }
  // The host's song position in quarter notes at the start of the piece of audio now being
  // processed, while the transport plays; -1 when it is stopped or the host tells no position.
  double SongPosition() const noexcept { return transport_.PlayingPositionAt(pieceStart_, sampleRate_); }
  // One host block: `inputs` may be null (silence); `outputs` must hold OutputChannelCount()
  // channels. Host buffers are read only; inputs and outputs may be the same buffers. Without
  // output buffers or samples nothing is processed, but the block's MIDI messages still arrive.
  void ProcessHostBlock(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept;
  // An assigned controller moves its parameters (see Controllers()); pitch bend is taken as
  // 0..1 from its full range. Plug-ins that handle controllers themselves call this too.
  void ProcessMIDIController(const KMIDIEvent& event) override;

  // ---- state document (user-interface thread)
  // Layout (each section holds only what differs from its defaults):
  //   <TorvaneState Plugin="identifier" Version="..." global settings...>
  //     <ProgramChange .../>                      program-change settings
  //     <Parameters key="working value" .../>     shortest text that reads back exactly
  //     <PluginSettings .../>                     the plug-in's own (StorePluginSettings)
  //     <MultiParameters/> <LFOs/>                kept as found, and acting: see StoreMultiParameters
  //     <Arpeggiator/>                            kept as found
  //     <ParamLock key="1" .../>
  //     <Controllers flags...><NoteControllers/><Controller Number= Channel= Parameter=/>...</Controllers>
  //     <ActivePreset Name="..." Current="1" Factory="1"/>
  //   </TorvaneState>
  // Stores every section into `root` (named kStateRoot here). kRemoveDefaults in `flags`
  // cleans a root that holds an earlier state of values that went back to their defaults.
  void StoreState(Element& root, uint32_t flags = 0);
  // The state as compact UTF-8 XML text, as every host carries it.
  std::string WriteState();
  // Loads a whole state: every value returns to its default and then takes what the document
  // holds; the values land at once at the next block. A root of another name is refused with a
  // KException before anything changes.
  void LoadState(Element root);
  // All or nothing: the whole text is read first, and a KException from reading leaves the
  // plug-in exactly as it was.
  void ReadState(std::string_view text);

  // The section routines. Each serves both directions as `flags` says (kStore,
  // kRemoveDefaults), with the element of its section.
  // On the root: the global settings, Version (only stored) and the channel mode first.
  void StoreGlobal(Element& section, uint32_t flags);
  // What a document brings under "MultiParameters", "LFOs" and "Arpeggiator" (and
  // "NoteControllers" in "Controllers") is kept as found and written back unchanged, so that a
  // state from a richer version survives a round trip through this one. Loading, the first two
  // also act: multiparameters become controls (KMultiParameters) and the LFOs a modulator made
  // by the registered maker (KModulator), handed to the audio thread at its next block.
  void StoreMultiParameters(Element& section, uint32_t flags);
  void StoreLFO(Element& section, uint32_t flags);
  void StoreArp(Element& section, uint32_t flags);

  // ---- modulators (user-interface thread)
  const Element& LFOs() const noexcept { return lfos_; }
  // A new "LFOs" section, acting from the next block.
  void SetLFOs(Element section);
  const Element& MultiParameterSection() const noexcept { return multiParameters_; }
  void SetMultiParameterSection(Element section);
  int32_t MultiParameterCount() const noexcept { return multi_.Count(); }
  const KMultiParameters::Control& MultiParameter(int32_t index) const noexcept { return multi_.Get(index); }
  // Moves a multiparameter's targets along their curves, sample-accurately from the next block.
  void SetMultiParameter(int32_t index, double value, int32_t glideSamples = 0);
  // One "1" attribute per locked parameter key.
  void StoreParamLock(Element& section, uint32_t flags);
  void StoreControllers(Element& section, uint32_t flags);
  void StoreActivePresets(Element& section, uint32_t flags);

  // ---- settings kept with the state (user-interface thread)
  KGlobalSettings& GlobalSettings() noexcept { return globals_; }
  // A locked parameter keeps its value when a preset loads.
  void SetParameterLocked(int32_t index, bool locked) noexcept { locked_[index] = locked; }
  bool IsParameterLocked(int32_t index) const noexcept { return locked_[index]; }
  KControllerMap& Controllers() noexcept { return controllers_; }

  // ---- the host's channel (user-interface thread only; not kept with the state)
  void SetChannelContext(const KChannelContext& context) { channelContext_ = context; }
  const KChannelContext& ChannelContext() const noexcept { return channelContext_; }

  // ---- presets (KException on failure)
  // Two kinds, listed in this order wherever presets are offered: the plug-in's factory presets,
  // which ship with it and never change, then the user's own, kept in "presets.xml" of
  // Module()'s user data folder. A position in ListPresets() counts across both.
  //
  // Factory presets are read-only: saving or renaming a user preset to a factory preset's name
  // is refused, and renaming or deleting acts on the user's presets only. A user preset that
  // already bears a factory name (written by an older version, or by hand) is listed among the
  // user's and reached by its position; by name, the factory preset comes first.
  void SetFactoryPresets(std::span<const KFactoryPreset> presets) noexcept { factoryPresets_ = presets; }
  std::span<const KFactoryPreset> FactoryPresets() const noexcept { return factoryPresets_; }
  int32_t FactoryPresetCount() const noexcept { return static_cast<int32_t>(factoryPresets_.size()); }
  // The factory presets' names alone: what can be offered even when the user's cannot be read.
  KStringList FactoryPresetNames() const;
  // The factory presets' names, then the user's in file order.
  KStringList ListPresets() const;
  // Loads the preset at `index` of ListPresets(); "There is no preset number {0}." beyond it.
  void SelectPreset(int32_t index);
  void SavePreset(const KString& name);
  // Loads a preset's sound: the parameters but the locked ones, the plug-in's own settings, the
  // kept modulator sections and, unless DoNotLoadFromPresets is on, the controller
  // assignments. The instance's global settings and parameter locks stay. One undo step.
  // A factory preset of that name, else the user's.
  void LoadPreset(const KString& name);
  // Loads one of the plug-in's own sounds the same way: the parameters it names take its values,
  // every other one its default. A KException, before anything changes, for a key the plug-in
  // does not have.
  void LoadFactoryPreset(const KFactoryPreset& preset);
  void RenamePreset(const KString& from, const KString& to);
  void DeletePreset(const KString& name);
  // The preset the settings came from (empty: none), whether it is a factory preset, and
  // whether the settings are still its own: no change was recorded for undo since it was loaded
  // or saved.
  const KString& ActivePresetName() const noexcept { return activePreset_.name; }
  bool IsActivePresetFactory() const noexcept { return activePreset_.factory; }
  bool IsActivePresetCurrent() const noexcept { return activePreset_.current; }

  // ---- undo (user-interface thread); the editor reports every change it makes
  // `value` is the parameter's normalised value from before the change.
  void UndoStore(int32_t index, double value) noexcept;
  // Before a change of the whole settings (randomising, say).
  void UndoStoreSettings() noexcept;
  void Undo() noexcept;
  void Redo() noexcept;
  bool CanUndo() const noexcept { return undo_.CanUndo(); }
  bool CanRedo() const noexcept { return undo_.CanRedo(); }

  // KUndoTarget: the history sees normalised values and the whole state document.
  int32_t GetParameterCount() const override { return ParameterCount(); }
  double GetParameterValue(int32_t index) const override;
  void SetParameterValue(int32_t index, double value) override;
  void StoreSettings(Element& settings) override { StoreState(settings); }
  void LoadSettings(const Element& settings) override { LoadState(settings); }
  // The editor, when there is one, reads CanUndo and CanRedo as it draws.
  void UpdateUndoButtons(bool /*canUndo*/, bool /*canRedo*/) override {}

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
  // For a plug-in whose own last pass reads its main inputs and writes its outputs anyway (from
  // ProcessUpdate): the rows where every Process leaves, for main channels 0 and 1, the largest
  // magnitudes of its input and of its output over the sub-block, NaN samples left out. With
  // them the cycle reads no audio for the level meters; null, it meters the audio itself.
  // Outputs that the channel mode converts after Process are the cycle's to meter all the same.
  using PeakRow = float[2];
  void SetMeasuredPeaks(const PeakRow* rows) noexcept { measuredPeaks_ = rows; }

private:
  struct ActivePreset {
    KString name;
    bool current = false;
    bool factory = false;
  };
  // Which sections a load touches: all of them, or a preset's sound only.
  enum class Scope { kWholeState, kPresetSound };

  // Every section in document order, both directions.
  void StoreSections(Element& root, uint32_t flags, Scope scope);
  void StoreParameters(Element& section, uint32_t flags, Scope scope);
  // KException, before anything changes, for a tree that is not a plug-in state.
  static void RequireStateRoot(const Element& root);
  int32_t DefaultChannelMode() const noexcept;
  // The global current preset follows the active one: its name and its place in ListPresets().
  void FollowActivePreset(const KPresetStore& store);
  // The factory preset of that name, or null.
  const KFactoryPreset* FindFactoryPreset(const KString& name) const;
  // KException "... is a factory preset ..." when a user preset may not take or lose that name.
  void RequireUserPresetName(const KString& name, const char* refusal) const;
  void LoadUserPreset(const KPresetStore& store, const KString& name);
  void TellHostSettingsChanged() noexcept;
  void PassThrough(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept;
  // Audio thread, before each piece of a host block: the modulator's ramps for it.
  void Modulate(int32_t length) noexcept;

  // Samples of the channel mode's input copies, which live on the stack of the processing call.
  static constexpr int32_t kScratchSamples = 2 * kMaxChunk;
  // `allInputs`: the host handed every input buffer.
  void ProcessChunk(const float* const* inputs, float* const* outputs, int32_t start, int32_t length, bool allInputs) noexcept;
  // The chunk on copies of the host's arrays, cut into pieces at `next` and then at the ramps'
  // and events' break points, at most `cap` long.
  void ProcessPieces(const float* const* inputs, float* const* outputs, int32_t start, int32_t length, int32_t next,
                     int32_t cap) noexcept;
  void ProcessAudio(const float* const* inputs, float* const* outputs, int32_t sampleCount) noexcept;
  // Feeds the meter pair from `first` with a channel pair, or its left meter with one channel.
  void MeterChannels(Meter first, const float* left, const float* right, int32_t sampleCount) noexcept;
  void TakeMeasuredPeaks(const PeakRow* rows, bool outputs, int32_t sampleCount) noexcept;

  Shape shape_;
  KString identifier_;
  KTransport transport_;
  int32_t pieceStart_ = 0;  // samples from the host block's start to the piece being processed
  KMIDIQueue midi_;
  KLevelMeter meters_[kMeterCount];
  int32_t channelsPerBus_ = kChannelCounts[0];
  // The longest piece of a host block processed at once: kMaxChunk, shorter for plug-ins with
  // more than two inputs. Follows the channel count.
  int32_t chunkLength_ = kMaxChunk;
  double sampleRate_ = 44100.0;
  int32_t subBlockCap_ = kDefaultSubBlockCap;
  int32_t fineSubBlockCap_ = kDefaultFineSubBlockCap;
  // Set on the audio thread, read by the host interface's timer.
  std::atomic<int32_t> latency_{0};
  std::atomic<int32_t> oversampling_{1};
  std::atomic<int32_t> channelMode_{0};
  std::atomic<bool> meterReset_{false};
  std::atomic<uint64_t> lastProcessingTime_{0};
  // Reading the clock at every block would cost a small block a noticeable share of its time.
  static constexpr int32_t kStampSamples = 512;
  int32_t sinceStamp_ = kStampSamples;  // audio thread: samples since the stamp; the first block takes one
  // The channel mode of the current chunk, read once so that routing and restoring agree.
  int32_t chunkMode_ = 0;
  std::atomic<bool> bypass_{false};
  bool resumeFromBypass_ = false;  // audio thread
  const PeakRow* measuredPeaks_ = nullptr;  // audio thread

  // State beyond the parameters, user-interface thread unless noted.
  KModule* module_ = nullptr;
  KGlobalSettings globals_;
  KArray<bool> locked_;
  KControllerMap controllers_;  // read by the audio thread
  Element multiParameters_;
  KMultiParameters multi_;
  Element lfos_;
  KHandOver<KModulator> modulator_;
  std::atomic<bool> resetModulator_{false};
  Element arpeggiator_;
  Element noteControllers_;
  ActivePreset activePreset_;
  std::span<const KFactoryPreset> factoryPresets_;
  KChannelContext channelContext_;
  KUndoHistory undo_{*this};
};
