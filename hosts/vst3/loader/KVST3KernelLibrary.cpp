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
  const size_t slash = loader.find_last_of("/\\");
  return slash == std::string::npos ? std::string() : loader.substr(0, slash + 1) + KKernelLibrary::kFileName;
}

// The loader's own file name without its extension: the name of its bundle and of its plug-in.
std::string BundleName() {
  std::string name = KPlatform::LibraryPathOf(&kAnchor);
  name.erase(0, name.find_last_of("/\\") + 1);
  const size_t dot = name.rfind('.');
  return dot == std::string::npos ? name : name.substr(0, dot);
}
}  // namespace

bool KKernelLibrary::OpenLocked() noexcept {
  if (library_) return true;
  try {
    const std::string path = KernelPath();
    if (path.empty()) return false;
    library_ = KPlatform::OpenLibrary(path);
    if (library_) {
      dispatch_ = reinterpret_cast<DispatchFunction>(KPlatform::FindSymbol(library_, kDispatchName));
      describe_ = reinterpret_cast<DescribeFunction>(KPlatform::FindSymbol(library_, kDescribeName));
    }
    if (!dispatch_ || !describe_) {
      std::fprintf(stderr, "Torvane: could not load the kernel %s (%s)\n", path.c_str(), KPlatform::LibraryError().c_str());
      KPlatform::CloseLibrary(library_);
      library_ = nullptr;
      dispatch_ = nullptr;
      describe_ = nullptr;
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
  describe_ = nullptr;
}

FUnknown* KKernelLibrary::Create(FUnknown* context, const char* key) noexcept {
  DispatchFunction dispatch = nullptr;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    if (OpenLocked()) dispatch = dispatch_;
  }
  return dispatch ? dispatch(context, key, "") : nullptr;
}

bool KKernelLibrary::Describe(KClassDescription& description) noexcept {
  try {
    const std::string bundle = BundleName();
    std::lock_guard<std::mutex> lock(mutex_);
    if (!OpenLocked()) return false;
    if (describe_(bundle.c_str(), &description)) return true;
    std::fprintf(stderr, "Torvane: the kernel knows no plug-in of the bundle %s\n", bundle.c_str());
  } catch (...) {
    // out of memory while naming the bundle
  }
  return false;
}

}  // namespace KVST3
