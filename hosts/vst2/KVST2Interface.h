#pragma once
// The VST 2.4 binary interface as hosts and plug-ins exchange it: records, opcodes and flags,
// declared from the published facts of the format (no SDK is used). Only what the adapter, the
// loader and the test hosts need. Sizes and offsets are those of a 64-bit Linux build and are
// checked below: a host reads these records by offset.

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace KVST2 {

struct AEffect;

using HostCallback = intptr_t (*)(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt);
using DispatcherFunction = intptr_t (*)(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt);
using ProcessFunction = void (*)(AEffect* effect, float** inputs, float** outputs, int32_t sampleFrames);
using ProcessDoubleFunction = void (*)(AEffect* effect, double** inputs, double** outputs, int32_t sampleFrames);
using SetParameterFunction = void (*)(AEffect* effect, int32_t index, float value);
using GetParameterFunction = float (*)(AEffect* effect, int32_t index);
// A module's entry ("VSTPluginMain", and "main" for older hosts).
using MainFunction = AEffect* (*)(HostCallback host);

// "VstP" as a big-endian 32-bit code.
inline constexpr int32_t kEffectMagic = 0x56737450;
inline constexpr int32_t kVstVersion = 2400;

// Four characters as a unique id, the first in the highest byte.
constexpr int32_t FourCharacters(std::string_view text) {
  uint32_t id = 0;
  for (size_t i = 0; i < 4 && i < text.size(); ++i) id = id << 8 | static_cast<uint8_t>(text[i]);
  return static_cast<int32_t>(id);
}

struct AEffect {
  int32_t magic;
  DispatcherFunction dispatcher;
  ProcessFunction process;  // the accumulating call of old hosts; unused
  SetParameterFunction setParameter;
  GetParameterFunction getParameter;
  int32_t numPrograms;
  int32_t numParams;
  int32_t numInputs;
  int32_t numOutputs;
  int32_t flags;
  intptr_t reserved1;
  intptr_t reserved2;
  int32_t initialDelay;
  int32_t realQualities;
  int32_t offQualities;
  float ioRatio;
  void* object;  // the plug-in's own object
  void* user;    // the host's
  int32_t uniqueID;
  int32_t version;
  ProcessFunction processReplacing;
  ProcessDoubleFunction processDoubleReplacing;
  char future[56];
};

// AEffect::flags
inline constexpr int32_t effFlagsHasEditor = 1 << 0;
inline constexpr int32_t effFlagsCanReplacing = 1 << 4;
inline constexpr int32_t effFlagsProgramChunks = 1 << 5;
inline constexpr int32_t effFlagsIsSynth = 1 << 8;
inline constexpr int32_t effFlagsNoSoundInStop = 1 << 9;
inline constexpr int32_t effFlagsCanDoubleReplacing = 1 << 12;

// Host to plug-in, through AEffect::dispatcher.
enum EffectOpcode : int32_t {
  effOpen = 0,
  effClose = 1,
  effSetProgram = 2,
  effGetProgram = 3,
  effSetProgramName = 4,
  effGetProgramName = 5,
  effGetParamLabel = 6,
  effGetParamDisplay = 7,
  effGetParamName = 8,
  effSetSampleRate = 10,
  effSetBlockSize = 11,
  effMainsChanged = 12,
  effEditGetRect = 13,
  effEditOpen = 14,
  effEditClose = 15,
  effEditIdle = 19,
  effGetChunk = 23,
  effSetChunk = 24,
  effProcessEvents = 25,
  effCanBeAutomated = 26,
  effString2Parameter = 27,
  effGetProgramNameIndexed = 29,
  effGetInputProperties = 33,
  effGetOutputProperties = 34,
  effGetPlugCategory = 35,
  effSetSpeakerArrangement = 42,
  effSetBypass = 44,
  effGetEffectName = 45,
  effGetVendorString = 47,
  effGetProductString = 48,
  effGetVendorVersion = 49,
  effCanDo = 51,
  effGetTailSize = 52,
  effIdle = 53,
  effGetVstVersion = 58,
  effEditKeyDown = 59,
  effEditKeyUp = 60,
  effGetSpeakerArrangement = 69,
  effStartProcess = 71,
  effStopProcess = 72,
  effSetProcessPrecision = 77,
};

// Plug-in to host, through the host callback.
enum HostOpcode : int32_t {
  audioMasterAutomate = 0,
  audioMasterVersion = 1,
  audioMasterCurrentId = 2,
  audioMasterIdle = 3,
  audioMasterGetTime = 7,
  audioMasterProcessEvents = 8,
  audioMasterIOChanged = 13,
  audioMasterSizeWindow = 15,
  audioMasterGetSampleRate = 16,
  audioMasterGetBlockSize = 17,
  audioMasterGetCurrentProcessLevel = 23,
  audioMasterGetVendorString = 32,
  audioMasterGetProductString = 33,
  audioMasterGetVendorVersion = 34,
  audioMasterCanDo = 37,
  audioMasterUpdateDisplay = 42,
  audioMasterBeginEdit = 43,
  audioMasterEndEdit = 44,
};

// Keys the host passes on to the editor (effEditKeyDown / effEditKeyUp: `index` the character,
// `value` the virtual key, `opt` the modifiers).
enum VstVirtualKey : int32_t {
  VKEY_BACK = 1,
  VKEY_TAB = 2,
  VKEY_RETURN = 4,
  VKEY_ESCAPE = 6,
  VKEY_SPACE = 7,
  VKEY_END = 9,
  VKEY_HOME = 10,
  VKEY_LEFT = 11,
  VKEY_UP = 12,
  VKEY_RIGHT = 13,
  VKEY_DOWN = 14,
  VKEY_ENTER = 19,
  VKEY_DELETE = 22,
  VKEY_F1 = 40,
};
// MODIFIER_COMMAND is the control key outside macOS, MODIFIER_CONTROL the control key on macOS.
enum VstModifierKey : int32_t {
  MODIFIER_SHIFT = 1 << 0,
  MODIFIER_ALTERNATE = 1 << 1,
  MODIFIER_COMMAND = 1 << 2,
  MODIFIER_CONTROL = 1 << 3,
};

// Texts the host's buffers hold, terminator included.
inline constexpr int32_t kVstMaxProgNameLen = 24;
inline constexpr int32_t kVstMaxParamStrLen = 8;
inline constexpr int32_t kVstMaxEffectNameLen = 32;
inline constexpr int32_t kVstMaxVendorStrLen = 64;
inline constexpr int32_t kVstMaxProductStrLen = 64;
inline constexpr int32_t kVstMaxLabelLen = 64;
inline constexpr int32_t kVstMaxShortLabelLen = 8;

// effGetPlugCategory answers.
inline constexpr intptr_t kPlugCategUnknown = 0;
inline constexpr intptr_t kPlugCategEffect = 1;
inline constexpr intptr_t kPlugCategSynth = 2;

// audioMasterGetCurrentProcessLevel answers.
enum ProcessLevel : int32_t {
  kVstProcessLevelUnknown = 0,
  kVstProcessLevelUser = 1,
  kVstProcessLevelRealtime = 2,
  kVstProcessLevelPrefetch = 3,
  kVstProcessLevelOffline = 4,
};

// ---- events

inline constexpr int32_t kVstMidiType = 1;
inline constexpr int32_t kVstSysExType = 6;

struct VstEvent {
  int32_t type;
  int32_t byteSize;  // of the whole event minus the two fields above
  int32_t deltaFrames;
  int32_t flags;
  char data[16];
};

struct VstMidiEvent {
  int32_t type;
  int32_t byteSize;
  int32_t deltaFrames;
  int32_t flags;
  int32_t noteLength;
  int32_t noteOffset;
  char midiData[4];
  char detune;
  char noteOffVelocity;
  char reserved1;
  char reserved2;
};

struct VstMidiSysexEvent {
  int32_t type;
  int32_t byteSize;
  int32_t deltaFrames;
  int32_t flags;
  int32_t dumpBytes;
  intptr_t reserved1;
  char* sysexDump;
  intptr_t reserved2;
};

// A host's or plug-in's block of events: numEvents pointers follow from `events` on (the record
// is made larger than declared when there are more than two).
struct VstEvents {
  int32_t numEvents;
  intptr_t reserved;
  VstEvent* events[2];
};

// ---- time

struct VstTimeInfo {
  double samplePos;
  double sampleRate;
  double nanoSeconds;
  double ppqPos;
  double tempo;
  double barStartPos;
  double cycleStartPos;
  double cycleEndPos;
  int32_t timeSigNumerator;
  int32_t timeSigDenominator;
  int32_t smpteOffset;
  int32_t smpteFrameRate;
  int32_t samplesToNextClock;
  int32_t flags;
};

// VstTimeInfo::flags, and the filter passed with audioMasterGetTime.
enum TimeInfoFlags : int32_t {
  kVstTransportChanged = 1 << 0,
  kVstTransportPlaying = 1 << 1,
  kVstTransportCycleActive = 1 << 2,
  kVstTransportRecording = 1 << 3,
  kVstAutomationWriting = 1 << 6,
  kVstAutomationReading = 1 << 7,
  kVstNanosValid = 1 << 8,
  kVstPpqPosValid = 1 << 9,
  kVstTempoValid = 1 << 10,
  kVstBarsValid = 1 << 11,
  kVstCyclePosValid = 1 << 12,
  kVstTimeSigValid = 1 << 13,
  kVstSmpteValid = 1 << 14,
  kVstClockValid = 1 << 15,
};

// ---- pins and speakers

inline constexpr int32_t kVstPinIsActive = 1 << 0;
inline constexpr int32_t kVstPinIsStereo = 1 << 1;
inline constexpr int32_t kVstPinUseSpeaker = 1 << 2;

struct VstPinProperties {
  char label[kVstMaxLabelLen];
  int32_t flags;
  int32_t arrangementType;
  char shortLabel[kVstMaxShortLabelLen];
  char future[48];
};

enum SpeakerArrangementType : int32_t {
  kSpeakerArrUserDefined = -2,
  kSpeakerArrEmpty = -1,
  kSpeakerArrMono = 0,
  kSpeakerArrStereo = 1,
};

struct VstSpeakerProperties {
  float azimuth;
  float elevation;
  float radius;
  float reserved;
  char name[64];
  int32_t type;
  char future[28];
};

// As declared: a host passes one with room for as many speakers as it has channels.
struct VstSpeakerArrangement {
  int32_t type;
  int32_t numChannels;
  VstSpeakerProperties speakers[8];
};

// The editor's rectangle.
struct ERect {
  int16_t top;
  int16_t left;
  int16_t bottom;
  int16_t right;
};

// ---- what a host reads by offset
static_assert(sizeof(void*) == 8, "the declarations are those of a 64-bit build");
static_assert(offsetof(AEffect, magic) == 0 && offsetof(AEffect, dispatcher) == 8 && offsetof(AEffect, process) == 16);
static_assert(offsetof(AEffect, setParameter) == 24 && offsetof(AEffect, getParameter) == 32 && offsetof(AEffect, numPrograms) == 40);
static_assert(offsetof(AEffect, numParams) == 44 && offsetof(AEffect, numInputs) == 48 && offsetof(AEffect, numOutputs) == 52);
static_assert(offsetof(AEffect, flags) == 56 && offsetof(AEffect, reserved1) == 64 && offsetof(AEffect, reserved2) == 72);
static_assert(offsetof(AEffect, initialDelay) == 80 && offsetof(AEffect, realQualities) == 84 && offsetof(AEffect, offQualities) == 88);
static_assert(offsetof(AEffect, ioRatio) == 92 && offsetof(AEffect, object) == 96 && offsetof(AEffect, user) == 104);
static_assert(offsetof(AEffect, uniqueID) == 112 && offsetof(AEffect, version) == 116 && offsetof(AEffect, processReplacing) == 120);
static_assert(offsetof(AEffect, processDoubleReplacing) == 128 && offsetof(AEffect, future) == 136 && sizeof(AEffect) == 192);
static_assert(sizeof(VstEvent) == 32 && offsetof(VstEvent, deltaFrames) == 8 && offsetof(VstEvent, data) == 16);
static_assert(sizeof(VstMidiEvent) == 32 && offsetof(VstMidiEvent, noteLength) == 16 && offsetof(VstMidiEvent, noteOffset) == 20);
static_assert(offsetof(VstMidiEvent, midiData) == 24 && offsetof(VstMidiEvent, detune) == 28 && offsetof(VstMidiEvent, reserved2) == 31);
static_assert(sizeof(VstMidiSysexEvent) == 48 && offsetof(VstMidiSysexEvent, dumpBytes) == 16 && offsetof(VstMidiSysexEvent, sysexDump) == 32);
static_assert(sizeof(VstEvents) == 32 && offsetof(VstEvents, reserved) == 8 && offsetof(VstEvents, events) == 16);
static_assert(sizeof(VstTimeInfo) == 88 && offsetof(VstTimeInfo, ppqPos) == 24 && offsetof(VstTimeInfo, barStartPos) == 40);
static_assert(offsetof(VstTimeInfo, cycleEndPos) == 56 && offsetof(VstTimeInfo, timeSigNumerator) == 64 && offsetof(VstTimeInfo, flags) == 84);
static_assert(sizeof(VstPinProperties) == 128 && offsetof(VstPinProperties, flags) == 64 && offsetof(VstPinProperties, shortLabel) == 72);
static_assert(sizeof(VstSpeakerProperties) == 112 && offsetof(VstSpeakerProperties, name) == 16 && offsetof(VstSpeakerProperties, type) == 80);
static_assert(sizeof(VstSpeakerArrangement) == 904 && offsetof(VstSpeakerArrangement, speakers) == 8);
static_assert(sizeof(ERect) == 8 && offsetof(ERect, right) == 6);
static_assert(kVstTransportChanged + kVstTransportPlaying + kVstTransportCycleActive + kVstAutomationWriting + kVstAutomationReading + kVstPpqPosValid +
                  kVstTempoValid + kVstBarsValid + kVstCyclePosValid + kVstTimeSigValid ==
              0x3EC7);

}  // namespace KVST2
