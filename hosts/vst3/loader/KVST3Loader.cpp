// The file a host loads for one plug-in: a VST 3 module that holds no plug-in code. It finds
// the kernel library in its own bundle and asks it for instances. The build names the plug-in:
// TORVANE_VST3_KEY, TORVANE_VST3_NAME, TORVANE_VST3_SUBCATEGORIES, TORVANE_VST3_VERSION.

#include "hosts/vst3/loader/KVST3KernelLibrary.h"
#include "hosts/vst3/loader/KVST3PluginFactory.h"

#define KVST3_LOADER_EXPORT extern "C" __attribute__((visibility("default")))

namespace {
KVST3::KKernelLibrary gKernel;
KVST3::KPluginFactory gFactory({TORVANE_VST3_KEY, TORVANE_VST3_NAME, TORVANE_VST3_SUBCATEGORIES, TORVANE_VST3_VERSION}, gKernel);
}  // namespace

// The host's first call after loading the module.
KVST3_LOADER_EXPORT bool ModuleEntry(void*) { return gKernel.Open(); }

// The host's last call before unloading the module, once every instance is gone.
KVST3_LOADER_EXPORT bool ModuleExit() {
  gKernel.Close();
  return true;
}

KVST3_LOADER_EXPORT KVST3::IPluginFactory* GetPluginFactory() {
  gFactory.AddRef();
  return &gFactory;
}
