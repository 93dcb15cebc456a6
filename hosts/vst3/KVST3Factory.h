#pragma once

// The factory a module hands its host, and the records that describe the module's classes.

#include "hosts/vst3/KVST3Base.h"

namespace KVST3 {

struct PFactoryInfo {
  static constexpr int32_t kUnicode = 16;  // the factory answers PClassInfoW
  char vendor[64];
  char url[256];
  char email[128];
  int32_t flags;
};

struct PClassInfo {
  static constexpr int32_t kManyInstances = 0x7FFFFFFF;
  char cid[16];
  int32_t cardinality;
  char category[32];
  char name[64];
};

struct PClassInfo2 {
  char cid[16];
  int32_t cardinality;
  char category[32];
  char name[64];
  uint32_t classFlags;
  char subCategories[128];
  char vendor[64];
  char version[64];
  char sdkVersion[64];
};

struct PClassInfoW {
  char cid[16];
  int32_t cardinality;
  char category[32];
  char16_t name[64];
  uint32_t classFlags;
  char subCategories[128];
  char16_t vendor[64];
  char16_t version[64];
  char16_t sdkVersion[64];
};

static_assert(sizeof(PFactoryInfo) == 452);
static_assert(sizeof(PClassInfo) == 116);
static_assert(sizeof(PClassInfo2) == 440);
static_assert(sizeof(PClassInfoW) == 696);

// The category of audio processors (effects and instruments alike).
inline constexpr const char* kAudioModuleClass = "Audio Module Class";

class IPluginFactory : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x7A4D811C, 0x52114A1F, 0xAED9D2EE, 0x0B43BF9F);
  virtual TResult GetFactoryInfo(PFactoryInfo* info) = 0;
  virtual int32_t CountClasses() = 0;
  virtual TResult GetClassInfo(int32_t index, PClassInfo* info) = 0;
  virtual TResult CreateInstance(FIDString classId, FIDString iid, void** object) = 0;

protected:
  ~IPluginFactory() = default;
};

class IPluginFactory2 : public IPluginFactory {
public:
  static constexpr KUID kIID = KUID::FromWords(0x0007B650, 0xF24B4C0B, 0xA464EDB9, 0xF00B2ABB);
  virtual TResult GetClassInfo2(int32_t index, PClassInfo2* info) = 0;

protected:
  ~IPluginFactory2() = default;
};

class IPluginFactory3 : public IPluginFactory2 {
public:
  static constexpr KUID kIID = KUID::FromWords(0x4555A2AB, 0xC1234E57, 0x9B122910, 0x36878931);
  virtual TResult GetClassInfoUnicode(int32_t index, PClassInfoW* info) = 0;
  virtual TResult SetHostContext(FUnknown* context) = 0;

protected:
  ~IPluginFactory3() = default;
};

// The module's exports on Linux, resolved by name: ModuleEntry receives the handle the host
// loaded the module with, and both answer whether they succeeded.
using GetPluginFactoryFunction = IPluginFactory* (*)();
using ModuleEntryFunction = bool (*)(void* libraryHandle);
using ModuleExitFunction = bool (*)();

}  // namespace KVST3
