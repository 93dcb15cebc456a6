// The file a host loads for one plug-in: a VST 3 module that holds no plug-in code. Every bundle
// carries a copy of this one loader, named after the bundle; it finds the kernel library beside
// it, asks it which plug-in its bundle holds, and asks it for instances of that plug-in.

#include "hosts/vst3/loader/KVST3KernelLibrary.h"
#include "hosts/vst3/loader/KVST3PluginFactory.h"
#include "kernel/KExport.h"

namespace {
KVST3::KKernelLibrary gKernel;
KVST3::KPluginFactory gFactory(gKernel);
}  // namespace

// The host's first call after loading the module (InitDll on Windows, ModuleEntry on Linux).
#if defined(_WIN32)
TORVANE_LOADER_EXPORT bool InitDll() { return gKernel.Open(); }
#else
TORVANE_LOADER_EXPORT bool ModuleEntry(void*) { return gKernel.Open(); }
#endif

// The host's last call before unloading the module, once every instance is gone.
#if defined(_WIN32)
TORVANE_LOADER_EXPORT bool ExitDll() {
#else
TORVANE_LOADER_EXPORT bool ModuleExit() {
#endif
  gKernel.Close();
  return true;
}

// Null when the kernel cannot be loaded or does not know the bundle's plug-in.
TORVANE_LOADER_EXPORT KVST3::IPluginFactory* GetPluginFactory() {
  if (!gFactory.Describe()) return nullptr;
  gFactory.AddRef();
  return &gFactory;
}
