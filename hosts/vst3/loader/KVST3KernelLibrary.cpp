#include "hosts/vst3/loader/KVST3KernelLibrary.h"

#include <cstdio>
#include <string>

#include "kernel/platform/KPlatformLibrary.h"

namespace KVST3 {
namespace {
// An object of the loader itself: its address names the loader's file.
const char kAnchor = 0;

std::string KernelPath() {
  const std::string loader = KPlatform::LibraryPathOf(&kAnchor);
  const size_t slash = loader.rfind('/');
  return slash == std::string::npos ? std::string() : loader.substr(0, slash + 1) + KKernelLibrary::kFileName;
}
}  // namespace

bool KKernelLibrary::OpenLocked() noexcept {
  if (library_) return true;
  try {
    const std::string path = KernelPath();
    if (path.empty()) return false;
    library_ = KPlatform::OpenLibrary(path);
    if (library_) dispatch_ = reinterpret_cast<DispatchFunction>(KPlatform::FindSymbol(library_, kDispatchName));
    if (!dispatch_) {
      std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
      KPlatform::CloseLibrary(library_);
      library_ = nullptr;
    }
  } catch (...) {
    library_ = nullptr;  // out of memory while building the path
  }
  return library_ != nullptr;
}

bool KKernelLibrary::Open() noexcept {
  std::lock_guard<std::mutex> lock(mutex_);
  if (!OpenLocked()) return false;
  ++opens_;
  return true;
}

void KKernelLibrary::Close() noexcept {
  std::lock_guard<std::mutex> lock(mutex_);
  if (opens_ == 0 || --opens_ > 0) return;
  KPlatform::CloseLibrary(library_);
  library_ = nullptr;
  dispatch_ = nullptr;
}

FUnknown* KKernelLibrary::Create(FUnknown* context, const char* key) noexcept {
  DispatchFunction dispatch = nullptr;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    if (OpenLocked()) dispatch = dispatch_;
  }
  return dispatch ? dispatch(context, key, "") : nullptr;
}

}  // namespace KVST3
