#pragma once

// The processor side: component and buses, the processing call and what it carries (audio
// buffers, the transport context, parameter queues and events).

#include "hosts/vst3/KVST3Base.h"

namespace KVST3 {

using ParamID = uint32_t;
using ParamValue = double;
using SpeakerArrangement = uint64_t;

namespace SpeakerArrangements {
inline constexpr SpeakerArrangement kEmpty = 0;
inline constexpr SpeakerArrangement kMono = 1ull << 19;  // the centre speaker alone
inline constexpr SpeakerArrangement kStereo = 3;         // left and right
}  // namespace SpeakerArrangements

enum MediaType : int32_t { kAudio = 0, kEvent = 1 };
enum BusDirection : int32_t { kInput = 0, kOutput = 1 };
enum BusType : int32_t { kMain = 0, kAux = 1 };
enum SampleSize : int32_t { kSample32 = 0, kSample64 = 1 };
enum ProcessMode : int32_t { kRealtime = 0, kPrefetch = 1, kOffline = 2 };
enum IoMode : int32_t { kSimple = 0, kAdvanced = 1, kOfflineProcessing = 2 };

struct BusInfo {
  static constexpr uint32_t kDefaultActive = 1;
  int32_t mediaType;
  int32_t direction;
  int32_t channelCount;
  String128 name;
  int32_t busType;
  uint32_t flags;
};

struct RoutingInfo {
  int32_t mediaType;
  int32_t busIndex;
  int32_t channel;
};

struct ProcessSetup {
  int32_t processMode;
  int32_t symbolicSampleSize;
  int32_t maxSamplesPerBlock;
  double sampleRate;
};

struct AudioBusBuffers {
  int32_t numChannels;
  uint64_t silenceFlags;  // bit c: channel c is silent
  union {
    float** channelBuffers32;
    double** channelBuffers64;
  };
};

struct Chord {
  uint8_t keyNote;
  uint8_t rootNote;
  int16_t chordMask;
};

struct FrameRate {
  uint32_t framesPerSecond;
  uint32_t flags;
};

struct ProcessContext {
  enum State : uint32_t {
    kPlaying = 1u << 1,
    kCycleActive = 1u << 2,
    kRecording = 1u << 3,
    kSystemTimeValid = 1u << 8,
    kProjectTimeMusicValid = 1u << 9,
    kTempoValid = 1u << 10,
    kBarPositionValid = 1u << 11,
    kCycleValid = 1u << 12,
    kTimeSigValid = 1u << 13,
    kSmpteValid = 1u << 14,
    kClockValid = 1u << 15,
    kContTimeValid = 1u << 17,
    kChordValid = 1u << 18,
  };
  uint32_t state;
  double sampleRate;
  int64_t projectTimeSamples;
  int64_t systemTime;
  int64_t continousTimeSamples;
  double projectTimeMusic;  // quarter notes
  double barPositionMusic;
  double cycleStartMusic;
  double cycleEndMusic;
  double tempo;
  int32_t timeSigNumerator;
  int32_t timeSigDenominator;
  Chord chord;
  int32_t smpteOffsetSubframes;
  FrameRate frameRate;
  int32_t samplesToNextClock;
};

// ---- events
struct NoteOnEvent {
  int16_t channel;
  int16_t pitch;
  float tuning;
  float velocity;
  int32_t length;
  int32_t noteId;
};

struct NoteOffEvent {
  int16_t channel;
  int16_t pitch;
  float velocity;
  int32_t noteId;
  float tuning;
};

struct DataEvent {
  uint32_t size;
  uint32_t type;  // 0: system exclusive
  const uint8_t* bytes;
};

struct PolyPressureEvent {
  int16_t channel;
  int16_t pitch;
  float pressure;
  int32_t noteId;
};

struct NoteExpressionValueEvent {
  uint32_t typeId;
  int32_t noteId;
  double value;
};

struct NoteExpressionTextEvent {
  uint32_t typeId;
  int32_t noteId;
  uint32_t textLen;
  const TChar* text;
};

struct ChordEvent {
  int16_t root;
  int16_t bassNote;
  int16_t mask;
  uint16_t textLen;
  const TChar* text;
};

struct ScaleEvent {
  int16_t root;
  int16_t mask;
  uint16_t textLen;
  const TChar* text;
};

// MIDI the plug-in sends that has no event type of its own. controlNumber: 0-127 a controller,
// then the numbers below; value2 carries the second byte where one is needed.
struct LegacyMIDICCOutEvent {
  static constexpr uint8_t kAfterTouch = 128;
  static constexpr uint8_t kPitchBend = 129;  // value: low 7 bits, value2: high 7 bits
  static constexpr uint8_t kProgramChange = 130;
  static constexpr uint8_t kPolyPressure = 131;  // value: note, value2: pressure
  uint8_t controlNumber;
  int8_t channel;
  int8_t value;
  int8_t value2;
};

struct Event {
  enum Type : uint16_t {
    kNoteOnEvent = 0,
    kNoteOffEvent = 1,
    kDataEvent = 2,
    kPolyPressureEvent = 3,
    kNoteExpressionValueEvent = 4,
    kNoteExpressionTextEvent = 5,
    kChordEvent = 6,
    kScaleEvent = 7,
    kLegacyMIDICCOutEvent = 65535,
  };
  static constexpr uint16_t kIsLive = 1;

  int32_t busIndex;
  int32_t sampleOffset;
  double ppqPosition;
  uint16_t flags;
  uint16_t type;
  union {
    NoteOnEvent noteOn;
    NoteOffEvent noteOff;
    DataEvent data;
    PolyPressureEvent polyPressure;
    NoteExpressionValueEvent noteExpressionValue;
    NoteExpressionTextEvent noteExpressionText;
    ChordEvent chord;
    ScaleEvent scale;
    LegacyMIDICCOutEvent midiCCOut;
  };
};

class IEventList : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x3A2C4214, 0x346349FE, 0xB2C4F397, 0xB9695A44);
  virtual int32_t GetEventCount() = 0;
  virtual TResult GetEvent(int32_t index, Event& event) = 0;
  virtual TResult AddEvent(Event& event) = 0;

protected:
  ~IEventList() = default;
};

// ---- parameter changes of one block
class IParamValueQueue : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x01263A18, 0xED074F6F, 0x98C9D356, 0x4686F9BA);
  virtual ParamID GetParameterId() = 0;
  virtual int32_t GetPointCount() = 0;
  virtual TResult GetPoint(int32_t index, int32_t& sampleOffset, ParamValue& value) = 0;
  virtual TResult AddPoint(int32_t sampleOffset, ParamValue value, int32_t& index) = 0;

protected:
  ~IParamValueQueue() = default;
};

class IParameterChanges : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0xA4779663, 0x0BB64A56, 0xB44384A8, 0x466FEB9D);
  virtual int32_t GetParameterCount() = 0;
  virtual IParamValueQueue* GetParameterData(int32_t index) = 0;
  virtual IParamValueQueue* AddParameterData(const ParamID& id, int32_t& index) = 0;

protected:
  ~IParameterChanges() = default;
};

struct ProcessData {
  int32_t processMode;
  int32_t symbolicSampleSize;
  int32_t numSamples;
  int32_t numInputs;
  int32_t numOutputs;
  AudioBusBuffers* inputs;
  AudioBusBuffers* outputs;
  IParameterChanges* inputParameterChanges;
  IParameterChanges* outputParameterChanges;
  IEventList* inputEvents;
  IEventList* outputEvents;
  ProcessContext* processContext;
};

static_assert(sizeof(BusInfo) == 276);
static_assert(sizeof(RoutingInfo) == 12);
static_assert(sizeof(ProcessSetup) == 24);
static_assert(sizeof(AudioBusBuffers) == 24);
static_assert(sizeof(ProcessContext) == 112);
static_assert(sizeof(NoteOnEvent) == 20 && sizeof(NoteOffEvent) == 16 && sizeof(DataEvent) == 16);
static_assert(sizeof(PolyPressureEvent) == 12 && sizeof(ChordEvent) == 16 && sizeof(ScaleEvent) == 16);
static_assert(sizeof(NoteExpressionValueEvent) == 16 && sizeof(NoteExpressionTextEvent) == 24);
static_assert(sizeof(LegacyMIDICCOutEvent) == 4);
static_assert(sizeof(Event) == 48);
static_assert(sizeof(ProcessData) == 80);

// ---- the processor's interfaces
class IComponent : public IPluginBase {
public:
  static constexpr KUID kIID = KUID::FromWords(0xE831FF31, 0xF2D54301, 0x928EBBEE, 0x25697802);
  virtual TResult GetControllerClassId(char* classId) = 0;
  virtual TResult SetIoMode(int32_t mode) = 0;
  virtual int32_t GetBusCount(int32_t type, int32_t direction) = 0;
  virtual TResult GetBusInfo(int32_t type, int32_t direction, int32_t index, BusInfo& info) = 0;
  virtual TResult GetRoutingInfo(RoutingInfo& input, RoutingInfo& output) = 0;
  virtual TResult ActivateBus(int32_t type, int32_t direction, int32_t index, TBool state) = 0;
  virtual TResult SetActive(TBool state) = 0;
  virtual TResult SetState(IBStream* state) = 0;
  virtual TResult GetState(IBStream* state) = 0;

protected:
  ~IComponent() = default;
};

class IAudioProcessor : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x42043F99, 0xB7DA453C, 0xA569E79D, 0x9AAEC33D);
  static constexpr uint32_t kNoTail = 0;
  static constexpr uint32_t kInfiniteTail = 0xFFFFFFFFu;
  virtual TResult SetBusArrangements(SpeakerArrangement* inputs, int32_t inputCount, SpeakerArrangement* outputs,
                                     int32_t outputCount) = 0;
  virtual TResult GetBusArrangement(int32_t direction, int32_t index, SpeakerArrangement& arrangement) = 0;
  virtual TResult CanProcessSampleSize(int32_t symbolicSampleSize) = 0;
  virtual uint32_t GetLatencySamples() = 0;
  virtual TResult SetupProcessing(ProcessSetup& setup) = 0;
  virtual TResult SetProcessing(TBool state) = 0;
  virtual TResult Process(ProcessData& data) = 0;
  virtual uint32_t GetTailSamples() = 0;

protected:
  ~IAudioProcessor() = default;
};

// Which parts of the process context the plug-in reads.
class IProcessContextRequirements : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x2A654303, 0xEF764E3D, 0x95B5FE83, 0x730EF6D0);
  enum Flags : uint32_t {
    kNeedSystemTime = 1u << 0,
    kNeedContinousTimeSamples = 1u << 1,
    kNeedProjectTimeMusic = 1u << 2,
    kNeedBarPositionMusic = 1u << 3,
    kNeedCycleMusic = 1u << 4,
    kNeedSamplesToNextClock = 1u << 5,
    kNeedTempo = 1u << 6,
    kNeedTimeSignature = 1u << 7,
    kNeedChord = 1u << 8,
    kNeedFrameRate = 1u << 9,
    kNeedTransportState = 1u << 10,
  };
  virtual uint32_t GetProcessContextRequirements() = 0;

protected:
  ~IProcessContextRequirements() = default;
};

}  // namespace KVST3
