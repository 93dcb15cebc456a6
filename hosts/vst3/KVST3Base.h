#pragma once

// Our declarations of the VST 3 interfaces, written from the interface's published facts: the
// interface identifiers, the order of each vtable, the argument types and the record layouts.
// Linux and macOS conventions: the compiler's default calling convention, natural alignment,
// result codes of the non-COM family and identifiers stored as four big-endian 32-bit words. On
// Windows the interface is COM's: result codes are HRESULTs and identifiers are GUIDs in memory
// (the first word and the two halves of the second little-endian, the rest as published); x64
// has one calling convention.
// Method names follow our own style; only the slot order counts across the boundary. Each
// interface has a protected destructor: it adds no slot, and nobody deletes through it.

#include <cstdint>
#include <cstring>

namespace KVST3 {

using TResult = int32_t;
#if defined(_WIN32)
inline constexpr TResult kNoInterface = static_cast<TResult>(0x80004002);
inline constexpr TResult kResultOk = 0;
inline constexpr TResult kResultTrue = 0;
inline constexpr TResult kResultFalse = 1;
inline constexpr TResult kInvalidArgument = static_cast<TResult>(0x80070057);
inline constexpr TResult kNotImplemented = static_cast<TResult>(0x80004001);
inline constexpr TResult kInternalError = static_cast<TResult>(0x80004005);
inline constexpr TResult kNotInitialized = static_cast<TResult>(0x8000FFFF);
inline constexpr TResult kOutOfMemory = static_cast<TResult>(0x8007000E);
#else
inline constexpr TResult kNoInterface = -1;
inline constexpr TResult kResultOk = 0;
inline constexpr TResult kResultTrue = 0;
inline constexpr TResult kResultFalse = 1;
inline constexpr TResult kInvalidArgument = 2;
inline constexpr TResult kNotImplemented = 3;
inline constexpr TResult kInternalError = 4;
inline constexpr TResult kNotInitialized = 5;
inline constexpr TResult kOutOfMemory = 6;
#endif

using TBool = uint8_t;
using TChar = char16_t;
using String128 = TChar[128];
using FIDString = const char*;
// A class or interface identifier as it crosses the boundary: 16 bytes.
using TUID = char[16];

// An identifier as a value, built from the four words in which it is published.
struct KUID {
  char bytes[16];

  static constexpr KUID FromWords(uint32_t a, uint32_t b, uint32_t c, uint32_t d) noexcept {
    KUID id{};
    const uint32_t words[4] = {a, b, c, d};
    for (int w = 0; w < 4; ++w)
      for (int k = 0; k < 4; ++k) id.bytes[4 * w + k] = static_cast<char>((words[w] >> (24 - 8 * k)) & 0xFF);
#if defined(_WIN32)
    // A GUID's Data1 (4 bytes), Data2 and Data3 (2 bytes each) are little-endian.
    const auto swap = [&id](int i, int j) {
      const char t = id.bytes[i];
      id.bytes[i] = id.bytes[j];
      id.bytes[j] = t;
    };
    swap(0, 3);
    swap(1, 2);
    swap(4, 5);
    swap(6, 7);
#endif
    return id;
  }
  constexpr bool operator==(const KUID&) const noexcept = default;
  bool Is(const char* other) const noexcept { return other && std::memcmp(bytes, other, 16) == 0; }
  void CopyTo(char* out) const noexcept { std::memcpy(out, bytes, 16); }
};

// Slots 0-2 of every interface.
class FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x00000000, 0x00000000, 0xC0000000, 0x00000046);
  virtual TResult QueryInterface(const char* iid, void** object) = 0;
  virtual uint32_t AddRef() = 0;
  virtual uint32_t Release() = 0;

protected:
  ~FUnknown() = default;
};

class IPluginBase : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x22888DDB, 0x156E45AE, 0x8358B348, 0x08190625);
  virtual TResult Initialize(FUnknown* context) = 0;
  virtual TResult Terminate() = 0;

protected:
  ~IPluginBase() = default;
};

// A byte stream the host hands over for state.
class IBStream : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0xC3BF6EA2, 0x30994752, 0x9B6BF990, 0x1EE33E9B);
  enum SeekMode : int32_t { kSeekSet = 0, kSeekCur = 1, kSeekEnd = 2 };
  virtual TResult Read(void* buffer, int32_t byteCount, int32_t* bytesRead) = 0;
  virtual TResult Write(void* buffer, int32_t byteCount, int32_t* bytesWritten) = 0;
  virtual TResult Seek(int64_t position, int32_t mode, int64_t* result) = 0;
  virtual TResult Tell(int64_t* position) = 0;

protected:
  ~IBStream() = default;
};

// Typed values under text keys (the host's channel context, for one).
class IAttributeList : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x1E5F0AEB, 0xCC7F4533, 0xA2544011, 0x38AD5EE4);
  using AttrID = const char*;
  virtual TResult SetInt(AttrID id, int64_t value) = 0;
  virtual TResult GetInt(AttrID id, int64_t& value) = 0;
  virtual TResult SetFloat(AttrID id, double value) = 0;
  virtual TResult GetFloat(AttrID id, double& value) = 0;
  virtual TResult SetString(AttrID id, const TChar* text) = 0;
  virtual TResult GetString(AttrID id, TChar* text, uint32_t sizeInBytes) = 0;
  virtual TResult SetBinary(AttrID id, const void* data, uint32_t sizeInBytes) = 0;
  virtual TResult GetBinary(AttrID id, const void*& data, uint32_t& sizeInBytes) = 0;

protected:
  ~IAttributeList() = default;
};

// The host's own object, passed to initialize.
class IHostApplication : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x58E595CC, 0xDB2D4969, 0x8B6AAF8C, 0x36A664E5);
  virtual TResult GetName(String128 name) = 0;
  virtual TResult CreateInstance(char* classId, char* iid, void** object) = 0;

protected:
  ~IHostApplication() = default;
};

}  // namespace KVST3
