#pragma once

#include <cstdint>

// The part of the AAX interface the adapter uses, declared from its public facts: result codes,
// four-character codes, the host objects a plug-in talks to and the MIDI packets of a processing
// call. Everything here is plain data or an abstract interface; the host owns its objects.
namespace KAAX {

// ---- results
using Result = int32_t;
constexpr Result kSuccess = 0;
constexpr Result kErrorInvalidParameterId = -20001;
constexpr Result kErrorInvalidStringConversion = -20002;
constexpr Result kErrorNullObject = -20004;
constexpr Result kErrorInvalidChunkId = -20007;
constexpr Result kErrorIncorrectChunkSize = -20008;
constexpr Result kErrorUnimplemented = -20009;
constexpr Result kErrorNotInitialized = -20011;

// The ACF library entry points answer COM-style results.
using ACFResult = int32_t;
constexpr ACFResult kACFOk = 0;
constexpr ACFResult kACFFalse = 1;
constexpr ACFResult kACFNotImplemented = static_cast<int32_t>(0x80004001u);
constexpr ACFResult kACFPointer = static_cast<int32_t>(0x80004003u);
constexpr ACFResult kACFFail = static_cast<int32_t>(0x80004005u);
constexpr ACFResult kACFUnexpected = static_cast<int32_t>(0x8000FFFFu);

// ---- four-character codes, big-endian: 'Torv' is 0x546F7276
constexpr uint32_t KFourCC(const char (&code)[5]) noexcept {
  return (static_cast<uint32_t>(static_cast<unsigned char>(code[0])) << 24) |
         (static_cast<uint32_t>(static_cast<unsigned char>(code[1])) << 16) |
         (static_cast<uint32_t>(static_cast<unsigned char>(code[2])) << 8) | static_cast<uint32_t>(static_cast<unsigned char>(code[3]));
}
using ChunkId = uint32_t;

// Parameters are known to the host by text identifiers.
using ParamId = const char*;
inline constexpr const char* kMasterBypassId = "MasterBypassID";

// ---- stem formats: the layout in the upper 16 bits, the channel count in the lower
constexpr uint32_t KStemFormat(int32_t layout, uint32_t channels) noexcept {
  return (static_cast<uint32_t>(layout) << 16) | (channels & 0xFFFFu);
}
constexpr uint32_t kStemFormatNone = KStemFormat(-100, 0);
constexpr uint32_t kStemFormatMono = KStemFormat(0, 1);
constexpr uint32_t kStemFormatStereo = KStemFormat(1, 2);

// ---- plug-in categories (bits)
constexpr uint32_t kCategoryEQ = 0x1;
constexpr uint32_t kCategoryDynamics = 0x2;
constexpr uint32_t kCategoryReverb = 0x8;
constexpr uint32_t kCategoryDelay = 0x10;
constexpr uint32_t kCategoryModulation = 0x20;
constexpr uint32_t kCategoryHarmonic = 0x40;
constexpr uint32_t kCategorySoundField = 0x200;
constexpr uint32_t kCategoryEffect = 0x2000;

// Transport positions are counted in ticks of 1/960000 quarter note.
constexpr double kTicksPerQuarter = 960000.0;

// ---- host objects
// The base of every ACF object (COM-like).
class IACFUnknown {
public:
  virtual ACFResult QueryInterface(const void* iid, void** object) = 0;
  virtual uint32_t AddRef() = 0;
  virtual uint32_t Release() = 0;

protected:
  ~IACFUnknown() = default;
};

// What the host tells an effect about its surroundings and accepts back from it.
class IController {
public:
  virtual Result GetSampleRate(double* sampleRate) const = 0;
  virtual Result SetSignalLatency(int32_t samples) = 0;

protected:
  ~IController() = default;
};

// Automation of a parameter on its way to the host: a touch opens a gesture, values follow,
// a release closes it.
class IAutomationDelegate {
public:
  virtual Result PostTouchRequest(ParamId id) = 0;
  virtual Result PostSetValueRequest(ParamId id, double normalized) = 0;
  virtual Result PostReleaseRequest(ParamId id) = 0;

protected:
  ~IAutomationDelegate() = default;
};

// The host's transport, asked during processing.
class ITransport {
public:
  virtual Result GetCurrentTempo(double* tempo) const = 0;
  virtual Result GetCurrentMeter(int32_t* numerator, int32_t* denominator) const = 0;
  virtual Result IsTransportPlaying(bool* playing) const = 0;
  virtual Result GetCurrentNativeSampleLocation(int64_t* samples) const = 0;
  virtual Result GetCurrentTickPosition(int64_t* ticks) const = 0;
  virtual Result GetBarStartTickPosition(int64_t* ticks) const = 0;
  virtual Result GetCurrentLoopPosition(bool* looping, int64_t* startTicks, int64_t* endTicks) const = 0;
  virtual Result IsOffline(bool* offline) const = 0;

protected:
  ~ITransport() = default;
};

// What kind of native window a view container holds. The published kinds name no Linux window;
// an X11 window id is our own kind, after them.
enum ViewContainerType : int32_t {
  kViewContainerNull = 0,
  kViewContainerNSView = 1,
  kViewContainerUIView = 2,
  kViewContainerHWND = 3,
  kViewContainerX11Window = 4,
};

// The frame the host gives an effect's GUI: its native window, and its size.
class IViewContainer {
public:
  virtual int32_t GetType() = 0;
  // The native window (an HWND for kViewContainerHWND, an X11 window id cast to a pointer for
  // kViewContainerX11Window).
  virtual void* GetPtr() = 0;
  virtual Result SetViewSize(int32_t width, int32_t height) = 0;

protected:
  ~IViewContainer() = default;
};

// ---- MIDI of one processing call
struct MidiPacket {
  uint32_t mTimestamp;  // samples from the start of the buffer
  uint32_t mLength;     // bytes used in mData
  uint8_t mData[4];
  bool mIsImmediate;
};

// A MIDI node's buffer: for input the packets the host delivers; for output the room the host
// gives (mCapacity packets), of which the plug-in fills mBufferSize.
struct MidiStream {
  uint32_t mBufferSize;
  uint32_t mCapacity;
  MidiPacket* mBuffer;
};

}  // namespace KAAX
