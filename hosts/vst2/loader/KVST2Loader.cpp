// The file a host loads for one plug-in: a Linux VST 2 module that holds no plug-in code. Every
// module is a copy of this one loader, named after its plug-in; it finds the kernel library
// beside it (TORVANE_VST2_KERNEL names its file), asks it which plug-in its own name stands for,
// and asks it for instances of that plug-in under the plug-in's unique id.

#include <cstdio>
#include <string>

#include "hosts/vst2/KVST2Dispatch.h"
#include "kernel/KExport.h"
#include "kernel/platform/KPlatformLibrary.h"


namespace {
// An object of the loader itself: its address names the loader's file.
const char kAnchor = 0;

struct KKernel {
  KVST2::DispatchFunction dispatch = nullptr;
  KVST2::KModuleDescription plugin{};
};

// The kernel's entry and this module's plug-in, found once; the kernel stays loaded for the life
// of the process, since the instances it made may outlive this module's own reference.
const KKernel& Kernel() noexcept {
  static const KKernel kernel = []() noexcept {
    KKernel found;
    try {
      const std::string loader = KPlatform::LibraryPathOf(&kAnchor);
      const size_t slash = loader.find_last_of("/\\"), dot = loader.rfind('.');
      if (slash == std::string::npos || dot == std::string::npos || dot < slash) return found;
      const std::string path = loader.substr(0, slash + 1) + TORVANE_VST2_KERNEL, name = loader.substr(slash + 1, dot - slash - 1);
      void* library = KPlatform::OpenLibrary(path);
      auto describe = reinterpret_cast<KVST2::DescribeFunction>(library ? KPlatform::FindSymbol(library, KVST2::kDescribeName) : nullptr);
      if (!describe) {
        std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
      } else if (!describe(name.c_str(), &found.plugin)) {
        std::fprintf(stderr, "Torvane: the kernel knows no plug-in of the module %s\n", name.c_str());
      } else {
        found.dispatch = reinterpret_cast<KVST2::DispatchFunction>(KPlatform::FindSymbol(library, KVST2::kDispatchName));
      }
    } catch (...) {
      // out of memory while building the path: no kernel
    }
    return found;
  }();
  return kernel;
}
}  // namespace

// Null when the kernel cannot be loaded or does not know this module's plug-in.
TORVANE_LOADER_EXPORT KVST2::AEffect* VSTPluginMain(KVST2::HostCallback host) {
  const KKernel& kernel = Kernel();
  return kernel.dispatch ? kernel.dispatch(kernel.plugin.key, "", static_cast<uint32_t>(kernel.plugin.uniqueId), host) : nullptr;
}

// The entry's older name, which some hosts still look for first.
TORVANE_LOADER_EXPORT KVST2::AEffect* KVST2LegacyMain(KVST2::HostCallback host) __asm__("main");
KVST2::AEffect* KVST2LegacyMain(KVST2::HostCallback host) { return VSTPluginMain(host); }
