// The file an AAX host loads for one plug-in: it holds no plug-in code. Its ACF entry points
// open the kernel library that sits beside it in the bundle (never one found through the
// system's search path, so that every bundle runs its own copy) and forward to the kernel's
// entries of the same names; the kernel tells from its own place which plug-in it is.

#include <cstdint>
#include <cstdio>
#include <mutex>
#include <string>

#include "kernel/KExport.h"
#include "kernel/platform/KPlatformLibrary.h"


namespace {
using ACFResult = int32_t;
constexpr ACFResult kACFFail = static_cast<int32_t>(0x80004005u);
#if defined(_WIN32)
constexpr const char* kKernelFile = "torvane.dll";
#else
constexpr const char* kKernelFile = "libtorvane.so";
#endif

// An object of the loader itself: its address names the loader's file.
const char kAnchor = 0;
std::mutex gLock;
void* gKernel = nullptr;

// The kernel's entry `name`, opening the kernel on first use; null when it cannot be loaded
// (the reason goes to the standard error stream: there is no kernel to report it).
void* Entry(const char* name) noexcept {
  std::lock_guard<std::mutex> lock(gLock);
  try {
    if (!gKernel) {
      const std::string loader = KPlatform::LibraryPathOf(&kAnchor);
      const size_t slash = loader.find_last_of("/\\");
      if (slash == std::string::npos) return nullptr;
      const std::string path = loader.substr(0, slash + 1) + kKernelFile;
      gKernel = KPlatform::OpenLibrary(path);
      if (!gKernel) std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
    }
  } catch (...) {
    return nullptr;  // out of memory while building the path
  }
  return gKernel ? KPlatform::FindSymbol(gKernel, name) : nullptr;
}

template <class... Arguments>
ACFResult Forward(const char* name, Arguments... arguments) noexcept {
  auto* entry = reinterpret_cast<ACFResult (*)(Arguments...)>(Entry(name));
  return entry ? entry(arguments...) : kACFFail;
}
}  // namespace

TORVANE_LOADER_EXPORT ACFResult ACFStartup(void* host) { return Forward("ACFStartup", host); }
TORVANE_LOADER_EXPORT ACFResult ACFRegisterPlugin(void* host, void** definition) { return Forward("ACFRegisterPlugin", host, definition); }
TORVANE_LOADER_EXPORT ACFResult ACFRegisterComponent(void* host, uint32_t index, void** component) {
  return Forward("ACFRegisterComponent", host, index, component);
}
TORVANE_LOADER_EXPORT ACFResult ACFGetClassFactory(void* host, const void* classId, const void* interfaceId, void** factory) {
  return Forward("ACFGetClassFactory", host, classId, interfaceId, factory);
}
TORVANE_LOADER_EXPORT ACFResult ACFCanUnloadNow(void* host) { return Forward("ACFCanUnloadNow", host); }
TORVANE_LOADER_EXPORT ACFResult ACFGetSDKVersion(uint64_t* version) { return Forward("ACFGetSDKVersion", version); }

// The host's last call: the kernel shuts down and is closed once it agrees to be unloaded.
TORVANE_LOADER_EXPORT ACFResult ACFShutdown(void* host) {
  const ACFResult result = Forward("ACFShutdown", host);
  std::lock_guard<std::mutex> lock(gLock);
  if (gKernel) {
    auto* canUnload = reinterpret_cast<ACFResult (*)(void*)>(KPlatform::FindSymbol(gKernel, "ACFCanUnloadNow"));
    if (canUnload && canUnload(host) == 0) {
      KPlatform::CloseLibrary(gKernel);
      gKernel = nullptr;
    }
  }
  return result;
}
