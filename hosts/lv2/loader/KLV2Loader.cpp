// The file a host loads for one plug-in and for its UI: holds no plug-in code. It opens the
// kernel library beside it in the bundle (its own copy, never one found on the system's search
// path) and asks it for the descriptors of the plug-in the bundle is named after: the loader's
// file name without ".so". The UI shares the plug-in's kernel, which its instance-access needs.

#include <cstdio>
#include <mutex>
#include <string>

#include "hosts/lv2/KLV2Dispatch.h"
#include "hosts/lv2/KLV2UI.h"
#include "kernel/platform/KPlatformLibrary.h"

namespace {
constexpr const char* kKernelFile = "libtorvane.so";
// An object of the loader itself: its address names the loader's file.
const char kAnchor = 0;

class KKernel {
public:
  ~KKernel() { KPlatform::CloseLibrary(library_); }

  // Opened on the first call, for as long as the loader stays loaded.
  const LV2_Descriptor* Descriptor() noexcept {
    std::lock_guard<std::mutex> lock(mutex_);
    if (!opened_) Open();
    return descriptor_;
  }
  const LV2UI_Descriptor* UIDescriptor() noexcept {
    std::lock_guard<std::mutex> lock(mutex_);
    if (!opened_) Open();
    return uiDescriptor_;
  }

private:
  void Open() noexcept {
    opened_ = true;
    try {
      const std::string loader = KPlatform::LibraryPathOf(&kAnchor);
      const size_t slash = loader.rfind('/');
      const size_t dot = loader.rfind(".so");
      if (slash == std::string::npos || dot == std::string::npos || dot < slash) return;
      const std::string path = loader.substr(0, slash + 1) + kKernelFile;
      library_ = KPlatform::OpenLibrary(path);
      auto dispatch = reinterpret_cast<KLV2::DispatchFunction>(library_ ? KPlatform::FindSymbol(library_, KLV2::kDispatchName) : nullptr);
      if (!dispatch) {
        std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
        return;
      }
      const std::string name = loader.substr(slash + 1, dot - slash - 1);
      descriptor_ = dispatch(name.c_str());
      if (!descriptor_) std::fprintf(stderr, "Torvane: the kernel %s holds no plug-in named %s\n", path.c_str(), name.c_str());
      if (auto ui = reinterpret_cast<KLV2::UIDispatchFunction>(KPlatform::FindSymbol(library_, KLV2::kUIDispatchName)))
        uiDescriptor_ = ui(name.c_str());
    } catch (...) {
      descriptor_ = nullptr;  // out of memory while building a path
    }
  }

  std::mutex mutex_;
  bool opened_ = false;
  void* library_ = nullptr;
  const LV2_Descriptor* descriptor_ = nullptr;
  const LV2UI_Descriptor* uiDescriptor_ = nullptr;
};

KKernel gKernel;
}  // namespace

// One plug-in per bundle, at index 0.
extern "C" __attribute__((visibility("default"))) const LV2_Descriptor* lv2_descriptor(uint32_t index) {
  return index == 0 ? gKernel.Descriptor() : nullptr;
}

// The plug-in's UI, at index 0.
extern "C" __attribute__((visibility("default"))) const LV2UI_Descriptor* lv2ui_descriptor(uint32_t index) {
  return index == 0 ? gKernel.UIDescriptor() : nullptr;
}
