// The file a host loads for one plug-in: a Linux VST 2 module that holds no plug-in code. It
// finds the kernel library beside itself and asks it for instances. The build names the
// plug-in: TORVANE_VST2_KEY (its registry key), TORVANE_VST2_ID (its four-character unique id)
// and TORVANE_VST2_KERNEL (the kernel's file name).

#include <cstdio>
#include <string>

#include "hosts/vst2/KVST2Dispatch.h"
#include "kernel/platform/KPlatformLibrary.h"

#define KVST2_LOADER_EXPORT extern "C" __attribute__((visibility("default")))

namespace {
// An object of the loader itself: its address names the loader's file.
const char kAnchor = 0;

// The kernel's entry, found once; the kernel stays loaded for the life of the process, since
// the instances it made may outlive this module's own reference.
KVST2::DispatchFunction Dispatch() noexcept {
  static const KVST2::DispatchFunction dispatch = []() noexcept -> KVST2::DispatchFunction {
    try {
      const std::string loader = KPlatform::LibraryPathOf(&kAnchor);
      const size_t slash = loader.rfind('/');
      if (slash == std::string::npos) return nullptr;
      const std::string path = loader.substr(0, slash + 1) + TORVANE_VST2_KERNEL;
      void* kernel = KPlatform::OpenLibrary(path);
      void* found = kernel ? KPlatform::FindSymbol(kernel, KVST2::kDispatchName) : nullptr;
      if (!found) std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
      return reinterpret_cast<KVST2::DispatchFunction>(found);
    } catch (...) {
      return nullptr;  // out of memory while building the path
    }
  }();
  return dispatch;
}
}  // namespace

KVST2_LOADER_EXPORT KVST2::AEffect* VSTPluginMain(KVST2::HostCallback host) {
  const KVST2::DispatchFunction dispatch = Dispatch();
  return dispatch ? dispatch(TORVANE_VST2_KEY, "", static_cast<uint32_t>(KVST2::FourCharacters(TORVANE_VST2_ID)), host) : nullptr;
}

// The entry's older name, which some hosts still look for first.
KVST2_LOADER_EXPORT KVST2::AEffect* KVST2LegacyMain(KVST2::HostCallback host) __asm__("main");
KVST2::AEffect* KVST2LegacyMain(KVST2::HostCallback host) { return VSTPluginMain(host); }
