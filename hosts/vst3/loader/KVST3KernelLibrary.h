#pragma once

#include <mutex>

#include "hosts/vst3/KVST3Dispatch.h"

namespace KVST3 {

// The kernel library that sits beside the loader in the bundle's binary folder: found from the
// loader's own file (never through the system's search path, so that every bundle runs its own
// copy of the kernel), opened with its symbols kept to itself.
class KKernelLibrary {
public:
#if defined(_WIN32)
  static constexpr const char* kFileName = "torvane.dll";
#else
  static constexpr const char* kFileName = "libtorvane.so";
#endif

  KKernelLibrary() = default;
  KKernelLibrary(const KKernelLibrary&) = delete;
  KKernelLibrary& operator=(const KKernelLibrary&) = delete;

  // Counted: the library closes when every Open has its Close. False when it cannot be loaded
  // (the reason goes to the standard error stream: there is no kernel to report it).
  bool Open() noexcept;
  void Close() noexcept;
  // The plug-in `key` as a VST 3 object with one reference, or null. Opens the library for good
  // when the host never called ModuleEntry.
  FUnknown* Create(FUnknown* context, const char* key) noexcept;
  // The plug-in of the bundle this loader is named after, as the kernel describes it. Opens the
  // library for good, as Create does, when the host never called ModuleEntry.
  bool Describe(KClassDescription& description) noexcept;

private:
  bool OpenLocked() noexcept;

  std::mutex mutex_;
  void* library_ = nullptr;
  DispatchFunction dispatch_ = nullptr;
  DescribeFunction describe_ = nullptr;
  int opens_ = 0;
};

}  // namespace KVST3
