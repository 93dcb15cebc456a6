#pragma once

#include <atomic>

#include "hosts/vst3/KVST3Factory.h"
#include "hosts/vst3/loader/KVST3KernelLibrary.h"

namespace KVST3 {

// What a loader tells its host about its one plug-in.
struct KPluginDescription {
  const char* key;            // the registry key, e.g. "KCompressorPlugin"
  const char* name;           // the name hosts list, e.g. "Compressor"
  const char* subCategories;  // e.g. "Fx|Dynamics"
  const char* version;        // the project's version
};

// The factory of one plug-in's module: one class, vendor "Torvane", category "Audio Module
// Class", its class identifier derived from the key (KVST3ClassId.h). Instances come from the
// kernel library of the bundle. Lives as long as the module; the host's references are counted
// only to let go of the host context when the last one goes.
class KPluginFactory final : public IPluginFactory3 {
public:
  static constexpr const char* kVendor = "Torvane";
  static constexpr const char* kSdkVersion = "VST 3.7.0";

  KPluginFactory(const KPluginDescription& description, KKernelLibrary& kernel) noexcept;

  TResult QueryInterface(const char* iid, void** object) override;
  uint32_t AddRef() override;
  uint32_t Release() override;
  TResult GetFactoryInfo(PFactoryInfo* info) override;
  int32_t CountClasses() override;
  TResult GetClassInfo(int32_t index, PClassInfo* info) override;
  TResult CreateInstance(FIDString classId, FIDString iid, void** object) override;
  TResult GetClassInfo2(int32_t index, PClassInfo2* info) override;
  TResult GetClassInfoUnicode(int32_t index, PClassInfoW* info) override;
  TResult SetHostContext(FUnknown* context) override;

private:
  KPluginDescription description_;
  KUID classId_;
  KKernelLibrary& kernel_;
  std::atomic<uint32_t> references_{0};
  FUnknown* hostContext_ = nullptr;
};

}  // namespace KVST3
