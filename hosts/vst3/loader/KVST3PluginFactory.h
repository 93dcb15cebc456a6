#pragma once

#include <atomic>
#include <mutex>

#include "hosts/vst3/KVST3Factory.h"
#include "hosts/vst3/loader/KVST3KernelLibrary.h"

namespace KVST3 {

// The factory of one plug-in's module: one class of category "Audio Module Class", described
// by the kernel library of the bundle (name, vendor, sub-categories, version and the class
// identifier of KVST3ClassId.h), which also makes its instances. Lives as long as the module;
// the host's references are counted only to let go of the host context when the last one goes.
class KPluginFactory final : public IPluginFactory3 {
public:
  static constexpr const char* kSdkVersion = "VST 3.7.0";

  explicit KPluginFactory(KKernelLibrary& kernel) noexcept : kernel_(kernel) {}

  // Asks the kernel for the description once; false while it cannot be had.
  bool Describe() noexcept;

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
  std::mutex describing_;
  std::atomic<bool> described_{false};
  KClassDescription description_{};
  KKernelLibrary& kernel_;
  std::atomic<uint32_t> references_{0};
  FUnknown* hostContext_ = nullptr;
};

}  // namespace KVST3
